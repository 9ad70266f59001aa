#include "ZULMetaDataBridge/Source/MetaDataReaders/BaseMetaDataParser.h"

#include "ZULMetaData/ZULMMetaDataParser.h"

#include <string>

namespace ZULMetaData {

BaseMetaDataParser* BaseMetaDataParser::initWithMetaDataFile(const FileLocation& file) {
    setMetaDataFile(file);
    setup();
    return this;
}

std::unique_ptr<std::stringstream> BaseMetaDataParser::getMetaDataStream(uuid type) const {
    const auto container = MetaDataParser::create(utf8Path(metaDataFile()));
    return std::make_unique<std::stringstream>(container ? container->loadData(type) : std::string());
}

} // namespace ZULMetaData
