#include "Tools/zulm/RedactReport.h"

#include "Reports/EntryFormat.h"
#include "Reports/Report.h"
#include "Reports/Text.h"
#include "Tools/zulm/StandardStreams.h"
#include "ZULMetaData/StreamEntries.h"

#include <fmt/core.h>

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

namespace {

const char* actionText(RedactedEntry::Action action) {
    switch (action) {
    case RedactedEntry::Removed: return "removed";
    case RedactedEntry::Changed: return "changed";
    default: return "added";
    }
}

const char* reasonText(RedactedPlace::Reason reason) {
    switch (reason) {
    case RedactedPlace::Text: return "text";
    case RedactedPlace::Creator: return "creator";
    default: return "unknown";
    }
}

/// As it was recorded; only the time of an entry that is added.
Json originalOf(const RedactedEntry& entry) {
    Json document{{"timestamp", numberDocument(entry.time)}};
    if (entry.original.empty())
        return document;
    RecordedKinds::visit(entry.header.uuid, [&]<class Kind>() {
        if (const auto decoded = decodeEntry<typename Kind::Value>(entry.original, entry.header.version))
            document = entryDocument<Kind>(decoded->time, decoded->value);
    });
    return document;
}

Json entryDocumentOf(const RedactedEntry& entry) {
    Json document{{"stream", metaDataKindName(entry.header.uuid)}, {"change", actionText(entry.action)}};
    document.update(originalOf(entry));
    return document;
}

Json streamDocument(const RedactedStream& stream) {
    return {{"kind", kindDocument(stream.header.uuid)},
            {"uuid", uuidText(stream.header.uuid)},
            {"removed", stream.removal != RedactedStream::Kept},
            {"status", removalText(stream.removal)},
            {"entries", stream.entries},
            {"entries_changed", stream.entriesChanged},
            {"entries_removed", stream.entriesRemoved},
            {"entries_added", stream.entriesAdded},
            {"bytes_left_out", stream.bytesLeftOut}};
}

Json fileDocument(const RedactReport& report) {
    Json document = fileHeader(report.file);
    if (report.output.empty())
        document["dry_run"] = true;
    else
        addText(document, "output", report.output);
    document["unreachable_streams"] = report.recording.unreachableStreams;
    document["places"] = Json::array();
    for (const RedactedPlace& place : report.recording.places) {
        Json& item = document["places"].emplace_back(Json{{"reason", reasonText(place.reason)}});
        addText(item, "path", place.path);
        item.update(Json{{"offset", place.offset}, {"size", place.size}});
    }
    document["streams"] = Json::array();
    for (const RedactedStream& stream : report.recording.streams)
        document["streams"].push_back(streamDocument(stream));
    return document;
}

void printStream(const RedactedStream& stream) {
    const std::string name = metaDataKindName(stream.header.uuid);
    if (stream.removal != RedactedStream::Kept)
        writeOutput(fmt::format("  {:<23}  {}\n", name, removalText(stream.removal)));
    else
        writeOutput(fmt::format("  {:<23}  {} left, {} of them changed, {} added; {} removed\n", name, stream.entries,
                                stream.entriesChanged, stream.entriesAdded, stream.entriesRemoved));
}

} // namespace

const char* removalText(RedactedStream::Removal removal) {
    switch (removal) {
    case RedactedStream::Kept: return "kept";
    case RedactedStream::Asked: return "removed";
    case RedactedStream::Undecodable: return "removed: its entries cannot be looked into";
    default: return "removed: it has no whole header";
    }
}

void printRedaction(const RedactReport& report, const VisitEntries& visitEntries) {
    if (report.output.empty())
        writeOutput(fmt::format("{}: nothing is written; a copy would differ in this\n", shown(report.file)));
    else
        writeOutput(fmt::format("{}: written\n", shown(report.output)));
    for (const RedactedStream& stream : report.recording.streams)
        printStream(stream);
    for (const RedactedPlace& place : report.recording.places)
        writeOutput(fmt::format("  {:<23}  removed: {} bytes at offset {} ({})\n", shown(place.path), place.size,
                                place.offset, reasonText(place.reason)));
    if (visitEntries)
        visitEntries([](const RedactedEntry& entry) {
            writeOutput(fmt::format("{:<23}  {}  {}\n", metaDataKindName(entry.header.uuid), actionText(entry.action),
                                    textLine(originalOf(entry))));
        });
}

void writeRedaction(JsonWriter& writer, const RedactReport& report, const VisitEntries& visitEntries) {
    if (!visitEntries)
        return writer.element(fileDocument(report));
    writer.beginObject();
    writer.members(fileDocument(report));
    writer.beginArray("entries");
    visitEntries([&writer](const RedactedEntry& entry) { writer.element(entryDocumentOf(entry)); });
    writer.end();
    writer.end();
}

} // namespace Zulm
