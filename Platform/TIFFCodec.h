#pragma once

// TIFF files to pixels and back. All functions throw `std::bad_alloc` if there is no memory, except that libtiff does
// not say whether a file that it cannot read is damaged or needs more memory.

#include "Platform/Image.h"

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

/// The first picture of a TIFF or BigTIFF file, turned upright: grey (1 to 16 bits), palette, RGB (8 or 16 bits) and
/// JPEG's own colours, in strips or tiles, stored plain or with PackBits, LZW, deflate or JPEG. The first extra sample
/// is alpha, straight unless it is marked as premultiplied. 16-bit samples are rounded to 8 bits; only 16-bit grey and
/// the colours of a palette are rounded down. Anything else is no image, and neither is grey of other than 8 bits with
/// alpha, which could only be read without it.
std::optional<Image> decodeTIFF(std::span<const std::uint8_t> encoded);

/// Reads the directory alone. Empty if `decodeTIFF` would refuse the file for it.
std::optional<EncodedImageInfo> readTIFFInfo(std::span<const std::uint8_t> encoded);

/// Decodes the picture and drops it, if that takes no more than `memory` bytes.
EncodedImageCheck checkTIFF(std::span<const std::uint8_t> encoded, std::uint64_t memory);

/// Little-endian, one uncompressed strip of RGBA with straight alpha. Empty if the image cannot be encoded.
std::vector<std::uint8_t> encodeTIFF(const Image& image);

} // namespace ZULMetaData
