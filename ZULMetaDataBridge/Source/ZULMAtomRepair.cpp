#include "ZULMetaDataBridge/Source/ZULMAtomRepair.h"

#include "ZULMetaData/ZULMMetaDataParser.h"

namespace ZULMetaData {

bool ZULMAtomRepair::finalizeAtomsInFile(const FileLocation& file) {
    return Util::finalizeAtomsInFile(utf8Path(file));
}

} // namespace ZULMetaData
