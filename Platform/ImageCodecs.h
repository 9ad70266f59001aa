#pragma once

// PNG and TIFF files to pixels and back, and what every codec asks before it allocates pixels. All functions throw
// `std::bad_alloc` if there is no memory, except that libtiff does not say whether a file that it cannot read is
// damaged or needs more memory.

#include "Platform/Image.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

/// In pixels. Keeps the largest picture at 1 GiB.
inline constexpr std::uint32_t s_maximumImageSide = 16384;

/// The best ratio that a deflate stream can reach (258 bytes from two bits), with a little room.
inline constexpr std::uint64_t s_maximumDeflateRatio = 1040;

/// Bytes of pixels that a check unpacks at most, and of memory that it takes at most. A cursor of 512 x 512 pixels has
/// a megabyte of them; so many take a tenth of a second.
inline constexpr std::uint64_t s_mostUnpackedToCheck = std::uint64_t{32} << 20;

/// Returns whether the bytes begin like a PNG file. All others are taken for a TIFF file.
inline bool isPNG(std::span<const std::uint8_t> encoded) {
    constexpr std::array<std::uint8_t, 8> signature{0x89, 'P', 'N', 'G', '\r', '\n', 0x1a, '\n'};
    return encoded.size() >= signature.size() && std::equal(signature.begin(), signature.end(), encoded.begin());
}

constexpr bool isImageSizeAllowed(std::uint32_t width, std::uint32_t height) noexcept {
    return width > 0 && height > 0 && width <= s_maximumImageSide && height <= s_maximumImageSide;
}

constexpr std::size_t rgbaSize(std::uint32_t width, std::uint32_t height) noexcept {
    return std::size_t{4} * width * height;
}

inline bool isEncodable(const Image& image) noexcept {
    return isImageSizeAllowed(image.width(), image.height()) &&
           image.rgba().size() == rgbaSize(image.width(), image.height());
}

// ---- PNG ----

/// Every colour type, bit depth and interlacing. 16-bit samples are scaled to 8 bits; gamma and colour profiles are
/// not applied. A wrong check sum anywhere, also in a chunk that is otherwise skipped, means no image; bytes after
/// the end chunk do not matter.
std::optional<Image> decodePNG(std::span<const std::uint8_t> encoded);

/// Reads the header alone. Empty if `decodePNG` would refuse the file for it.
std::optional<EncodedImageInfo> readPNGInfo(std::span<const std::uint8_t> encoded);

/// Reads the file from end to end and keeps nothing, in less than 1 MiB of memory.
EncodedImageCheck checkPNG(std::span<const std::uint8_t> encoded);

/// RGBA of 8 bits a channel. Empty if the image cannot be encoded.
std::vector<std::uint8_t> encodePNG(const Image& image);

// ---- TIFF ----

/// The first picture of a TIFF or BigTIFF file, turned upright: grey (1 to 16 bits), palette, RGB (8 or 16 bits) and
/// JPEG's own colours, in strips or tiles, stored plain or with PackBits, LZW, deflate or JPEG. The first extra sample
/// is alpha, straight unless it is marked as premultiplied. 16-bit samples are rounded to 8 bits; only 16-bit grey and
/// the colours of a palette are rounded down. Anything else is no image, and neither is grey of other than 8 bits with
/// alpha, which could only be read without it.
std::optional<Image> decodeTIFF(std::span<const std::uint8_t> encoded);

/// Reads the directory alone. Empty if `decodeTIFF` would refuse the file for it.
std::optional<EncodedImageInfo> readTIFFInfo(std::span<const std::uint8_t> encoded);

/// Decodes the picture and drops it, if decoding takes at most `memory` bytes.
EncodedImageCheck checkTIFF(std::span<const std::uint8_t> encoded, std::uint64_t memory);

/// Little-endian, one uncompressed strip of RGBA with straight alpha. Empty if the image cannot be encoded.
std::vector<std::uint8_t> encodeTIFF(const Image& image);

} // namespace ZULMetaData
