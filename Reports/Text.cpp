#include "Reports/Text.h"

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <fmt/core.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

namespace Zulm {

using ZULMetaData::validCharacterLength;

namespace {

constexpr std::string_view s_base64Digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

struct NumberRange {
    std::uint32_t first;
    std::uint32_t last;
};

/// In ascending order: the general categories Cc, Cf, Zl and Zp, the default ignorable code points, the blank Braille
/// pattern, and the numbers that Unicode keeps free. Those that end in FFFE and FFFF are not among them.
constexpr std::array<NumberRange, 29> s_invisible{
    {{0x0000, 0x001f},   {0x007f, 0x009f},   {0x00ad, 0x00ad},   {0x034f, 0x034f},   {0x0600, 0x0605},
     {0x061c, 0x061c},   {0x06dd, 0x06dd},   {0x070f, 0x070f},   {0x0890, 0x0891},   {0x08e2, 0x08e2},
     {0x115f, 0x1160},   {0x17b4, 0x17b5},   {0x180b, 0x180f},   {0x200b, 0x200f},   {0x2028, 0x202e},
     {0x2060, 0x206f},   {0x2800, 0x2800},   {0x3164, 0x3164},   {0xfdd0, 0xfdef},   {0xfe00, 0xfe0f},
     {0xfeff, 0xfeff},   {0xffa0, 0xffa0},   {0xfff0, 0xfffb},   {0x110bd, 0x110bd}, {0x110cd, 0x110cd},
     {0x13430, 0x1343f}, {0x1bca0, 0x1bca3}, {0x1d173, 0x1d17a}, {0xe0000, 0xe0fff}}};

bool isInvisible(std::uint32_t number) {
    const auto range = std::lower_bound(s_invisible.begin(), s_invisible.end(), number,
                                        [](const NumberRange& each, std::uint32_t n) { return each.last < n; });
    const bool isInTable = range != s_invisible.end() && range->first <= number;
    return isInTable || (number & 0xfffe) == 0xfffe;
}

/// Returns the code point of one valid character.
std::uint32_t numberOf(std::string_view character) {
    constexpr std::array<unsigned char, 5> firstBits{0, 0x7f, 0x1f, 0x0f, 0x07};
    std::uint32_t number = static_cast<unsigned char>(character[0]) & firstBits[character.size()];
    for (const char c : character.substr(1))
        number = number << 6 | (static_cast<unsigned char>(c) & 0x3f);
    return number;
}

/// One character of a text, or one byte that belongs to no character.
struct TextPiece {
    std::string_view bytes;
    std::uint32_t number = 0; ///< its code point, or the value of the byte
    bool isCharacter = false; ///< false for a byte that is not UTF-8

