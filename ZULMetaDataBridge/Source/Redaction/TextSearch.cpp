#include "ZULMetaDataBridge/Source/Redaction/TextSearch.h"

#include "SharedDependencies/UTF8.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <cstring>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_longText = 8;            // characters
constexpr std::size_t s_leastDifferent = 4;      // characters of a long text
constexpr std::size_t s_wordSize = 8;            // bytes
constexpr std::size_t s_longestNeedle = 512;     // bytes: more do not tell a text any better
constexpr std::size_t s_filterSize = 1 << 20;    // bits
constexpr std::size_t s_shortestWordBounded = 4; // characters
constexpr std::size_t s_searchPiece = 1 << 20;   // bytes

/// The characters of a text in UTF-8; the bytes of any other.
std::u32string charactersOf(const std::string& text) {
    std::u32string characters;
    const bool isText = isUTF8(text);
    for (const char byte : text) {
        const auto value = static_cast<unsigned char>(byte);
        if (!isText || value < 0x80)
            characters.push_back(value);
        else if (continuesCharacter(byte))
            characters.back() = characters.back() << 6 | (value & 0x3fU);
        else
            characters.push_back(value & (value < 0xe0 ? 0x1fU : value < 0xf0 ? 0x0fU : 0x07U));
    }
    return characters;
}

bool isLong(const std::u32string& characters) {
    return characters.size() >= s_longText &&
           std::set<char32_t>(characters.begin(), characters.end()).size() >= s_leastDifferent;
}

std::string utf16(const std::u32string& characters, bool isBigEndian) {
    std::string bytes;
    const auto append = [&](char32_t unit) {
        const auto high = static_cast<char>(unit >> 8);
        const auto low = static_cast<char>(unit & 0xff);
        bytes.append({isBigEndian ? high : low, isBigEndian ? low : high});
    };
    for (const char32_t character : characters) {
        if (character >= 0x10000)
            append(0xd7c0 + (character >> 10));
        append(character < 0x10000 ? character : 0xdc00 + (character & 0x3ff));
    }
    return bytes;
}

/// Empty if it has characters Latin-1 lacks.
std::optional<std::string> latin1(const std::u32string& characters) {
    std::string bytes;
    for (const char32_t character : characters) {
        if (character > 0xff)
            return std::nullopt;
        bytes.push_back(static_cast<char>(character));
    }
    return bytes;
}

std::uint64_t wordAt(const char* bytes) {
    std::uint64_t word = 0;
    std::memcpy(&word, bytes, sizeof word);
    return word;
}

std::size_t filterPlaceOf(std::uint64_t word) {
    return static_cast<std::size_t>(word * 0x9e3779b97f4a7c15 >> 44);
}

bool isWordByte(char byte) {
    const auto value = static_cast<unsigned char>(byte);
    return value >= 0x80 || (value >= '0' && value <= '9') || ((value | 0x20) >= 'a' && (value | 0x20) <= 'z');
}

/// Whether `text` is in `within` and no word continues beyond its ends.
bool isWordIn(const std::string& text, const std::string& within) {
    for (std::size_t at = within.find(text); at != std::string::npos; at = within.find(text, at + 1)) {
        const std::size_t end = at + text.size();
        const bool continuesBefore = at > 0 && isWordByte(within[at - 1]) && isWordByte(text.front());
        const bool continuesAfter = end < within.size() && isWordByte(within[end]) && isWordByte(text.back());
        if (!continuesBefore && !continuesAfter)
            return true;
    }
    return false;
}

} // namespace

TextSearch::TextSearch(const std::set<std::string>& texts, const Spellings& spellings) : texts_(texts) {
    if (spellings)
        for (const std::string& text : texts)
            for (const std::string& spelled : spellings(text))
                texts_.insert(spelled);
    texts_.erase("");
    words_.resize(s_filterSize);
    for (const std::string& text : texts_) {
        const std::u32string characters = charactersOf(text);
        if (!isLong(characters))
            continue;
        addNeedle(text);
        addNeedle(utf16(characters, true));
        addNeedle(utf16(characters, false));
        if (const auto bytes = latin1(characters); bytes && *bytes != text)
            addNeedle(*bytes);
    }
}

void TextSearch::addNeedle(const std::string& bytes) {
    const std::uint64_t word = wordAt(bytes.data());
    needlesByWord_[word].push_back(needles_.size());
    words_[filterPlaceOf(word)] = true;
    needles_.push_back(bytes.substr(0, s_longestNeedle));
}

bool TextSearch::isIn(const std::string& text) const {
    return texts_.contains(text) || findIn(std::string_view(text));
}

bool TextSearch::isToldBy(const std::string& shown) const {
    if (isIn(shown))
        return true;
    const bool isLongShown = isLong(charactersOf(shown));
    return std::any_of(texts_.begin(), texts_.end(), [&](const std::string& text) {
        return (isLongShown && text.find(shown) != std::string::npos) ||
               (text.size() >= s_shortestWordBounded && isWordIn(text, shown));
    });
}

std::optional<std::size_t> TextSearch::findIn(std::string_view bytes) const {
    if (needles_.empty())
        return std::nullopt;
    for (std::size_t at = 0; at + s_wordSize <= bytes.size(); ++at) {
        const std::uint64_t word = wordAt(bytes.data() + at);
        if (!words_[filterPlaceOf(word)])
            continue;
        const auto found = needlesByWord_.find(word);
        if (found == needlesByWord_.end())
            continue;
        for (const std::size_t needle : found->second)
            if (bytes.substr(at).starts_with(needles_[needle]))
                return at;
    }
    return std::nullopt;
}

std::optional<std::uint64_t> TextSearch::findIn(const ByteSource& file, std::uint64_t begin, std::uint64_t end,
                                                const std::function<void(std::uint64_t)>& advance) const {
    if (needles_.empty())
        return std::nullopt;
    std::vector<char> piece(s_searchPiece + s_longestNeedle);
    for (std::uint64_t position = begin; position < end; position += s_searchPiece) {
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(piece.size(), end - position));
        const std::string_view bytes(piece.data(), file.read(position, {piece.data(), wanted}));
        if (bytes.empty())
            break;
        if (!isZero(bytes))
            if (const auto found = findIn(bytes))
                return position + *found;
        advance(std::min(bytes.size(), s_searchPiece));
    }
    return std::nullopt;
}

std::string textFromUTF16(std::string_view bytes) {
    const bool isMarked = bytes.starts_with("\xfe\xff") || bytes.starts_with("\xff\xfe");
    const bool isBigEndian = !bytes.starts_with("\xff\xfe");
    const auto unitAt = [&](std::size_t at) {
        const auto first = static_cast<unsigned char>(bytes[at]);
        const auto second = static_cast<unsigned char>(bytes[at + 1]);
        return static_cast<char32_t>(isBigEndian ? first << 8 | second : second << 8 | first);
    };
    std::string text;
    for (std::size_t at = isMarked ? 2 : 0; at + 1 < bytes.size(); at += 2) {
        const char32_t unit = unitAt(at);
        const bool isPair = unit >= 0xd800 && unit < 0xdc00 && at + 3 < bytes.size();
        text += encodedUTF8(isPair ? 0x10000 + ((unit & 0x3ff) << 10) + (unitAt(at + 2) & 0x3ff) : unit);
        at += isPair ? 2 : 0;
    }
    return text;
}

} // namespace ZULMetaData::detail
