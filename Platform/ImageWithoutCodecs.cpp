// Images in a build without libpng and libtiff, for programs that hand the encoded bytes on, such as to a browser: an
// image is known by the size that its headers state. It has no pixels, and nothing else in its file is examined.

#include "Platform/Image.h"

#include "Platform/ImageCodecs.h"

namespace ZULMetaData {

namespace {

using Bytes = std::span<const std::uint8_t>;

struct Size {
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

/// Returns the number that takes `size` bytes at a position, or 0 if the file ends before it.
std::uint64_t numberAt(Bytes file, std::uint64_t position, std::uint64_t size, bool isBigEndian) {
    std::uint64_t number = 0;
    if (position <= file.size() && size <= file.size() - position)
        for (std::uint64_t i = 0; i < size; ++i)
            number = number << 8 | file[static_cast<std::size_t>(position + (isBigEndian ? i : size - 1 - i))];
    return number;
}

Size sizeOfPNG(Bytes file) {
    const auto number = [file](std::uint64_t position) {
        return static_cast<std::uint32_t>(numberAt(file, position, 4, true));
    };
    return {number(16), number(20)};
}

/// Returns the size of the picture as it is shown: four of the eight orientations store columns in place of rows.
Size sizeOfTIFF(Bytes file) {
    const std::uint64_t order = numberAt(file, 0, 2, false); // "II" or "MM"
    const bool isBigEndian = order == 0x4d4d;
    const auto number = [=](std::uint64_t position, std::uint64_t size) {
        return numberAt(file, position, size, isBigEndian);
    };
    const std::uint64_t version = number(2, 2);
    if ((order != 0x4949 && !isBigEndian) || (version != 42 && version != 43))
        return {};
    const std::uint64_t offsetSize = version == 43 ? 8 : 4; // BigTIFF has wider offsets and counts
    const std::uint64_t countSize = version == 43 ? 8 : 2;
    const std::uint64_t directory = number(offsetSize, offsetSize);
    Size size;
    std::uint32_t orientation = 1;
    std::uint64_t field = directory + countSize;
    for (std::uint64_t left = number(directory, countSize); left > 0 && field < file.size(); --left) {
        const bool isShort = number(field + 2, 2) == 3;
        const auto value = static_cast<std::uint32_t>(number(field + 4 + offsetSize, isShort ? 2 : 4));
        switch (number(field, 2)) {
        case 256: size.width = value; break;
        case 257: size.height = value; break;
        case 274: orientation = value; break;
        default: break;
        }
        field += 4 + 2 * offsetSize;
    }
    return orientation >= 5 && orientation <= 8 ? Size{size.height, size.width} : size;
}

} // namespace

std::optional<EncodedImageInfo> Image::infoOfEncodedBytes(Bytes encoded) {
    const auto [width, height] = isPNG(encoded) ? sizeOfPNG(encoded) : sizeOfTIFF(encoded);
    if (!isImageSizeAllowed(width, height))
        return std::nullopt;
    return EncodedImageInfo{width, height, rgbaSize(width, height)};
}

std::optional<Image> Image::fromEncodedBytes(Bytes encoded) {
    const auto info = infoOfEncodedBytes(encoded);
    return info ? std::optional(Image(info->width, info->height, {})) : std::nullopt;
}

EncodedImageCheck Image::checkEncodedBytes(Bytes encoded, std::uint64_t) {
    const auto info = infoOfEncodedBytes(encoded);
    if (!info)
        return {};
    return {EncodedImageCheck::Decodable, info->width, info->height, rgbaSize(info->width, info->height), 0};
}

std::vector<std::uint8_t> Image::tiffRepresentation() const {
    return {};
}

std::optional<BitmapImageRep> BitmapImageRep::fromTIFF(Bytes) {
    return std::nullopt;
}

std::vector<std::uint8_t> BitmapImageRep::pngRepresentation() const {
    return {};
}

} // namespace ZULMetaData
