#pragma once

// What every codec asks before it allocates pixels.

#include "Platform/Image.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

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

} // namespace ZULMetaData
