#include "ZULMetaDataBridge/Source/EntryTexts.h"

#include "SharedDependencies/UTF8.h"

#include <array>
#include <stdexcept>

namespace ZULMetaData {

namespace {

/// What a first byte announces: the length of its character and the range of its second byte, which keeps out
/// overlong forms, surrogates and everything above U+10FFFF.
struct Sequence {
    std::size_t length;
    unsigned char secondFrom = 0x80;
    unsigned char secondTo = 0xbf;
};

Sequence sequenceOf(unsigned char first) {
    if (first < 0x80)
        return {1};
    if (first >= 0xc2 && first <= 0xdf)
        return {2};
    if (first == 0xe0)
        return {3, 0xa0, 0xbf};
    if (first == 0xed)
        return {3, 0x80, 0x9f};
    if (first >= 0xe1 && first <= 0xef)
        return {3};
    if (first == 0xf0)
        return {4, 0x90, 0xbf};
    if (first == 0xf4)
        return {4, 0x80, 0x8f};
    if (first >= 0xf1 && first <= 0xf3)
        return {4};
    return {0};
}

std::string_view upToZeroByte(std::string_view bytes) {
    return bytes.substr(0, bytes.find('\0'));
}

} // namespace

std::size_t validCharacterLength(std::string_view bytes) {
    const auto byteAt = [bytes](std::size_t index) { return static_cast<unsigned char>(bytes[index]); };
    if (bytes.empty())
        return 0;
    const Sequence sequence = sequenceOf(byteAt(0));
    if (sequence.length > bytes.size())
        return 0;
    if (sequence.length > 1 && (byteAt(1) < sequence.secondFrom || byteAt(1) > sequence.secondTo))
        return 0;
    for (std::size_t index = 2; index < sequence.length; ++index)
        if (!continuesCharacter(static_cast<char>(byteAt(index))))
            return 0;
    return sequence.length;
}

bool isUTF8(std::string_view bytes) {
    return validUTF8Length(bytes) == bytes.size();
}

std::size_t validUTF8Length(std::string_view bytes) {
    std::size_t valid = 0;
    while (valid < bytes.size()) {
        const std::size_t length = validCharacterLength(bytes.substr(valid));
        if (length == 0)
            break;
        valid += length;
    }
    return valid;
}

std::string textFromUTF8(const std::string& bytes) {
    const std::string_view text = upToZeroByte(bytes);
    if (!isUTF8(text))
        throw std::invalid_argument("text is not valid UTF-8");
    return std::string(text);
}

std::string detail::encodedUTF8(std::uint32_t number) {
    const int further = number < 0x80 ? 0 : number < 0x800 ? 1 : number < 0x10000 ? 2 : 3; // bytes
    constexpr std::array<std::uint32_t, 4> marks{0, 0xc0, 0xe0, 0xf0};
    std::string bytes(1, static_cast<char>(marks[static_cast<std::size_t>(further)] | number >> 6 * further));
    for (int i = further - 1; i >= 0; --i)
        bytes.push_back(static_cast<char>(0x80 | (number >> 6 * i & 0x3f)));
    return bytes;
}

std::string utf8Character(std::uint32_t codePoint) {
    const bool isCharacter = codePoint < 0xd800 || (codePoint > 0xdfff && codePoint < 0x110000);
    return isCharacter ? detail::encodedUTF8(codePoint) : std::string();
}

std::string utf8FromLatin1(std::string_view bytes) {
    std::string text;
    for (const char c : bytes)
        text += utf8Character(static_cast<unsigned char>(c));
    return text;
}

std::string textFromLatin1(const std::string& bytes) {
    return utf8FromLatin1(upToZeroByte(bytes));
}

} // namespace ZULMetaData
