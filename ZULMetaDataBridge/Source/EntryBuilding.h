#pragma once

// Turns decoded values into entries, by the fields of their kind.

#include "ZULMetaDataBridge/Source/EntryDictionary.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <array>
#include <cstdint>
#include <functional>
#include <string>
#include <tuple>

namespace ZULMetaData {

inline EntryValue entryValue(std::int32_t value) {
    return value;
}
inline EntryValue entryValue(std::uint32_t value) {
    return static_cast<std::int32_t>(value);
}
inline EntryValue entryValue(std::uint64_t value) {
    return static_cast<std::int64_t>(value);
}
inline EntryValue entryValue(float value) {
    return value;
}
inline EntryValue entryValue(double value) {
    return static_cast<float>(value);
}
inline EntryValue entryValue(std::string value) {
    return value;
}
inline EntryValue entryValue(EntryValue value) {
    return value;
}

/// The keys of a kind's fields, then "timestamp".
template <class Kind>
const EntryKeys& entryKeys() {
    static const EntryKeys& keys = *new EntryKeys(std::apply( // never destroyed: entries may outlive the program's end
        [](const auto&... field) {
            return EntryKeys{field.key..., "timestamp"};
        },
        Kind::fields));
    return keys;
}

/// `time` is narrowed to 32 bits. Throws what the kind's fields throw for a value that has no text.
template <class Kind>
EntryDictionary makeEntry(double time, const typename Kind::Value& value) {
    static_assert(std::tuple_size_v<decltype(Kind::fields)> < EntryDictionary::maxSize);
    const auto values = [&](const auto&... field) {
        return std::array<EntryValue, EntryDictionary::maxSize>{entryValue(std::invoke(field.valueOf, value))...,
                                                                entryValue(time)};
    };
    return {entryKeys<Kind>(), std::apply(values, Kind::fields)};
}

} // namespace ZULMetaData
