#include "ZULMetaDataBridge/Source/MetaDataWriters/BaseMetaDataWriter.h"

namespace ZULMetaData {

BaseMetaDataWriter* BaseMetaDataWriter::initWithMetaDataFile(const FileLocation& file) {
    setMetaDataFile(file);
    setup();
    return this;
}

} // namespace ZULMetaData
