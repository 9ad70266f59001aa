#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/MovieDuration.h"
#include "ZULMetaDataBridge/Source/Validation/ContainerWalk.h"

#include <algorithm>
#include <stdexcept>

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

bool ValidationReport::hidesStreams() const {
    constexpr std::array codes{FindingCode::TrailingBytes, FindingCode::ZeroSizeChild, FindingCode::BeyondParent,
                               FindingCode::BeyondFile,    FindingCode::DroppedTail,   FindingCode::OpenEndedAtom};
    const auto isInMetaData = [&](const Finding& finding) {
        return (finding.place == detail::s_metaDataAtom.text() || finding.place == detail::s_streamAtom.text() ||
                finding.code == FindingCode::ZeroSizeChild) &&
               std::find(codes.begin(), codes.end(), finding.code) != codes.end();
    };
    return std::any_of(findings.begin(), findings.end(), isInMetaData) ||
           std::any_of(streams.begin(), streams.end(), [](const StreamReport& stream) { return !stream.isReachable; });
}

ValidationReport validateRecording(const FileLocation& file, const std::set<FindingCode>& ignored) {
    const std::string path = utf8Path(file);
    const ByteSource bytes = ByteSource::file(path);
    const RecognizedContainer recognized = recognizeContainer(bytes, path);
    if (recognized.type == Container::Unknown)
        throw std::runtime_error(recognized.refusal());
    return validateRecording(bytes, recognized.type, ignored);
}

ValidationReport validateRecording(const ByteSource& file, Container::Type type, const std::set<FindingCode>& ignored) {
    ValidationReport report;
    report.container = type;
    report.bytes = file.size();
    report.duration = movieDuration(file, type);
    detail::walkContainer(file, report, ignored);
    return report;
}

} // namespace ZULMetaData
