#include "Platform/Image.h"

#include "Platform/PNGCodec.h"
#include "Platform/TIFFCodec.h"

#include <cerrno>
#include <new>
#include <utility>

namespace ZULMetaData {

namespace {

/// The libraries of the codecs get memory from the C library. One that has none is told like a damaged picture, or
/// leaves something out of what it writes. The C library may set the number of that error where it found memory
/// elsewhere, but not twice for the same work.
template <class Work>
auto orOutOfMemory(Work work) {
    errno = 0;
    auto result = work();
    if (errno == ENOMEM) {
        errno = 0;
        result = work();
    }
    if (errno == ENOMEM) {
        throw std::bad_alloc();
    }
    return result;
}

} // namespace

Image::Image(std::uint32_t width, std::uint32_t height, std::vector<std::uint8_t> rgba)
    : width_(width), height_(height), rgba_(std::move(rgba)) {}

std::optional<Image> Image::fromEncodedBytes(std::span<const std::uint8_t> encoded) {
    return orOutOfMemory([&] { return hasPNGSignature(encoded) ? decodePNG(encoded) : decodeTIFF(encoded); });
}

std::optional<EncodedImageInfo> Image::infoOfEncodedBytes(std::span<const std::uint8_t> encoded) {
    return orOutOfMemory([&] { return hasPNGSignature(encoded) ? readPNGInfo(encoded) : readTIFFInfo(encoded); });
}

std::vector<std::uint8_t> Image::tiffRepresentation() const {
    return orOutOfMemory([&] { return encodeTIFF(*this); });
}

BitmapImageRep::BitmapImageRep(Image image) : image_(std::move(image)) {}

std::optional<BitmapImageRep> BitmapImageRep::fromTIFF(std::span<const std::uint8_t> tiff) {
    auto image = orOutOfMemory([&] { return decodeTIFF(tiff); });
    if (!image) {
        return std::nullopt;
    }
    return BitmapImageRep(*std::move(image));
}

std::vector<std::uint8_t> BitmapImageRep::pngRepresentation() const {
    return orOutOfMemory([&] { return encodePNG(image_); });
}

} // namespace ZULMetaData
