#pragma once

// A folder with the entries of many recordings, as tables that other programs read: a folder for each kind
// ("kind=cursorLocation"), in it one part after the other ("part-00000.csv"), and a manifest of the recordings.
//
// Parts appear together with the lines of the manifest that say whose entries are in them. A run that ends at any
// moment leaves a data set that lacks the recordings since the last commit, and has none of them twice.
//
// Nobody may read a part who may not read all recordings in it. Only the owner may read the manifest.

#include "Platform/LockFile.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/ParquetProgram.h"
#include "Tools/zulm/TablePart.h"

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <shared_mutex>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace Zulm {

/// What a recording was when it was exported.
struct RecordingState {
    std::string name; ///< in its rows, as it was named first
    std::uint64_t size = 0;
    std::int64_t modified = 0; ///< as the file system's clock counts
    std::uint64_t checksum = 0;
    bool isWhole = true; ///< false if its entries could not be read to their end

    /// Throws `Failure`. The checksum is left 0.
    static RecordingState of(const std::string& path);
};

/// Several threads may use it at once.
class DataSet {
public:
    struct Description {
        TableFormat format = TableFormat::CSV;
        std::vector<std::string> kinds; ///< names of the kinds; all of them if it is empty
        std::uint64_t partBytes = 0;    ///< a part ends when it has so many
    };

    /// Opens the folder, or creates it. Ends what an earlier run could not end. Throws `Failure`, also if another
    /// program writes to it, or if it was made by another description.
    DataSet(const std::string& folder, const Description& description);
    ~DataSet();
    DataSet(const DataSet&) = delete;
    DataSet& operator=(const DataSet&) = delete;

    /// Returns false if this run has begun the recording already, because it was named twice.
    bool claim(const std::string& path);

    /// Gives the recording its name in the rows. Throws `Failure` if another one has it.
    void takeName(const std::string& path);

    /// Returns what the manifest says about a recording.
    std::optional<RecordingState> stateOf(const std::string& path) const;

    /// What is thrown after a failure of the data set that was thrown before: nothing is committed any more.
    struct HasFailed {};

    /// Returns whether an append or a commit has failed.
    bool hasFailed() const;

    /// Keeps the data set from a commit while it lives, so that a recording is in one commit with all of its entries.
    /// Throws `HasFailed`.
    std::shared_lock<std::shared_mutex> beginRecording();

    /// Adds whole lines to the table of a kind. Throws `Failure` and `HasFailed`.
    void append(const TableHead& head, const std::string& lines);

    /// Says that all lines of a recording were appended.
    void endRecording(const std::string& path, const RecordingState& state);

    /// Commits if so much was appended that it should not be lost. Nothing may be begun by this thread. Throws
    /// `Failure` and `HasFailed`.
    void commitIfDue();

    /// Makes everything that was appended part of the data set. Throws `Failure` and `HasFailed`.
    void commit();

    std::uint64_t parts() const { return parts_; } ///< the number of parts that were added

private:
    struct Commit {
        std::uint64_t manifestBytes = 0; ///< before it
        std::vector<std::string> parts;
        std::string lines; ///< of the manifest
    };

    struct Table {
        std::unique_ptr<TablePart> open;
        std::optional<std::uint64_t> next; ///< the number of the next part
    };

    std::string pathOf(const std::string& name) const;
    void lock();
    void open(const Description& description);
    void openManifest(const Description& description);
    void readManifest();
    void removeLeftovers() const;
    std::unique_ptr<TablePart> newPart(Table& table, const TableHead& head);
    void appendTo(Table& table, const TableHead& head, const std::string& lines);
    void requireUsable() const;
    void endPart(Table& table);
    void commitAll();
    void commitUncommitted();
    void moveIn(const std::string& part) const;
    bool isPartName(const std::string& part) const;
    Commit readCommit(const std::string& journal) const;
    void apply(const std::string& journal);

    std::string folder_;
    TableFormat format_;
    std::uint64_t partBytes_;
    std::optional<ParquetProgram> parquet_;
    std::unique_ptr<ZULMetaData::LockFile> lock_;
    std::unordered_map<std::string, RecordingState> manifest_;

    std::shared_mutex recordings_;                       ///< shared by the recordings that are being exported
    mutable std::mutex mutex_;                           ///< guards what follows
    bool hasFailed_ = false;                             ///< an append, which leaves out rows, or a commit
    FileAccess access_;                                  ///< of the recordings that are not committed
    std::unordered_set<std::string> claimed_;            ///< the recordings of this run
    std::unordered_map<std::string, std::string> names_; ///< from names in the rows to absolute paths
    std::map<std::string, Table> tables_;
    std::vector<std::string> ended_;           ///< names of parts that are whole and not committed
    std::vector<nlohmann::ordered_json> done_; ///< lines of the manifest that are not committed
    std::uint64_t uncommittedBytes_ = 0;
    std::uint64_t parts_ = 0;
};

} // namespace Zulm
