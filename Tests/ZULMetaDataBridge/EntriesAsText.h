#pragma once

// Decoded entries as lines of text, so that a test shows what it expects as a reader would write it down.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <string>
#include <variant>
#include <vector>

namespace ZULMetaData::Test {

/// Enough digits to tell every float from its neighbours.
inline std::string digitsOf(double number) {
    char digits[32];
    std::snprintf(digits, sizeof digits, "%.9g", number);
    return digits;
}

/// "2x1 ff0000ff 00ff0080": the size, then the pixels.
inline std::string asText(const Image& image) {
    std::string text = std::to_string(image.width()) + 'x' + std::to_string(image.height());
    std::size_t index = 0;
    for (const std::uint8_t byte : image.rgba()) {
        char digits[3];
        std::snprintf(digits, sizeof digits, "%02x", unsigned{byte});
        text += index++ % 4 == 0 ? " " : "";
        text += digits;
    }
    return text;
}

struct EntryValueText {
    std::string operator()(std::int32_t number) const { return "int32 " + std::to_string(number); }
    std::string operator()(std::int64_t number) const { return "int64 " + std::to_string(number); }
    std::string operator()(float number) const { return "float " + digitsOf(number); }
    std::string operator()(const std::string& text) const { return "text '" + text + '\''; }
    std::string operator()(const std::shared_ptr<const Image>& image) const {
        return image ? "image " + asText(*image) : "no image";
    }
};

/// "x = int32 10, y = int32 -4, timestamp = float 0.25": the keys in their order, each with the type of its value
/// and the value.
inline std::string asText(const EntryDictionary& entry) {
    std::string text;
    for (const auto& [key, value] : entry)
        text += (text.empty() ? "" : ", ") + key + " = " + std::visit(EntryValueText(), value);
    return text;
}

inline std::vector<std::string> asTexts(const EntryList& entries) {
    std::vector<std::string> texts;
    for (const EntryDictionary& entry : entries)
        texts.push_back(asText(entry));
    return texts;
}

} // namespace ZULMetaData::Test
