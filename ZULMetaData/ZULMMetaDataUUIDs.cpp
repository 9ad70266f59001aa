#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <algorithm>
#include <iostream>

namespace ZULMetaData {

const MetaDataKind* findMetaDataKind(const uuid& type) {
    const auto kind = std::ranges::find(s_metaDataKinds, type, &MetaDataKind::type);
    return kind == s_metaDataKinds.end() ? nullptr : &*kind;
}

int MetaDataUUID::currentVersionForUUID(const uuid& type) {
    if (const MetaDataKind* kind = findMetaDataKind(type))
        return kind->currentVersion;
    std::cout << "MetaDataUUID::currentVersionForUUID - unsupported UUID = " << type << std::endl;
    return -1;
}

} // namespace ZULMetaData
