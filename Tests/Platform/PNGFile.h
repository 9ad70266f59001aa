#pragma once

// PNG files, made byte by byte.

#include "Tests/Platform/ImageTestSupport.h"

#include <cstdint>
#include <string_view>

namespace ZULMetaData::Test {

inline const Bytes s_signature{0x89, 'P', 'N', 'G', '\r', '\n', 0x1A, '\n'};

enum ColourType : std::uint8_t { Grey = 0, RGB = 2, Palette = 3, GreyAlpha = 4, RGBA = 6 };

inline std::uint32_t crc32(const Bytes& bytes) {
    std::uint32_t crc = 0xFFFFFFFFU;
    for (const auto byte : bytes) {
        crc ^= byte;
        for (int bit = 0; bit < 8; ++bit) {
            crc = (crc >> 1) ^ ((crc & 1U) != 0 ? 0xEDB88320U : 0U);
        }
    }
    return ~crc;
}

inline std::uint32_t adler32(const Bytes& bytes) {
    std::uint32_t a = 1;
    std::uint32_t b = 0;
    for (const auto byte : bytes) {
        a = (a + byte) % 65521;
        b = (b + a) % 65521;
    }
    return (b << 16) | a;
}

inline Bytes chunk(std::string_view type, const Bytes& data) {
    const auto body = Bytes(type.begin(), type.end()) + data;
    return bigEndian(data.size(), 4) + body + bigEndian(crc32(body), 4);
}

/// A zlib stream of one stored block.
inline Bytes stored(const Bytes& raw) {
    const auto size = static_cast<std::uint16_t>(raw.size());
    const auto low = static_cast<std::uint8_t>(size);
    const auto high = static_cast<std::uint8_t>(size >> 8);
    const Bytes head{0x78, 0x01, 0x01, low, high, static_cast<std::uint8_t>(~low), static_cast<std::uint8_t>(~high)};
    return head + raw + bigEndian(adler32(raw), 4);
}

inline Bytes header(std::uint32_t width, std::uint32_t height, int depth, ColourType type) {
    return chunk("IHDR",
                 bigEndian(width, 4) + bigEndian(height, 4) + Bytes{static_cast<std::uint8_t>(depth), type, 0, 0, 0});
}

inline const Bytes& end() {
    static const Bytes bytes = chunk("IEND", {});
    return bytes;
}

/// A zlib stream of `count` zero bytes or a few more. It copies 258 of them with every 13 bits, so that 13 bytes make
/// 2064.
inline Bytes zlibOfZeros(std::uint64_t count) {
    constexpr std::uint64_t atFirst = 259;
    constexpr std::uint64_t inEachGroup = 2064;
    const Bytes group{0xa3, 0x60, 0x14, 0x8c, 0x82, 0x51, 0x30, 0x0a, 0x46, 0xc1, 0x28, 0x18, 0x05};
    const std::uint64_t groups = (count - atFirst + inEachGroup - 1) / inEachGroup;
    Bytes stream{0x78, 0x01, 0x63, 0x18, 0x05};
    for (std::uint64_t i = 0; i < groups; ++i)
        stream.insert(stream.end(), group.begin(), group.end());
    const std::uint64_t total = atFirst + groups * inEachGroup;
    return stream + Bytes{0} + bigEndian(total % 65521 << 16 | 1, 4);
}

} // namespace ZULMetaData::Test
