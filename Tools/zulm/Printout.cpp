#include "Tools/zulm/Printout.h"

#include "Reports/Text.h"
#include "Tools/zulm/Choice.h"
#include "Tools/zulm/StandardStreams.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <sstream>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

constexpr auto s_fileColumn = "file";
constexpr auto s_streamColumn = "stream";
constexpr auto s_timeColumn = "timestamp";

bool contains(const std::vector<std::string>& names, const std::string& name) {
    return std::find(names.begin(), names.end(), name) != names.end();
}

bool isInEveryLine(const std::string& name) {
    return name == s_fileColumn || name == s_streamColumn || name == s_timeColumn;
}

std::vector<std::string> knownColumns() {
    std::vector<std::string> names{s_fileColumn, s_streamColumn, s_timeColumn};
    RecordedKinds::forEach([&]<class Kind>() {
        for (const std::string& key : entryKeys<Kind>())
            if (!contains(names, key))
                names.push_back(key);
    });
    return names;
}

void requireKnown(const std::string& name) {
    static const std::vector<std::string> known = knownColumns();
    if (!contains(known, name))
        throw CLI::ValidationError("--columns", fmt::format("'{}' is no column{} (the columns are {})", name,
                                                            suggestionFor(name, known), fmt::join(known, ", ")));
}

} // namespace

Columns::Columns(const std::string& list) {
    std::istringstream names(list + ',');
    for (std::string name; std::getline(names, name, ',');) {
        requireKnown(name);
        if (!contains(names_, name))
            names_.push_back(name);
    }
}

bool Columns::areIn(const EntryKeys& keys) const {
    const auto isThere = [&](const std::string& name) { return !isInEveryLine(name) && contains(keys, name); };
    return std::all_of(names_.begin(), names_.end(), isInEveryLine) ||
           std::any_of(names_.begin(), names_.end(), isThere);
}

EntryKeys Columns::namesIn(const EntryKeys& keys) const {
    EntryKeys found;
    for (const std::string& name : names_)
        if (isInEveryLine(name) || contains(keys, name))
            found.push_back(name);
    return found;
}

Json Columns::of(const Json& line) const {
    const auto isAbout = [](const std::string& key, const std::string& name) {
        return key == name || key == name + "_base64" || (name == s_timeColumn && key == "timestamp_f32");
    };
    Json chosen = Json::object();
    for (const std::string& name : names_)
        for (const auto& [key, value] : line.items())
            if (isAbout(key, name))
                chosen[key] = value;
    for (const char* key : {"further", "damage"})
        if (line.contains(key))
            chosen[key] = line[key];
    return chosen;
}

Printout::Printout(EntryFormat format, const Columns& columns, bool hasSeveralFiles, JsonWriter* writer)
    : format_(format), columns_(columns), hasSeveralFiles_(hasSeveralFiles) {
    if (writer)
        document_.emplace(*writer);
}

void Printout::beginFile(const RecordingFile& recording) {
    file_ = recording.name();
    if (document_)
        document_->beginFile(recording);
}

void Printout::beginStream(const StreamReport& stream, const EntryKeys* keys, bool isOnlyOne) {
    kind_ = stream.name();
    keys_ = keys;
    switch (format_) {
    case EntryFormat::Text: return beginText(isOnlyOne);
    case EntryFormat::CSV: return beginTable();
    case EntryFormat::JSON: return document_->beginStream(stream, keys != nullptr);
    case EntryFormat::NDJSON: return;
    }
}

void Printout::beginText(bool isOnlyOne) const {
    if (hasSeveralFiles_)
        writeOutput(heading(fmt::format("{}: {}", shown(file_), kind_)) + '\n');
    else if (!isOnlyOne)
        writeOutput(heading(kind_) + '\n');
}

void Printout::beginTable() {
    if (!keys_)
        return;
    EntryKeys about{s_streamColumn};
    if (hasSeveralFiles_)
        about.insert(about.begin(), s_fileColumn);
    linePrefix_ = csvLine({{s_fileColumn, validText(file_)}, {s_streamColumn, kind_}}, about) + ',';
    tableKeys_ = columns_.namesIn(*keys_);
    writeSeparator("\n");
    writeOutput((columns_.areChosen() ? csvHeader(tableKeys_) : csvHeader(about) + ',' + csvHeader(*keys_)) + '\n');
}

void Printout::print(const Json& entry) {
    const bool areChosen = columns_.areChosen();
    switch (format_) {
    case EntryFormat::Text: return writeOutput(textLine(areChosen ? columns_.of(line(entry)) : entry) + '\n');
    case EntryFormat::CSV:
        return writeOutput((areChosen ? csvLine(line(entry), tableKeys_) : linePrefix_ + csvLine(entry, *keys_)) +
                           '\n');
    case EntryFormat::JSON: return document_->add(areChosen ? columns_.of(entry) : entry);
    case EntryFormat::NDJSON: return writeOutput(jsonLine(areChosen ? columns_.of(line(entry)) : line(entry)) + '\n');
    }
}

Json Printout::line(const Json& entry) const {
    Json line = Json::object();
    if (hasSeveralFiles_ || columns_.areChosen())
        line[s_fileColumn] = validText(file_);
    line[s_streamColumn] = kind_;
    line.update(entry);
    return line;
}

void Printout::endStream() {
    if (document_)
        document_->endStream();
}

void Printout::endFile() {
    if (document_)
        document_->endFile();
}

} // namespace Zulm
