#include "Tools/zulm/Text.h"

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fmt/core.h>
#include <nlohmann/json.hpp>

#include <cstddef>
#include <cstdint>

namespace Zulm {

namespace {

std::string escaped(char byte) {
    return fmt::format("\\x{:02x}", static_cast<unsigned char>(byte));
}

/// Of the control characters U+0080 to U+009F, which take two bytes.
bool isUpperControl(std::string_view bytes) {
    return bytes.size() > 1 && bytes[0] == '\xc2' && static_cast<unsigned char>(bytes[1]) < 0xa0;
}

} // namespace

std::string printable(std::string_view bytes) {
    std::string text;
    for (const char c : bytes)
        text += c >= ' ' && c <= '~' && c != '\\' ? std::string(1, c) : escaped(c);
    return text;
}

std::string withoutControls(const std::string& bytes) {
    std::string result;
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        const auto byte = static_cast<unsigned char>(bytes[i]);
        const bool isControl = byte < 0x20 || byte == 0x7f;
        if (isUpperControl(std::string_view(bytes).substr(i))) {
            result += escaped(bytes[i + 1]);
            ++i;
        } else {
            result += isControl ? escaped(bytes[i]) : std::string(1, bytes[i]);
        }
    }
    return result;
}

std::string shown(const std::string& text) {
    return withoutControls(validText(text));
}

std::string validText(const std::string& bytes) {
    if (ZULMetaData::isUTF8(bytes))
        return bytes;
    const std::string text = nlohmann::json(bytes).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
    return nlohmann::json::parse(text).get<std::string>();
}

std::string shellWord(const std::string& word) {
    constexpr std::string_view plain = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789_-+=:,./@%";
    if (!word.empty() && word.find_first_not_of(plain) == std::string::npos)
        return word;
    std::string quoted = "\"";
    for (const char c : word)
        quoted +=
            std::string_view("\"\\$`").find(c) == std::string_view::npos ? std::string(1, c) : std::string{'\\', c};
    return quoted + '"';
}

std::string base64(std::string_view bytes) {
    constexpr auto digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        const std::string_view group = bytes.substr(i, 3);
        std::uint32_t bits = 0;
        for (std::size_t j = 0; j < 3; ++j)
            bits = bits << 8 | (j < group.size() ? static_cast<unsigned char>(group[j]) : 0U);
        for (std::size_t j = 0; j < 4; ++j)
            text += j <= group.size() ? digits[bits >> (18 - 6 * j) & 0x3f] : '=';
    }
    return text;
}

} // namespace Zulm
