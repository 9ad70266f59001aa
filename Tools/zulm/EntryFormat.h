#pragma once

// Decoded entries as JSON documents, and these as lines of text, NDJSON and CSV.

#include "Tools/zulm/Text.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <nlohmann/json.hpp>

#include <concepts>
#include <cstdint>
#include <list>
#include <string>

namespace Zulm {

enum class EntryFormat { Text, JSON, NDJSON, CSV };

/// An entry by its keys. Every text is valid; one that is not what is stored has the stored bytes beside it, as
/// "KEY_base64". "timestamp" is the exact time, "timestamp_f32" its 32-bit form where that is another one. An image
/// shows as width, height and byte count, or as byte count and "damage".
nlohmann::ordered_json entryDocument(const ZULMetaData::EntryDictionary& entry, double time);

/// What is peculiar to values that are more, or less, than the keys of their kind.
nlohmann::ordered_json textEntryDocument(const ZULMetaData::EntryDictionary& entry, double time,
                                         const std::string& stored);
nlohmann::ordered_json cursorEntryDocument(const ZULMetaData::EntryDictionary& entry, double time,
                                           const ZULMetaData::CursorImage& stored);
nlohmann::ordered_json listEntryDocument(const ZULMetaData::EntryDictionary& entry, double time,
                                         const std::list<std::string>& stored);

/// Filled up with empty texts to as many as an entry of the kind has keys for.
template <class Kind>
std::list<std::string> filledUp(std::list<std::string> texts) {
    if (texts.size() < std::tuple_size_v<decltype(Kind::fields)>)
        texts.resize(std::tuple_size_v<decltype(Kind::fields)>);
    return texts;
}

template <class Kind>
nlohmann::ordered_json entryDocument(double time, const typename Kind::Value& value) {
    using Value = typename Kind::Value;
    using ZULMetaData::makeEntry;
    if constexpr (std::same_as<Value, ZULMetaData::CursorImage>)
        return cursorEntryDocument(makeEntry<Kind>(time, value), time, value);
    else if constexpr (std::same_as<Value, std::string>)
        return textEntryDocument(makeEntry<Kind>(time, validText(value)), time, value);
    else if constexpr (std::same_as<Value, std::list<std::string>>)
        return listEntryDocument(makeEntry<Kind>(time, filledUp<Kind>(value)), time, value);
    else
        return entryDocument(makeEntry<Kind>(time, value), time);
}

/// What is wrong with an entry that could be read all the same; empty where nothing is.
std::string damageOf(const nlohmann::ordered_json& entry);

/// In one line, without its end. Bytes that are no text show as U+FFFD.
std::string jsonLine(const nlohmann::ordered_json& document);
std::string textLine(const nlohmann::ordered_json& entry);

/// The fields under `keys`.
std::string csvLine(const nlohmann::ordered_json& entry, const ZULMetaData::EntryKeys& keys);
std::string csvHeader(const ZULMetaData::EntryKeys& keys);

} // namespace Zulm