    bool canBeSeen() const { return isCharacter && !isInvisible(number); }
};

/// Returns what `bytes` begin with. They must not be empty.
TextPiece firstPiece(std::string_view bytes) {
    const std::size_t length = validCharacterLength(bytes);
    if (length == 0)
        return {bytes.substr(0, 1), static_cast<unsigned char>(bytes[0]), false};
    return {bytes.substr(0, length), numberOf(bytes.substr(0, length)), true};
}

std::string escaped(char byte) {
    return fmt::format("\\x{:02x}", static_cast<unsigned char>(byte));
}

std::string escaped(const TextPiece& piece) {
    return piece.bytes.size() == 1 ? escaped(piece.bytes[0]) : fmt::format("\\u{{{:x}}}", piece.number);
}

std::string escapedForJSON(std::uint32_t number) {
    if (number < 0x10000)
        return fmt::format("\\u{:04x}", number);
    const std::uint32_t rest = number - 0x10000;
    return fmt::format("\\u{:04x}\\u{:04x}", 0xd800 | rest >> 10, 0xdc00 | (rest & 0x3ff));
}

/// Joins what `show` returns for every piece of the text.
template <class Show>
std::string eachShown(std::string_view bytes, Show show) {
    std::string text;
    while (!bytes.empty()) {
        const TextPiece piece = firstPiece(bytes);
        bytes.remove_prefix(piece.bytes.size());
        text += show(piece, bytes);
    }
    return text;
}

std::string shownPiece(const TextPiece& piece) {
    return piece.canBeSeen() ? std::string(piece.bytes) : escaped(piece);
}

/// Whether a backslash before these bytes would look like the beginning of an escape.
bool looksLikeEscape(std::string_view following) {
    if (following.empty())
        return false;
    return std::string_view("\\xu").find(following[0]) != std::string_view::npos || !firstPiece(following).canBeSeen();
}

std::string octalEscapes(std::string_view bytes) {
    std::string text;
    for (const char c : bytes)
        text += fmt::format("\\{:03o}", static_cast<unsigned char>(c));
    return text;
}

bool isWhiteSpace(std::uint32_t number) {
    return number == ' ' || (number >= '\t' && number <= '\r');
}

} // namespace

std::string printable(std::string_view bytes) {
    std::string text;
    for (const char c : bytes)
        text += c >= ' ' && c <= '~' && c != '\\' ? std::string(1, c) : escaped(c);
    return text;
}

std::string shown(std::string_view bytes) {
    return eachShown(bytes, [](const TextPiece& piece, std::string_view) {
        return piece.number == '\\' ? std::string("\\\\") : shownPiece(piece);
    });
}

std::string shownLines(std::string_view bytes) {
    return eachShown(bytes, [](const TextPiece& piece, std::string_view) {
        return piece.number == '\n' ? std::string("\n") : shown(piece.bytes);
    });
}

std::string shownMessage(std::string_view message) {
    return eachShown(message, [](const TextPiece& piece, std::string_view following) {
        return piece.number == '\\' && looksLikeEscape(following) ? std::string("\\\\") : shownPiece(piece);
    });
}

std::string shownJSON(const std::string& document) {
    const auto isPlain = [](char c) { return static_cast<unsigned char>(c) < 0x7f; };
    if (std::all_of(document.begin(), document.end(), isPlain))
        return document;
    return eachShown(document, [](const TextPiece& piece, std::string_view) {
        return piece.number < 0x7f || piece.canBeSeen() ? std::string(piece.bytes) : escapedForJSON(piece.number);
    });
}

std::string readableLine(const std::string& text) {
    return eachShown(text, [](const TextPiece& piece, std::string_view) {
        if (isWhiteSpace(piece.number))
            return std::string(1, ' ');
        return piece.canBeSeen() ? std::string(piece.bytes) : fmt::format("[U+{:04X}]", piece.number);
    });
}

std::string validText(const std::string& bytes) {
    if (ZULMetaData::isUTF8(bytes))
        return bytes;
    const std::string text = nlohmann::json(bytes).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
    return nlohmann::json::parse(text).get<std::string>();
}

// A backslash stands before a quote or a digit here, never before what would make it look like an escape.
std::string shellWord(const std::string& word) {
    constexpr std::string_view plain = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789_-+=:,./@%";
    if (!word.empty() && word.find_first_not_of(plain) == std::string::npos)
        return word;
    const auto quoted = [](const TextPiece& piece, std::string_view) -> std::string {
        if (piece.number == '\\')
            return R"("'\'")";
        if (!piece.canBeSeen())
            return fmt::format("\"$'{}'\"", octalEscapes(piece.bytes));
        const bool hasMeaning = std::string_view("\"$`").find(piece.bytes) != std::string_view::npos;
        return (hasMeaning ? "\\" : "") + std::string(piece.bytes);
    };
    return fmt::format("\"{}\"", eachShown(word, quoted));
}

std::string base64(std::string_view bytes) {
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        const std::string_view group = bytes.substr(i, 3);
        std::uint32_t bits = 0;
        for (std::size_t j = 0; j < 3; ++j)
            bits = bits << 8 | (j < group.size() ? static_cast<unsigned char>(group[j]) : 0U);
        for (std::size_t j = 0; j < 4; ++j)
            text += j <= group.size() ? s_base64Digits[bits >> (18 - 6 * j) & 0x3f] : '=';
    }
    return text;
}

std::string bytesOfBase64(std::string_view text) {
    std::string bytes;
    std::uint32_t bits = 0;
    int count = 0;
    for (const char c : text.substr(0, text.find('='))) {
        bits = bits << 6 | static_cast<std::uint32_t>(s_base64Digits.find(c));
        count += 6;
        if (count >= 8) {
            count -= 8;
            bytes += static_cast<char>(bits >> count & 0xff);
        }
    }
    return bytes;
}

} // namespace Zulm
