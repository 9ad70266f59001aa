#include "Platform/Image.h"

#include "Platform/ImageCodecs.h"

#include <algorithm>

namespace ZULMetaData {

std::optional<Image> Image::fromEncodedBytes(std::span<const std::uint8_t> encoded) {
    return isPNG(encoded) ? decodePNG(encoded) : decodeTIFF(encoded);
}

std::optional<EncodedImageInfo> Image::infoOfEncodedBytes(std::span<const std::uint8_t> encoded) {
    return isPNG(encoded) ? readPNGInfo(encoded) : readTIFFInfo(encoded);
}

EncodedImageCheck Image::checkEncodedBytes(std::span<const std::uint8_t> encoded, std::uint64_t memory) {
    return isPNG(encoded) ? checkPNG(encoded) : checkTIFF(encoded, std::min(memory, s_mostUnpackedToCheck));
}

std::vector<std::uint8_t> Image::tiffRepresentation() const {
    return encodeTIFF(*this);
}

std::optional<BitmapImageRep> BitmapImageRep::fromTIFF(std::span<const std::uint8_t> tiff) {
    auto image = decodeTIFF(tiff);
    return image ? std::optional(BitmapImageRep(*std::move(image))) : std::nullopt;
}

std::vector<std::uint8_t> BitmapImageRep::pngRepresentation() const {
    return encodePNG(image_);
}

} // namespace ZULMetaData
