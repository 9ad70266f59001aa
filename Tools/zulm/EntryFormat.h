#pragma once

// Decoded entries as text, NDJSON and CSV.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <nlohmann/json.hpp>

#include <concepts>
#include <cstdint>
#include <stdexcept>
#include <string>

namespace Zulm {

enum class EntryFormat { Text, NDJSON, CSV };

/// `bytes` as they are where they are UTF-8, else with U+FFFD in place of what is not.
std::string validText(const std::string& bytes);

/// An entry by its keys, the time in full and every text valid. An image shows as width, height and byte count.
nlohmann::ordered_json entryDocument(const ZULMetaData::EntryDictionary& entry, double time,
                                     std::uint32_t imageSize = 0);

template <class Kind>
nlohmann::ordered_json entryDocument(double time, const typename Kind::Value& value) {
    using Value = typename Kind::Value;
    if constexpr (std::same_as<Value, ZULMetaData::CursorImage>)
        return entryDocument(ZULMetaData::makeEntry<Kind>(time, value), time, value.imageDataSize);
    else if constexpr (std::same_as<Value, std::string>)
        return entryDocument(ZULMetaData::makeEntry<Kind>(time, validText(value)), time);
    else
        return entryDocument(ZULMetaData::makeEntry<Kind>(time, value), time);
}

/// As a line, without its end.
std::string formatted(const nlohmann::ordered_json& entry, EntryFormat format);

/// The first line of a CSV table.
std::string csvHeader(const nlohmann::ordered_json& entry);

} // namespace Zulm
