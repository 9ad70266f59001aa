#pragma once

// PNG files to pixels and back.

#include "Platform/Image.h"

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

bool hasPNGSignature(std::span<const std::uint8_t> encoded) noexcept;

/// Every colour type, bit depth and interlacing. 16-bit samples are scaled to 8 bits; gamma and colour profiles are
/// not applied. A wrong check sum anywhere, also in a chunk that is otherwise skipped, gives no image; bytes behind
/// the end chunk do not matter.
std::optional<Image> decodePNG(std::span<const std::uint8_t> encoded);

/// By its header; nothing where `decodePNG` would refuse it.
std::optional<EncodedImageInfo> readPNGInfo(std::span<const std::uint8_t> encoded);

/// RGBA of 8 bits a channel. Empty where the image cannot be encoded.
std::vector<std::uint8_t> encodePNG(const Image& image);

} // namespace ZULMetaData
