#include "Tools/zulm/DumpDocument.h"

#include "Tools/zulm/EntryFormat.h"
#include "Tools/zulm/Report.h"

namespace Zulm {

using namespace ZULMetaData;
using Json = nlohmann::ordered_json;

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

void OpenArray::begin(const Json& document) {
    const std::string text = jsonLine(document);
    sink_(std::string_view(text).substr(0, text.size() - 2));
    isEmpty_ = true;
}

void OpenArray::add(const Json& element) {
    separate();
    sink_(jsonLine(element));
}

void OpenArray::separate() {
    sink_(isEmpty_ ? "\n" : ",\n");
    isEmpty_ = false;
}

DumpDocument::DumpDocument(const Recording& recording, const TextSink& sink)
    : sink_(sink), files_(sink), streams_(sink), entries_(sink) {
    Json report = reportHeader("dump");
    report["files"] = Json::array();
    files_.begin(report);
    files_.separate();
    Json file = fileHeader(recording.name());
    file["container"] = recording.container();
    file["streams"] = Json::array();
    streams_.begin(file);
}

void DumpDocument::beginStream(const StreamInfo& stream, bool isDecoded) {
    isDecoded_ = isDecoded;
    Json document{{"kind", kindDocument(stream.type)}, {"uuid", uuidText(stream.type)}, {"version", stream.version}};
    document["entries"] = isDecoded ? Json::array() : Json(nullptr);
    if (!isDecoded)
        return streams_.add(document);
    streams_.separate();
    entries_.begin(document);
}

void DumpDocument::endStream() {
    if (isDecoded_)
        entries_.end();
}

void DumpDocument::end() {
    streams_.end();
    files_.end();
    sink_("\n");
}

void writeDump(Recording& recording, const std::vector<uuid>& types, const TextSink& sink) {
    DumpDocument document(recording, sink);
    for (const uuid& type : types) {
        const StreamInfo stream = recording.streamInfo(type);
        document.beginStream(stream, stream.isDecodable);
        if (stream.isDecodable)
            RecordedKinds::visit(type, [&]<class Kind>() {
                EntryWriter<Kind> writer(document);
                recording.readEntries<typename Kind::Value>(stream, writer);
            });
        document.endStream();
    }
    document.end();
}

} // namespace Zulm
