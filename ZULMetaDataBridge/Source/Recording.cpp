#include "ZULMetaDataBridge/Source/Recording.h"

#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaData/Containers/RecordingInfo.h"

#include <algorithm>
#include <span>
#include <stdexcept>
#include <utility>

namespace ZULMetaData {

namespace {

std::unique_ptr<MetaDataParser> recognized(std::istream& input, const std::string& name) {
    const RecognizedContainer container = recognizeContainer(input, name);
    if (container.type == Container::Unknown)
        throw std::runtime_error(container.refusal());
    return openContainer(input, container.type);
}

/// Puts the name before the refusal.
template <class Open>
std::unique_ptr<MetaDataParser> opened(const std::string& name, Open open) {
    try {
        return orFileError(name, open);
    } catch (const FileError&) {
        throw;
    } catch (const std::runtime_error& refusal) {
        throw std::runtime_error(name + ": " + refusal.what());
    }
}

} // namespace

Recording::Recording(const FileLocation& file, std::string name)
    : path_(utf8Path(file)), name_(name.empty() ? path_ : std::move(name)),
      parser_(opened(name_, [this] { return openContainer(path_); })) {
    requireRead();
}

Recording::Recording(std::istream& input, std::string name)
    : name_(std::move(name)), parser_(opened(name_, [&] { return recognized(input, name_); })) {
    requireRead();
}

void Recording::requireRead() {
    orFileError(name_, [this] { requireReadable(input()); });
}

std::uint64_t Recording::size() {
    return orFileError(name_, [this] { return sizeOfInput(input()); });
}

ReadBytes Recording::bytes() {
    return [read = readingFrom(input()), name = name_](std::uint64_t position, std::span<char> bytes) {
        return orFileError(name, [&] { return read(position, bytes); });
    };
}

std::optional<double> Recording::duration() {
    const auto duration = orFileError(name_, [this] { return movieDuration(*parser_); });
    requireRead();
    return duration;
}

std::vector<ZCAPHeader> Recording::creators() {
    auto creators = orFileError(name_, [this] { return readRecordingInfo(*parser_); });
    requireRead();
    return creators;
}

const ValidationReport& Recording::validation() {
    if (!validation_)
        validation_ = orFileError(name_, [this] { return validateRecording(input(), container()); });
    return *validation_;
}

std::vector<StreamInfo> Recording::streams() {
    const std::uint64_t total = size();
    std::vector<StreamInfo> streams;
    for (const uuid& type : parser_->getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = parser_->fileDataForUUID(type);
        streams.push_back({type, offset, length, std::min(length, total - std::min(offset, total))});
    }
    return streams;
}

StreamReport Recording::examine(const StreamInfo& stream) {
    const std::vector<StreamReport>& reports = validation().streams;
    const auto found = std::find_if(reports.begin(), reports.end(),
                                    [&](const StreamReport& report) { return report.offset == stream.offset; });
    const bool isThere = found != reports.end() && found->presentBytes >= s_metaDataHeaderSize;
    StreamReport report = isThere ? *found : StreamReport();
    report.type = stream.type;
    report.offset = stream.offset;
    report.declaredBytes = stream.declaredBytes;
    return report;
}

std::vector<StreamReport> Recording::examinedStreams() {
    std::vector<StreamReport> reports;
    for (const StreamInfo& stream : streams())
        reports.push_back(examine(stream));
    return reports;
}

std::vector<StreamReport> Recording::hiddenStreams() {
    std::vector<StreamReport> hidden;
    for (const StreamReport& stream : validation().streams) {
        const auto [offset, length] = parser_->fileDataForUUID(stream.type);
        if (stream.presentBytes >= s_metaDataHeaderSize && (length == 0 || offset != stream.offset))
            hidden.push_back(stream);
    }
    return hidden;
}

StreamEntries Recording::entriesOf(const StreamInfo& stream) {
    const auto read = [read = bytes(), offset = stream.offset](std::uint64_t position, std::span<char> bytes) {
        return read(offset + position, bytes);
    };
    return ZULMetaData::entriesOf(read, stream.presentBytes);
}

} // namespace ZULMetaData
