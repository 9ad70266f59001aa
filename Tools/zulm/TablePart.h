#pragma once

// One file of a data set while it is written. Its name begins with a dot until it is committed, so that no reader takes
// it for a whole one.

#include <cstdint>
#include <memory>
#include <string>

#include <nlohmann/json.hpp>

namespace Zulm {

enum class TableFormat { CSV, NDJSON, Parquet };

/// Returns "csv", which is also the extension of the files.
std::string nameOf(TableFormat format);

/// Returns how the rows show a recording of this name. Two names may look alike if one of them is not UTF-8.
std::string nameInRows(const std::string& name, TableFormat format);

/// What the rows of a table are.
struct TableHead {
    std::string kind;
    std::string csv;                ///< the first line of every part; empty if there is none
    nlohmann::ordered_json columns; ///< names and types, for Parquet
};

/// Returns the name under which a part is written.
std::string hiddenName(const std::string& part);

/// Returns whether the file is one that a run did not commit.
bool isUnfinished(const std::string& path);

class ParquetProgram;

class TablePart {
public:
    virtual ~TablePart() = default;
    TablePart(const TablePart&) = delete;
    TablePart& operator=(const TablePart&) = delete;

    /// Adds whole lines. Throws `Failure`.
    virtual void append(const std::string& lines) = 0;

    /// Returns how many bytes the file has, as far as they are known.
    virtual std::uint64_t bytes() const = 0;

    /// Ends the file, whose bytes are on the disk then. Throws `Failure`.
    virtual void end() = 0;

    /// Returns the name from the data set's folder on, as it is committed.
    const std::string& name() const { return name_; }

protected:
    explicit TablePart(std::string name) : name_(std::move(name)) {}

private:
    std::string name_;
};

/// Begins a part in the folder of a data set. `parquet` is null for text. Throws `Failure`.
std::unique_ptr<TablePart> newTablePart(const std::string& folder, const std::string& name, const TableHead& head,
                                        const ParquetProgram* parquet);

/// Writes a file that has all of its bytes as soon as it has its name. Throws `Failure`.
void replaceDurably(const std::string& path, const std::string& bytes);

} // namespace Zulm
