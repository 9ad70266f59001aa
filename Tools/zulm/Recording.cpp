#include "Tools/zulm/Recording.h"

#include "Tools/zulm/Command.h"

#include <fmt/core.h>

#include <sstream>
#include <stdexcept>

namespace Zulm {

using namespace ZULMetaData;

namespace {

template <class Value>
class Summary final : public DataStreamObserver<Value> {
public:
    explicit Summary(StreamInfo& info) : info_(info) {}

    bool dataRead(double time, const Value&) override {
        ++info_.entries;
        if (!info_.firstTime)
            info_.firstTime = time;
        info_.lastTime = time;
        return true;
    }

private:
    StreamInfo& info_;
};

std::int32_t versionAt(std::istream& stream, std::uint64_t offset) {
    MetaDataHeader header;
    stream.clear();
    stream.seekg(static_cast<std::streamoff>(offset));
    stream.read(reinterpret_cast<char*>(&header), sizeof header);
    return header.version;
}

} // namespace

Recording::Recording(std::string path) : path_(std::move(path)) {
    requireFile(path_);
    parser_ = MetaDataParser::create(path_);
    if (!parser_)
        throw Failure(
            fmt::format("{}: not a movie (.mp4, .mov, .zcap), a RIFF file (.avi, .wav) or a stream (.dat)", path_));
}

std::string Recording::container() const {
    switch (parser_->getStreamType()) {
    case MetaDataParser::QuickTime: return "movie";
    case MetaDataParser::Riff: return "RIFF";
    default: return "stream";
    }
}

std::vector<StreamInfo> Recording::streams() {
    std::vector<StreamInfo> streams;
    for (const uuid& type : parser_->getAvailableMetaDataUUIDs())
        streams.push_back(streamInfo(type));
    return streams;
}

StreamInfo Recording::streamInfo(const uuid& type) {
    StreamInfo info;
    info.type = type;
    info.range = parser_->fileDataForUUID(type);
    info.version = versionAt(parser_->getStream(), info.range.offset);
    const MetaDataKind* kind = findMetaDataKind(type);
    if (!kind)
        return info;
    info.kind = kind->name;
    if (info.version < 1 || info.version > kind->currentVersion)
        return info;
    info.isDecodable = RecordedKinds::visit(type, [&]<class Kind>() {
        Summary<typename Kind::Value> summary(info);
        try {
            parser_->loadDataType(type, summary, -1);
        } catch (const std::runtime_error&) {
            info.damage = fmt::format("cut short behind entry {}", info.entries);
        }
    });
    return info;
}

std::string uuidText(const uuid& type) {
    std::ostringstream text;
    text << type;
    return text.str();
}

std::string nameOf(const uuid& type) {
    const MetaDataKind* kind = findMetaDataKind(type);
    return kind ? std::string(kind->name) : uuidText(type);
}

} // namespace Zulm
