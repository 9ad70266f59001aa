#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include "SharedDependencies/EndianFile.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaData/Containers/WideRIFF.h"
#include "ZULMetaData/StreamExtent.h"
#include "ZULMetaDataBridge/Source/Validation/ContainerWalk.h"
#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"
#include "ZULMetaDataBridge/Source/Validation/UntrustedInput.h"

#include <algorithm>
#include <cerrno>
#include <fstream>
#include <stdexcept>
#include <system_error>

namespace ZULMetaData {

std::string StreamReport::name() const {
    return metaDataKindName(type);
}

std::vector<Finding> ValidationReport::allFindings() const {
    std::vector<Finding> all = findings;
    for (const StreamReport& stream : streams)
        all.insert(all.end(), stream.findings.begin(), stream.findings.end());
    std::stable_sort(all.begin(), all.end(),
                     [](const Finding& left, const Finding& right) { return left.offset < right.offset; });
    return all;
}

ValidationReport validateRecording(const FileLocation& file) {
    return validateRecording(file, {});
}

ValidationReport validateRecording(const FileLocation& file, const std::set<FindingCode>& ignored) {
    const std::string path = utf8Path(file);
    std::ifstream stream;
    fileOpen(stream, path.c_str(), std::ios_base::in | std::ios_base::binary);
    if (!stream.is_open())
        throw std::system_error(errno, std::generic_category(), "cannot be opened");
    const RecognizedContainer recognized = recognizeContainer(stream, path);
    if (recognized.type == Container::Unknown)
        throw std::runtime_error(recognized.refusal());
    return validateRecording(stream, recognized.type, ignored);
}

ValidationReport validateRecording(std::istream& stream, Container::Type type) {
    return validateRecording(stream, type, {});
}

ValidationReport validateRecording(std::istream& stream, Container::Type type, const std::set<FindingCode>& ignored) {
    ValidationReport report;
    report.container = type;
    report.bytes = sizeOfInput(stream);
    report.duration = movieDuration(stream, type);
    requireReadable(stream);
    std::optional<detail::WideRIFF> wide;
    if (type == Container::Riff)
        wide = detail::wideRIFF(stream);
    stream.clear();
    stream.seekg(0);
    detail::UntrustedInput input(stream, report.bytes);
    detail::ContainerWalk walk(input, report, ignored);
    switch (type) {
    case Container::QuickTime: walk.walkMovie(); break;
    case Container::Riff: walk.walkRIFF(wide); break;
    case Container::RawStream: walk.walkRawStream(); break;
    default: throw std::runtime_error(RecognizedContainer().refusal());
    }
    return report;
}

} // namespace ZULMetaData
