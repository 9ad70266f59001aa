#include "Platform/Image.h"

#include "Platform/ImageLimits.h"
#include "Platform/PNGChunks.h"
#include "Platform/PNGCodec.h"
#include "Platform/TIFFCodec.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <new>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::uint64_t s_smallWork = std::uint64_t{64} << 10;

bool isThereMemory(std::uint64_t bytes) {
    void* volatile block = bytes <= PTRDIFF_MAX ? std::malloc(static_cast<std::size_t>(bytes)) : nullptr;
    std::free(block);
    return block != nullptr;
}

/// The libraries of the codecs get memory from the C library. One that has none is told like a damaged picture, or
/// leaves something out of what it writes. The C library may set the number of that error though it found memory
/// elsewhere: so the work is done again, and what it takes is asked for.
template <class Work, class Needed>
auto orOutOfMemory(Work work, Needed needed) {
    errno = 0;
    auto result = work();
    if (errno == ENOMEM) {
        errno = 0;
        result = work();
    }
    if (errno == ENOMEM && !isThereMemory(std::max<std::uint64_t>(needed(), s_smallWork))) {
        throw std::bad_alloc();
    }
    return result;
}

std::optional<EncodedImageInfo> readInfo(std::span<const std::uint8_t> encoded) {
    return hasPNGSignature(encoded) ? readPNGInfo(encoded) : readTIFFInfo(encoded);
}

std::uint64_t neededToDecode(std::span<const std::uint8_t> encoded) {
    const auto info = readInfo(encoded);
    return info ? info->decodingMemory : 0;
}

/// The pixels once more.
std::uint64_t neededToEncode(const Image& image) {
    return image.rgba().size();
}

} // namespace

Image::Image(std::uint32_t width, std::uint32_t height, std::vector<std::uint8_t> rgba)
    : width_(width), height_(height), rgba_(std::move(rgba)) {}

std::optional<Image> Image::fromEncodedBytes(std::span<const std::uint8_t> encoded) {
    return orOutOfMemory([&] { return hasPNGSignature(encoded) ? decodePNG(encoded) : decodeTIFF(encoded); },
                         [&] { return neededToDecode(encoded); });
}

std::optional<EncodedImageInfo> Image::infoOfEncodedBytes(std::span<const std::uint8_t> encoded) {
    return orOutOfMemory([&] { return readInfo(encoded); }, [] { return s_smallWork; });
}

EncodedImageCheck Image::checkEncodedBytes(std::span<const std::uint8_t> encoded, std::uint64_t memory) {
    const std::uint64_t most = std::min(memory, s_mostUnpackedToCheck);
    return orOutOfMemory([&] { return hasPNGSignature(encoded) ? checkPNG(encoded) : checkTIFF(encoded, most); },
                         [&] { return std::min(neededToDecode(encoded), most); });
}

std::vector<std::uint8_t> Image::tiffRepresentation() const {
    return orOutOfMemory([&] { return encodeTIFF(*this); }, [&] { return neededToEncode(*this); });
}

BitmapImageRep::BitmapImageRep(Image image) : image_(std::move(image)) {}

std::optional<BitmapImageRep> BitmapImageRep::fromTIFF(std::span<const std::uint8_t> tiff) {
    auto image = orOutOfMemory([&] { return decodeTIFF(tiff); }, [&] { return neededToDecode(tiff); });
    if (!image) {
        return std::nullopt;
    }
    return BitmapImageRep(*std::move(image));
}

std::vector<std::uint8_t> BitmapImageRep::pngRepresentation() const {
    return orOutOfMemory([&] { return encodePNG(image_); }, [&] { return neededToEncode(image_); });
}

} // namespace ZULMetaData
