#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/Redaction/TextSearch.h"

#include <algorithm>
#include <cstring>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_shortestRun = 4;
constexpr std::uint64_t s_blankPiece = 1 << 18;

bool isPrintable(char byte) {
    const auto value = static_cast<unsigned char>(byte);
    return value >= 0x20 && value != 0x7f && (value < 0x80 || value >= 0xa0);
}

/// A byte that can be part of a text: anything but a control character.
bool isTextByte(char byte) {
    const auto value = static_cast<unsigned char>(byte);
    return value >= 0x20 && value != 0x7f;
}

/// `typeOffset` is where the four characters of the type stand in the header.
MediaPlace blanked(MediaPlace::Use use, const std::string& path, const ContainerItem& item, std::uint64_t typeOffset,
                   FourCC type) {
    const std::string characters = type.text();
    MediaPlace place{use, path, item.offset, item.size, {}};
    place.blanks.push_back({item.offset + typeOffset, characters.size(), characters});
    if (item.payloadSize() > 0)
        place.blanks.push_back({item.payloadOffset(), item.payloadSize(), {}});
    return place;
}

} // namespace

bool isZero(std::string_view bytes) {
    return bytes.front() == 0 && std::memcmp(bytes.data(), bytes.data() + 1, bytes.size() - 1) == 0;
}

std::string readAll(const ByteSource& source) {
    std::string bytes(static_cast<std::size_t>(source.size()), '\0');
    bytes.resize(source.read(0, bytes));
    return bytes;
}

std::string readBytes(const ByteSource& file, std::uint64_t offset, std::uint64_t size, std::uint64_t limit) {
    return readAll(file.part(offset, std::min(size, limit)));
}

std::uint64_t bigEndianAt(std::string_view bytes, std::size_t offset, std::size_t size) {
    std::uint64_t number = 0;
    if (offset > bytes.size() || size > bytes.size() - offset)
        return number;
    for (const char byte : bytes.substr(offset, size))
        number = number << 8 | static_cast<unsigned char>(byte);
    return number;
}

std::uint32_t littleEndianAt(std::string_view bytes, std::size_t offset) {
    return swapInt(static_cast<std::uint32_t>(bigEndianAt(bytes, offset, sizeof(std::uint32_t))));
}

std::string_view part(std::string_view bytes, std::size_t offset, std::size_t size) {
    return offset < bytes.size() ? bytes.substr(offset, size) : std::string_view();
}

std::string decodedText(std::string_view bytes) {
    if (bytes.starts_with("\xfe\xff") || bytes.starts_with("\xff\xfe"))
        return textFromUTF16(bytes);
    const std::string text(bytes.substr(0, bytes.find('\0')));
    return isUTF8(text) ? text : textFromLatin1(text);
}

std::vector<std::string> textRuns(std::string_view bytes) {
    std::vector<std::string> runs;
    for (auto begin = bytes.begin(); begin != bytes.end();) {
        begin = std::find_if(begin, bytes.end(), isTextByte);
        const auto end = std::find_if_not(begin, bytes.end(), isTextByte);
        if (static_cast<std::size_t>(end - begin) >= s_shortestRun)
            runs.push_back(decodedText(
                bytes.substr(static_cast<std::size_t>(begin - bytes.begin()), static_cast<std::size_t>(end - begin))));
        begin = end;
    }
    return runs;
}

std::string shownType(const ContainerItem& item) {
    const std::string type = item.type.text();
    return std::all_of(type.begin(), type.end(), isPrintable) ? textFromLatin1(type)
                                                              : '#' + std::to_string(item.type.value);
}

MediaPlace blankedAtom(MediaPlace::Use use, const std::string& path, const ContainerItem& atom) {
    return blanked(use, path, atom, sizeof(std::uint32_t), s_freeAtom);
}

MediaPlace blankedChunk(MediaPlace::Use use, const std::string& path, const ContainerItem& chunk) {
    return blanked(use, path, chunk, 0, s_junkChunk);
}

bool isBlank(const ByteSource& file, const ContainerItem& item) {
    for (std::uint64_t done = 0; done < item.payloadSize(); done += s_blankPiece) {
        const std::string bytes = readBytes(file, item.payloadOffset() + done, item.payloadSize() - done, s_blankPiece);
        if (bytes.empty())
            break;
        if (!isZero(bytes))
            return false;
    }
    return true;
}

} // namespace ZULMetaData::detail
