#include "ZULMetaDataBridge/Source/ZULMAtomWriter.h"

#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaDataBridge/Source/ZULMAtomRepair.h"

#include <algorithm>
#include <iterator>
#include <string>

namespace ZULMetaData {

void ZULMAtomWriter::writeMetaDataFiles(const std::vector<FileLocation>& files, const FileLocation& toFile) const {
    ZULMAtomRepair::finalizeAtomsInFile(toFile);
    std::vector<std::string> paths;
    std::transform(files.begin(), files.end(), std::back_inserter(paths), utf8Path);
    MP4MetaData::appendMetaDataFiles(utf8Path(toFile), paths);
}

} // namespace ZULMetaData
