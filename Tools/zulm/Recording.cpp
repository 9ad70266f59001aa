#include "Tools/zulm/Recording.h"

#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <fmt/core.h>

#include <algorithm>
#include <stdexcept>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// The first thing that is wrong, and how much else.
std::string damageIn(const StreamReport& stream) {
    const auto isDamage = [](const Finding& finding) { return finding.severity() == Severity::Damage; };
    const auto first = std::find_if(stream.findings.begin(), stream.findings.end(), isDamage);
    if (first == stream.findings.end())
        return {};
    const auto others = std::count_if(stream.findings.begin(), stream.findings.end(), isDamage) - 1;
    return fmt::format("at offset {}: {}{}", first->offset, first->sentence,
                       others == 0 ? std::string() : fmt::format(" ({} more)", others));
}

/// Fills in what walking the stream has told.
void examine(StreamInfo& info, const StreamReport& report) {
    info.version = report.version;
    info.isDecodable = isDecodable({info.type, report.version, report.fixedEntrySize});
    info.entries = report.wholeEntries;
    info.firstTime = report.firstTime;
    info.lastTime = report.lastTime;
    info.readableBytes = report.readableBytes;
    info.damage = damageIn(report);
}

} // namespace

Recording::Recording(std::istream& input, Container::Type type, std::string name) : name_(std::move(name)) {
    parser_ = orUnreadable(name_, [&] { return openContainer(input, type); });
    requireRead(parser_->getStream(), name_);
}

std::uint64_t Recording::size() {
    return orUnreadable(name_, [this] { return sizeOfInput(parser_->getStream()); });
}

ReadBytes Recording::bytes() {
    return [read = readingFrom(parser_->getStream()), name = name_](std::uint64_t position, std::span<char> bytes) {
        return orUnreadable(name, [&] { return read(position, bytes); });
    };
}

std::string Recording::container() const {
    return containerName(parser_->getStreamType());
}

const ValidationReport& Recording::validation() {
    try {
        if (!validation_)
            validation_ = validate();
    } catch (const std::runtime_error& error) {
        throw Failure(fmt::format("{}: {}", name_, error.what()));
    }
    return *validation_;
}

ValidationReport Recording::validate() {
    return validateRecording(parser_->getStream(), parser_->getStreamType());
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
    const MetaDataKind* kind = findMetaDataKind(type);
    info.kind = kind ? kind->name : std::string_view();
    const auto& streams = validation().streams;
    const auto found = std::find_if(streams.begin(), streams.end(),
                                    [&](const StreamReport& stream) { return stream.offset == info.range.offset; });
    if (found == streams.end() || found->presentBytes < s_metaDataHeaderSize) {
        info.damage = "it could not be examined";
        return info;
    }
    examine(info, *found);
    return info;
}

std::vector<StreamInfo> Recording::hiddenStreams() {
    std::vector<StreamInfo> hidden;
    for (const StreamReport& stream : validation().streams) {
        const auto taken = parser_->fileDataForUUID(stream.type);
        if (stream.presentBytes < s_metaDataHeaderSize || (taken.length > 0 && taken.offset == stream.offset))
            continue;
        StreamInfo& info = hidden.emplace_back();
        info.type = stream.type;
        info.kind = stream.kind;
        info.range = {stream.offset, stream.declaredBytes};
        examine(info, stream);
    }
    return hidden;
}

void requireRead(const std::istream& stream, const std::string& name) {
    orUnreadable(name, [&stream] { requireReadable(stream); });
}

bool isNamedOtherwise(const std::string& path, Container::Type type) {
    const Container::Type named = MetaDataParser::streamTypeOf(path);
    return named != Container::Unknown && named != type;
}

std::string containerName(Container::Type type) {
    switch (type) {
    case Container::QuickTime: return "movie";
    case Container::Riff: return "RIFF";
    default: return "stream";
    }
}

nlohmann::ordered_json kindDocument(const uuid& type) {
    const MetaDataKind* kind = findMetaDataKind(type);
    return kind ? nlohmann::ordered_json(kind->name) : nlohmann::ordered_json(nullptr);
}

} // namespace Zulm
