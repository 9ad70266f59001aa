#pragma once

// Everything that one run of `zulm dump` prints, in its format.

#include "Reports/DumpDocument.h"
#include "Reports/EntryFormat.h"

#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// Which members of entries are printed, in which order: all of them unless some are named.
class Columns {
public:
    Columns() = default;

    /// `list` is separated by commas. Throws `CLI::ValidationError` if it names something that no entry has.
    explicit Columns(const std::string& list);

    bool areChosen() const { return !names_.empty(); }

    /// Whether the entries of a stream with these keys have any of the columns that were named. The time, the stream
    /// and the file are columns of every entry, so they tell nothing unless no others are named.
    bool areIn(const ZULMetaData::EntryKeys& keys) const;

    /// The names that a stream with these keys has.
    ZULMetaData::EntryKeys namesIn(const ZULMetaData::EntryKeys& keys) const;

    /// Those members of a line or an entry, with what tells of them that they are damaged or not as they are stored.
    nlohmann::ordered_json of(const nlohmann::ordered_json& line) const;

private:
    std::vector<std::string> names_;
};

class Printout {
public:
    /// `writer` has the "files" of a report open; it is null for other formats than JSON.
    Printout(EntryFormat format, const Columns& columns, bool hasSeveralFiles, JsonWriter* writer);

    void beginFile(const ZULMetaData::RecordingFile& recording);

    /// `keys` are those of the stream's entries; null if these cannot be decoded.
    void beginStream(const ZULMetaData::StreamReport& stream, const ZULMetaData::EntryKeys* keys, bool isOnlyOne);

    void print(const nlohmann::ordered_json& entry);
    void endStream();
    void endFile();

private:
    void beginText(bool isOnlyOne) const;
    void beginTable();
    nlohmann::ordered_json line(const nlohmann::ordered_json& entry) const;

    EntryFormat format_;
    const Columns& columns_;
    bool hasSeveralFiles_;
    std::string file_;
    std::string kind_;
    const ZULMetaData::EntryKeys* keys_ = nullptr;
    ZULMetaData::EntryKeys tableKeys_;
    std::string linePrefix_; ///< of a line of csv: the fields that are not the entry's
    std::optional<DumpDocument> document_;
};

} // namespace Zulm
