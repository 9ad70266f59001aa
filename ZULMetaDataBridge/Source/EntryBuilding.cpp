#include "ZULMetaDataBridge/Source/EntryBuilding.h"

namespace ZULMetaData {

EntryValue entryValue(std::int32_t value) {
    return value;
}

EntryValue entryValue(std::uint32_t value) {
    return static_cast<std::int32_t>(value);
}

EntryValue entryValue(std::uint64_t value) {
    return static_cast<std::int64_t>(value);
}

EntryValue entryValue(float value) {
    return value;
}

EntryValue entryValue(double value) {
    return static_cast<float>(value);
}

EntryValue entryValue(std::string value) {
    return value;
}

EntryValue entryValue(EntryValue value) {
    return value;
}

} // namespace ZULMetaData
