#pragma once

// The chunks of a PNG file, walked without unpacking what is in them.

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

namespace ZULMetaData {

/// What the chunks of a sound file tell. Offsets count from the first byte of the file.
struct PNGChunks {
    std::uint32_t width = 0;         ///< in pixels, at most `s_maximumImageSide`
    std::uint32_t height = 0;        ///< likewise
    std::uint64_t unpackedBytes = 0; ///< of all pixels before compression, without the filter byte of each row
    std::size_t pixelsEnd = 0;       ///< after the last chunk of pixels
    std::size_t end = 0;             ///< after the end chunk
};

bool hasPNGSignature(std::span<const std::uint8_t> encoded) noexcept;

/// Walks from the signature to the end chunk. Empty if the order of the chunks, a check sum or the header is wrong, if
/// a chunk is cut short, or if the header claims more pixels than the file can hold.
std::optional<PNGChunks> walkPNGChunks(std::span<const std::uint8_t> encoded);

/// The same as far as the first chunk of pixels, whose content may be damaged. `pixelsEnd` and `end` stay 0.
std::optional<PNGChunks> walkPNGHeader(std::span<const std::uint8_t> encoded);

} // namespace ZULMetaData
