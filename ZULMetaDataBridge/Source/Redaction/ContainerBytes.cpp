#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "ZULMetaDataBridge/Source/Redaction/TextSearch.h"

#include <cstring>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_shortestRun = 4;
constexpr std::uint64_t s_blankPiece = 1 << 18;

/// A byte that can be part of a text: anything but a control character.
bool isTextByte(char byte) {
    const auto value = static_cast<unsigned char>(byte);
    return value >= 0x20 && value != 0x7f;
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
    const bool isPrintable = std::all_of(type.begin(), type.end(), [](char byte) {
        const auto value = static_cast<unsigned char>(byte);
        return isTextByte(byte) && (value < 0x80 || value >= 0xa0);
    });
    return isPrintable ? textFromLatin1(type) : '#' + std::to_string(item.type.value);
}

std::string PlaceWalk::payloadOf(const ContainerItem& item) const {
    return readBytes(file_, item.payloadOffset(), item.payloadSize());
}

MediaPlace PlaceWalk::blanked(MediaPlace::Use use, const ContainerItem& item, const std::string& path) const {
    const std::string type = (items_.isMovie() ? s_freeAtom : s_junkChunk).text();
    MediaPlace place{use, path, item.offset, item.size, {}};
    place.blanks.push_back({item.offset + (items_.isMovie() ? sizeof item.sizeField : 0), type.size(), type});
    if (item.payloadSize() > 0)
        place.blanks.push_back({item.payloadOffset(), item.payloadSize(), {}});
    return place;
}

void PlaceWalk::addPlace(MediaPlace::Use use, const ContainerItem& item, const std::string& path) {
    places_.places.push_back(blanked(use, item, path));
}

void PlaceWalk::addUnused(const ContainerItem& item, const std::string& path) {
    for (std::uint64_t done = 0; done < item.payloadSize(); done += s_blankPiece) {
        const auto bytes = readBytes(file_, item.payloadOffset() + done, item.payloadSize() - done, s_blankPiece);
        if (bytes.empty())
            return;
        if (!isZero(bytes))
            return addPlace(MediaPlace::Use::Unused, item, path);
    }
}

void PlaceWalk::addTexts(MediaText::Role role, const ContainerItem& item, const std::string& path,
                         std::vector<std::string> texts) {
    std::erase(texts, "");
    if (!texts.empty())
        places_.texts.push_back({role, path, item.offset, std::move(texts)});
}

} // namespace ZULMetaData::detail
