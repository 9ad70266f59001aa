#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <algorithm>
#include <iostream>
#include <sstream>

namespace ZULMetaData {

namespace {

template <class IsWanted>
const MetaDataKind* findKind(IsWanted isWanted) {
    const auto kind = std::find_if(s_metaDataKinds.begin(), s_metaDataKinds.end(), isWanted);
    return kind == s_metaDataKinds.end() ? nullptr : &*kind;
}

} // namespace

const MetaDataKind* findMetaDataKind(const uuid& type) {
    return findKind([&type](const MetaDataKind& kind) { return kind.type == type; });
}

const MetaDataKind* findMetaDataKind(std::string_view name) {
    return findKind([name](const MetaDataKind& kind) { return kind.name == name; });
}

std::string uuidText(const uuid& type) {
    std::ostringstream text;
    text.exceptions(std::ios_base::badbit); // half an identifier is worse than std::bad_alloc
    text << type;
    return text.str();
}

std::string metaDataKindName(const uuid& type) {
    const MetaDataKind* kind = findMetaDataKind(type);
    return kind ? std::string(kind->name) : uuidText(type);
}

int MetaDataUUID::currentVersionForUUID(const uuid& type) {
    if (const MetaDataKind* kind = findMetaDataKind(type))
        return kind->currentVersion;
    std::cout << "MetaDataUUID::currentVersionForUUID - unsupported UUID = " << type << std::endl;
    return -1;
}

} // namespace ZULMetaData
