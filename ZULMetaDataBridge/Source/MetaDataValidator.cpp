#include "ZULMetaDataBridge/Source/MetaDataValidator.h"

#include "SharedDependencies/EndianFile.h"
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
    const std::string path = utf8Path(file);
    const MetaDataParser::StreamType type = MetaDataParser::streamTypeOf(path);
    std::ifstream stream;
    fileOpen(stream, path.c_str(), std::ios_base::in | std::ios_base::binary);
    if (!stream.is_open())
        throw std::system_error(errno, std::generic_category(), "cannot be opened");
    return validateRecording(stream, type);
}

ValidationReport validateRecording(std::istream& stream, MetaDataParser::StreamType type) {
    stream.clear();
    stream.seekg(0);
    ValidationReport report;
    report.container = type;
    report.bytes = sizeOfInput(stream);
    detail::UntrustedInput input(stream, report.bytes);
    detail::ContainerWalk walk(input, report);
    switch (type) {
    case MetaDataParser::QuickTime: walk.walkMovie(); break;
    case MetaDataParser::Riff: walk.walkRIFF(); break;
    case MetaDataParser::RawStream: walk.walkRawStream(); break;
    default: throw std::runtime_error("not a movie, a RIFF file or a stream by its name");
    }
    return report;
}

} // namespace ZULMetaData
