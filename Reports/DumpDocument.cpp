#include "Reports/DumpDocument.h"

#include "Reports/EntryFormat.h"
#include "Reports/Report.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

namespace Zulm {

using namespace ZULMetaData;

void DumpDocument::beginFile(const RecordingFile& recording) {
    writer_.beginObject();
    writer_.members(fileHeader(recording.name()));
    writer_.member("container", containerName(recording.container()));
    writer_.beginArray("streams");
}

void DumpDocument::beginStream(const StreamReport& stream, bool isDecoded) {
    isDecoded_ = isDecoded;
    writer_.beginObject();
    writer_.members(
        {{"kind", kindDocument(stream.type)}, {"uuid", uuidText(stream.type)}, {"version", stream.version}});
    if (isDecoded)
        writer_.beginArray("entries");
    else
        writer_.member("entries", nullptr);
}

void DumpDocument::endStream() {
    if (isDecoded_)
        writer_.end();
    writer_.end();
}

void DumpDocument::endFile() {
    writer_.end();
    writer_.end();
}

void writeDump(RecordingFile& recording, const std::vector<StreamReport>& streams, const TextSink& sink) {
    JsonWriter writer(sink, JsonWriter::Style::Lines);
    beginReport(writer, "dump");
    DumpDocument document(writer);
    document.beginFile(recording);
    for (const StreamReport& stream : streams) {
        document.beginStream(stream, isDecodable(stream.header()));
        RecordedKinds::visit(stream.type, [&]<class Kind>() {
            recording.readEntries<typename Kind::Value>(stream, [&](double time, const auto& value) {
                document.add(entryDocument<Kind>(time, value));
                return true;
            });
        });
        document.endStream();
    }
    document.endFile();
    endReport(writer, {});
    sink("\n");
}

} // namespace Zulm
