#pragma once

// Decoded entries as JSON documents, and these as lines of text, NDJSON and CSV.

#include "Reports/Report.h"
#include "ZULMetaDataBridge/Source/EntryBuilding.h"
#include "ZULMetaDataBridge/Source/StoredFields.h"

#include <nlohmann/json.hpp>

#include <concepts>
#include <cstdint>
#include <list>
#include <string>
#include <tuple>
#include <vector>

namespace Zulm {

enum class EntryFormat { Text, JSON, NDJSON, CSV };

/// The document of one entry, put together from the values that are stored. Every text is valid UTF-8; one that is not
/// what is stored has the stored bytes beside it, as "KEY_base64". "timestamp" is the exact time, "timestamp_f32" its
/// 32-bit form if that is another one. An image shows as width, height and byte count, or as byte count and "damage".
class EntryDocument {
public:
    void add(const char* key, std::int32_t value) { document_[key] = value; }
    void add(const char* key, std::uint32_t value) { document_[key] = value; }
    /// Adds it as a text, because it may not fit into a number of JSON.
    void add(const char* key, std::uint64_t value) { document_[key] = std::to_string(value); }
    void add(const char* key, float value);
    void add(const char* key, double value) { document_[key] = numberDocument(value); }
    void add(const char* key, const std::string& text) { addText(key, text, text); }
    void add(const char* key, const ZULMetaData::CursorImage& cursor);

    /// Adds a text and, if that is not what is stored, the stored bytes.
    void addText(const char* key, const std::string& text, const std::string& stored);

    /// Adds the texts of a list under these keys. A text that the list lacks is null, further ones stand in "further".
    void addList(const std::vector<const char*>& keys, const std::list<std::string>& stored);

    nlohmann::ordered_json finished(double time);

private:
    nlohmann::ordered_json document_ = nlohmann::ordered_json::object();
    nlohmann::ordered_json further_ = nlohmann::ordered_json::object(); ///< what follows the fields
};

template <class Kind>
nlohmann::ordered_json entryDocument(double time, const typename Kind::Value& value) {
    EntryDocument document;
    if constexpr (std::same_as<typename Kind::Value, std::list<std::string>>)
        document.addList(std::apply([](const auto&... field) { return std::vector{field.key...}; }, Kind::fields),
                         value);
    else
        ZULMetaData::visitStoredFields<Kind>(
            value, [&document](const char* key, const auto& stored) { document.add(key, stored); });
    return document.finished(time);
}

/// The columns of a table of these entries. Lists have one more, "further", for the texts that no key is for.
template <class Kind>
ZULMetaData::EntryKeys tableKeys() {
    ZULMetaData::EntryKeys keys = ZULMetaData::entryKeys<Kind>();
    if constexpr (std::same_as<typename Kind::Value, std::list<std::string>>)
        keys.insert(keys.end() - 1, "further");
    return keys;
}

/// Returns what is wrong with an entry that could be read all the same. Empty if nothing is.
std::string damageOf(const nlohmann::ordered_json& entry);

/// Returns the entry in one line, without its end. Texts are escaped, and what is not UTF-8 in them shows byte by byte.
std::string textLine(const nlohmann::ordered_json& entry);

/// Returns the fields under `keys`. Texts are escaped, except for the ends of their lines; "further" is a JSON array.
std::string csvLine(const nlohmann::ordered_json& entry, const ZULMetaData::EntryKeys& keys);
std::string csvHeader(const ZULMetaData::EntryKeys& keys);

} // namespace Zulm
