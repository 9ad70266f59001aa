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

/// Bytes of pixels that a check unpacks at most, and of memory that it takes at most. A cursor of 512 x 512 pixels has
/// a megabyte of them; so many take a tenth of a second.
inline constexpr std::uint64_t s_mostUnpackedToCheck = std::uint64_t{32} << 20;

constexpr bool isImageSizeAllowed(std::uint32_t width, std::uint32_t height) noexcept {
    return width > 0 && height > 0 && width <= s_maximumImageSide && height <= s_maximumImageSide;
}

constexpr std::size_t rgbaSize(std::uint32_t width, std::uint32_t height) noexcept {
    return std::size_t{4} * width * height;
}

/// What decoding a PNG file of this size may hold at a time.
constexpr std::uint64_t memoryToDecodePNG(std::uint32_t width, std::uint32_t height) noexcept {
    constexpr std::uint64_t rowBuffers = 8; // a few rows of up to 16 bits a channel
    constexpr std::uint64_t tables = std::uint64_t{128} << 10;
    return rgbaSize(width, height) + rowBuffers * rgbaSize(width, 1) + tables;
}

inline bool isEncodable(const Image& image) noexcept {
    return isImageSizeAllowed(image.width(), image.height()) &&
           image.rgba().size() == rgbaSize(image.width(), image.height());
}

} // namespace ZULMetaData
