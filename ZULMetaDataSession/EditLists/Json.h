#pragma once

// Reads JSON documents of other programs. Numbers keep their text, so that a fraction can be made of them exactly.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

/// A value of a document.
struct JsonValue {
    /// The types of values.
    enum class Type : std::uint8_t { Null, Boolean, Number, Text, Array, Object };

    Type type = Type::Null;
    std::uint64_t offset = 0;     ///< the position of its first byte in the document
    std::string name;             ///< the name of a member of an object
    std::string text;             ///< a text in UTF-8, or the characters of a number or a boolean
    std::vector<JsonValue> items; ///< the elements of an array, or the members of an object

    bool isText() const { return type == Type::Text; }
    bool isNumber() const { return type == Type::Number; }
    bool isArray() const { return type == Type::Array; }
    bool isObject() const { return type == Type::Object; }

    /// Returns the member of an object, or null if there is none or this is no object.
    const JsonValue* find(std::string_view member) const;

    /// Returns whether this is a text with these characters.
    bool isText(std::string_view characters) const { return isText() && text == characters; }
};

/// What may stand in a document.
enum class JsonDialect {
    JSON,  ///< RFC 8259
    JSON5, ///< also comments, trailing commas, names without quotes, single quotes, and more forms of decimal numbers
};

/// Reads a document. Throws `Error` that names `file` and the position for what is no such document, for bytes that are
/// not UTF-8, two members of one name, more than 64 levels, more than a million values, and anything after the
/// document.
JsonValue readJson(std::string_view document, const std::string& file, JsonDialect dialect = JsonDialect::JSON);

} // namespace ZULMetaData::detail
