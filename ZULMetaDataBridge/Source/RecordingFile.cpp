#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include "ZULMetaData/ByteSourceStream.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaData/Containers/RecordingInfo.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <stdexcept>
#include <utility>

namespace ZULMetaData {

namespace {

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

/// Reads the first bytes through the stream of the parser, which then need not be read again to find the metadata.
Container::Type recognizedType(std::istream& input, std::uint64_t size, const std::string& name) {
    std::array<char, s_recognitionBytes> first;
    input.read(first.data(), first.size());
    const auto count = static_cast<std::size_t>(input.gcount());
    input.clear();
    input.seekg(0);
    const RecognizedContainer recognized = recognizeContainer({first.data(), count}, size, name);
    if (recognized.type == Container::Unknown)
        throw std::runtime_error(recognized.refusal());
    return recognized.type;
}

} // namespace

RecordingFile::RecordingFile(const FileLocation& file, std::string name)
    : RecordingFile(utf8Path(file), std::move(name), {}, ScanMessages::Printed) {}

RecordingFile::RecordingFile(ByteSource bytes, std::string name, ScanMessages messages)
    : RecordingFile({}, std::move(name), std::move(bytes), messages) {}

RecordingFile::RecordingFile(std::string path, std::string name, std::optional<ByteSource> bytes, ScanMessages messages)
    : path_(std::move(path)), name_(name.empty() ? path_ : std::move(name)),
      bytes_(bytes ? namedSource(*bytes, name_) : openSource(path_, name_)),
      input_(std::make_unique<ByteSourceStream>(bytes_)), parser_(opened(name_, [this, messages] {
          const std::string& named = path_.empty() ? name_ : path_;
          return openContainer(*input_, recognizedType(*input_, bytes_.size(), named), messages);
      })) {}

std::optional<double> RecordingFile::duration() const {
    return validation_ ? validation_->duration : movieDuration(bytes_, container());
}

std::vector<ZCAPHeader> RecordingFile::creators() const {
    return readRecordingInfo(bytes_, container());
}

const ValidationReport& RecordingFile::validation() {
    if (!validation_)
        validation_ = validateRecording(bytes_, container());
    return *validation_;
}

std::vector<StreamInfo> RecordingFile::streams() const {
    std::vector<StreamInfo> streams;
    for (const uuid& type : parser_->getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = parser_->fileDataForUUID(type);
        streams.push_back({type, offset, length, bytes_.part(offset, length).size()});
    }
    return streams;
}

StreamReport RecordingFile::examine(const StreamInfo& stream) {
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

std::vector<StreamReport> RecordingFile::examinedStreams() {
    std::vector<StreamReport> reports;
    for (const StreamInfo& stream : streams())
        reports.push_back(examine(stream));
    return reports;
}

std::vector<StreamReport> RecordingFile::hiddenStreams() {
    std::vector<StreamReport> hidden;
    for (const StreamReport& stream : validation().streams) {
        const auto [offset, length] = parser_->fileDataForUUID(stream.type);
        if (stream.presentBytes >= s_metaDataHeaderSize && (length == 0 || offset != stream.offset))
            hidden.push_back(stream);
    }
    return hidden;
}

} // namespace ZULMetaData
