#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <cstdlib>
#include <cstring>
#include <iomanip>
#include <istream>
#include <ostream>
#include <utility>

namespace ZULMetaData {

CursorImage::CursorImage(std::uint64_t id, std::int32_t hotspotX, std::int32_t hotspotY, unsigned char* data,
                         std::uint32_t dataSize, CursorTypeID typeId, CursorImageFlags imageFlags)
    : uniqueId(id), hotspotOffsetX(hotspotX), hotspotOffsetY(hotspotY), imageDataSize(dataSize), imageData(data),
      cursorTypeId(typeId), flags(imageFlags) {}

CursorImage::CursorImage(const CursorImage& other) {
    *this = other;
}

CursorImage& CursorImage::operator=(const CursorImage& other) {
    if (this == &other)
        return *this;
    freeImageData(true);
    copyAllButImage(other);
    if (other.imageDataSize != 0 && other.imageData) {
        imageDataSize = other.imageDataSize;
        imageData = static_cast<unsigned char*>(std::malloc(imageDataSize));
        if (imageData)
            std::memcpy(imageData, other.imageData, imageDataSize);
    }
    return *this;
}

CursorImage::CursorImage(CursorImage&& other) noexcept {
    *this = std::move(other);
}

CursorImage& CursorImage::operator=(CursorImage&& other) noexcept {
    if (this == &other)
        return *this;
    freeImageData(true);
    copyAllButImage(other);
    imageDataSize = std::exchange(other.imageDataSize, 0);
    imageData = std::exchange(other.imageData, nullptr);
    return *this;
}

CursorImage::~CursorImage() {
    freeImageData(true);
}

void CursorImage::freeImageData(bool freeBytes) {
    if (freeBytes)
        std::free(imageData);
    imageData = nullptr;
    imageDataSize = 0;
}

void CursorImage::copyAllButImage(const CursorImage& other) {
    uniqueId = other.uniqueId;
    hotspotOffsetX = other.hotspotOffsetX;
    hotspotOffsetY = other.hotspotOffsetY;
    cursorTypeId = other.cursorTypeId;
    flags = other.flags;
}

bool operator==(const CursorImage& left, const CursorImage& right) {
    if (&left == &right)
        return true;
    if (left.uniqueId != right.uniqueId || left.hotspotOffsetX != right.hotspotOffsetX ||
        left.hotspotOffsetY != right.hotspotOffsetY || left.imageDataSize != right.imageDataSize)
        return false;
    if (left.imageData && right.imageData && std::memcmp(left.imageData, right.imageData, left.imageDataSize) != 0)
        return false;
    return left.cursorTypeId == right.cursorTypeId && left.flags == right.flags;
}

std::uint8_t uuid::readUint8FromHexChars(std::istream& stream) {
    char chars[3] = {};
    stream.read(chars, 2);
    return hexCharsToUint8(chars);
}

std::uint8_t uuid::hexCharsToUint8(const char* chars) {
    const char pair[3] = {chars[0], chars[0] == '\0' ? '\0' : chars[1], '\0'};
    return static_cast<std::uint8_t>(std::strtol(pair, nullptr, 16) & 0xff);
}

namespace {

/// A separator stands before bytes 4, 6, 8 and 10.
constexpr bool isGroupStart(int byte) {
    return byte >= 4 && byte <= 10 && byte % 2 == 0;
}

} // namespace

std::ostream& operator<<(std::ostream& stream, const uuid& id) {
    constexpr char digits[] = "0123456789abcdef";
    std::string text;
    for (int byte = 0; byte < 16; ++byte) {
        if (isGroupStart(byte))
            text += '-';
        text += digits[id.data[byte] >> 4];
        text += digits[id.data[byte] & 0xf];
    }
    stream.width(0);
    return stream << std::hex << std::setfill('0') << text;
}

std::istream& operator>>(std::istream& stream, uuid& id) {
    for (int byte = 0; byte < 16; ++byte) {
        if (isGroupStart(byte))
            stream.get();
        id.data[byte] = uuid::readUint8FromHexChars(stream);
    }
    return stream;
}

std::ostream& operator<<(std::ostream& stream, const Point& point) {
    return stream << '(' << point.x << ',' << point.y << ')';
}

std::ostream& operator<<(std::ostream& stream, const Rect& rect) {
    return stream << '(' << rect.x << ',' << rect.y << ',' << rect.width << ',' << rect.height << ')';
}

std::ostream& operator<<(std::ostream& stream, const KeyStroke& keyStroke) {
    return stream << '(' << keyStroke.characterCode << ',' << keyStroke.eventFlagsCode << ')';
}

std::ostream& operator<<(std::ostream& stream, const CursorImage& image) {
    return stream << '(' << image.uniqueId << ',' << image.hotspotOffsetX << ',' << image.hotspotOffsetY << ','
                  << image.imageDataSize << ',' << reinterpret_cast<std::intptr_t>(image.imageData) << ','
                  << static_cast<std::int32_t>(image.cursorTypeId) << ',' << static_cast<std::uint32_t>(image.flags)
                  << ')';
}

} // namespace ZULMetaData
