#pragma once

// PNG files to pixels and back. All functions throw `std::bad_alloc` if there is no memory.

#include "Platform/Image.h"

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

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

} // namespace ZULMetaData
