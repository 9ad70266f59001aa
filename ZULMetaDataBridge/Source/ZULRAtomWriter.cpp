#include "ZULMetaDataBridge/Source/ZULRAtomWriter.h"

#include "Platform/AssertionReport.h"
#include "Platform/ProcessInfo.h"
#include "SharedDependencies/EndianFile.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/AtomWriting.h"
#include "ZULMetaDataBridge/Source/ZULMAtomRepair.h"

#include <cstdint>
#include <fstream>

namespace ZULMetaData {

namespace {

std::string versionOfThisSystem() {
    const auto version = ProcessInfo::current().operatingSystemVersion;
    return std::to_string(version.major) + '.' + std::to_string(version.minor) + '.' + std::to_string(version.patch);
}

struct AppendedAtom {
    detail::OpenAtom atom;
    std::uint64_t size;
};

// What both assertions report is part of their contract: crash reports are told apart by it.

AppendedAtom appendZCAPAtomInfo(const std::string& path, const ZCAPHeader& header) {
    std::ofstream outfile;
    fileOpen(outfile, path.c_str(), std::ios_base::app | std::ios_base::binary | std::ios_base::out);
    if (!outfile.is_open())
        reportFailedAssertion("outfile.is_open()", "appendZCAPAtomInfo", "ZULRAtomWriter", 40);
    const detail::OpenAtom atom = detail::beginAtom(outfile, detail::s_recordingInfoAtom);
    outfile.write(reinterpret_cast<const char*>(&header), sizeof header);
    return {atom, detail::endAtom(outfile, atom)};
}

void writeAtomSize(const std::string& path, const AppendedAtom& appended) {
    std::fstream stream;
    fileOpen(stream, path.c_str(), std::ios_base::in | std::ios_base::out | std::ios_base::binary);
    if (!stream.is_open())
        reportFailedAssertion("stream.is_open()", "writeAtomSize", "ZULRAtomWriter", 26);
    detail::writeAtomSize(stream, appended.atom.sizeField, appended.size);
}

} // namespace

ZCAPHeader recordingInfo(const std::string& creatorName, const std::string& creatorVersion) {
    CreatorAttributes creator;
    creator.setName(creatorName);
    creator.setVersion(creatorVersion);
    creator.setName(CreatorAttributes::platformNameMac());
    creator.setPlatformVersion(versionOfThisSystem());
    ZCAPHeader header;
    header.headerVersion = 1;
    header.creator = creator;
    return header;
}

void ZULRAtomWriter::writeZULRtoFile(const FileLocation& file, const std::string& creatorName,
                                     const std::string& creatorVersion) const {
    ZULMAtomRepair::finalizeAtomsInFile(file);
    const std::string path = utf8Path(file);
    writeAtomSize(path, appendZCAPAtomInfo(path, recordingInfo(creatorName, creatorVersion)));
}

} // namespace ZULMetaData
