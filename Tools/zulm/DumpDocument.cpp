#include "Tools/zulm/DumpDocument.h"

#include "Tools/zulm/EntryFormat.h"
#include "Tools/zulm/Report.h"

namespace Zulm {

using namespace ZULMetaData;

namespace {

template <class Kind>
class EntryWriter final : public DataStreamObserver<typename Kind::Value> {
public:
    explicit EntryWriter(DumpDocument& document) : document_(document) {}

    bool dataRead(double time, const typename Kind::Value& value) override {
        document_.add(entryDocument<Kind>(time, value));
        return true;
    }

private:
    DumpDocument& document_;
};

} // namespace

void DumpDocument::beginFile(const Recording& recording) {
    writer_.beginObject();
    writer_.members(fileHeader(recording.name()));
    writer_.member("container", recording.container());
    writer_.beginArray("streams");
}

void DumpDocument::beginStream(const StreamInfo& stream, bool isDecoded) {
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

void writeDump(Recording& recording, const std::vector<uuid>& types, const TextSink& sink) {
    JsonWriter writer(sink, JsonWriter::Style::Lines);
    beginReport(writer, "dump");
    DumpDocument document(writer);
    document.beginFile(recording);
    for (const uuid& type : types) {
        const StreamInfo stream = recording.streamInfo(type);
        document.beginStream(stream, stream.isDecodable);
        if (stream.isDecodable)
            RecordedKinds::visit(type, [&]<class Kind>() {
                EntryWriter<Kind> entries(document);
                recording.readEntries<typename Kind::Value>(stream, entries);
            });
        document.endStream();
    }
    document.endFile();
    endReport(writer, {});
    sink("\n");
}

} // namespace Zulm
