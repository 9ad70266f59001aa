#include "ZULMetaData/ContainerRecognition.h"

#include "ZULMetaData/AtomFormat.h"

#include <algorithm>
#include <cstring>

namespace ZULMetaData {

namespace {

constexpr std::string_view s_riffSignature = "RIFF";

/// All identifiers share everything but their first group.
bool beginsLikeStream(std::string_view bytes) {
    constexpr std::size_t firstGroup = 4;
    if (bytes.size() < sizeof(uuid))
        return false;
    return std::memcmp(bytes.data() + firstGroup, s_cursorImageUUID.data + firstGroup, sizeof(uuid) - firstGroup) == 0;
}

bool beginsLikeAtom(std::string_view bytes) {
    if (bytes.size() < detail::s_atomHeaderSize)
        return false;
    std::uint32_t size = 0;
    std::memcpy(&size, bytes.data(), sizeof size);
    size = swapInt(size);
    const std::string_view type = bytes.substr(sizeof size, sizeof size);
    const auto isPrintable = [](char c) { return c >= ' ' && c <= '~'; };
    const bool isOpenOrExtended = size == 0 || size == detail::s_extendedSizeMarker;
    return (size >= detail::s_atomHeaderSize || isOpenOrExtended) && std::all_of(type.begin(), type.end(), isPrintable);
}

} // namespace

MetaDataParser::StreamType streamTypeOfContents(std::string_view firstBytes) {
    if (beginsLikeStream(firstBytes))
        return MetaDataParser::RawStream;
    if (firstBytes.starts_with(s_riffSignature) && firstBytes.size() >= detail::s_chunkHeaderSize)
        return MetaDataParser::Riff;
    return beginsLikeAtom(firstBytes) ? MetaDataParser::QuickTime : MetaDataParser::Unknown;
}

std::string_view extensionFor(MetaDataParser::StreamType type) {
    switch (type) {
    case MetaDataParser::Riff: return ".avi";
    case MetaDataParser::QuickTime: return ".mp4";
    case MetaDataParser::RawStream: return ".dat";
    default: return "";
    }
}

} // namespace ZULMetaData
