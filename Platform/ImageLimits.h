#pragma once

// What every codec asks before it allocates pixels.

#include "Platform/Image.h"

#include <cstddef>
#include <cstdint>

namespace ZULMetaData {

/// In pixels. Keeps the largest picture at 1 GiB.
inline constexpr std::uint32_t s_maximumImageSide = 16384;

/// The best ratio that a deflate stream can reach (258 bytes from two bits), with a little room.
inline constexpr std::uint64_t s_maximumDeflateRatio = 1040;

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
