#include "Platform/Image.h"

#include "Platform/PNGCodec.h"
#include "Platform/TIFFCodec.h"

#include <utility>

namespace ZULMetaData {

Image::Image(std::uint32_t width, std::uint32_t height, std::vector<std::uint8_t> rgba)
    : width_(width), height_(height), rgba_(std::move(rgba)) {}

std::optional<Image> Image::fromEncodedBytes(std::span<const std::uint8_t> encoded) {
    return hasPNGSignature(encoded) ? decodePNG(encoded) : decodeTIFF(encoded);
}

std::optional<EncodedImageInfo> Image::infoOfEncodedBytes(std::span<const std::uint8_t> encoded) {
    return hasPNGSignature(encoded) ? readPNGInfo(encoded) : readTIFFInfo(encoded);
}

std::vector<std::uint8_t> Image::tiffRepresentation() const {
    return encodeTIFF(*this);
}

BitmapImageRep::BitmapImageRep(Image image) : image_(std::move(image)) {}

std::optional<BitmapImageRep> BitmapImageRep::fromTIFF(std::span<const std::uint8_t> tiff) {
    auto image = decodeTIFF(tiff);
    if (!image) {
        return std::nullopt;
    }
    return BitmapImageRep(*std::move(image));
}

std::vector<std::uint8_t> BitmapImageRep::pngRepresentation() const {
    return encodePNG(image_);
}

} // namespace ZULMetaData
