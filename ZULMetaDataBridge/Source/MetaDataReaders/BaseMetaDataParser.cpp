#include "ZULMetaDataBridge/Source/MetaDataReaders/BaseMetaDataParser.h"

#include "ZULMetaData/ZULMMetaDataParser.h"

#include <ios>
#include <map>
#include <string>
#include <utility>

namespace ZULMetaData {

BaseMetaDataParser* BaseMetaDataParser::initWithMetaDataFile(const FileLocation& file) {
    setMetaDataFile(file);
    setup();
    return this;
}

std::unique_ptr<std::stringstream> BaseMetaDataParser::getMetaDataStream(uuid type) const {
    std::map<uuid, std::string> streams;
    if (const auto container = MetaDataParser::create(utf8Path(metaDataFile())))
        container->loadAllData(streams);
    return std::make_unique<std::stringstream>(std::move(streams[type]));
}

} // namespace ZULMetaData
