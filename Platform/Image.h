#pragma once

// A picture in memory and the bitmap made from its TIFF data: with them a cursor image becomes PNG bytes and comes
// back. Everything happens in memory. What a codec cannot read or write is "no image", without a message.
//
// The only exception is `std::bad_alloc`, if memory ends. libtiff reports this like damage, so a TIFF file that is read
// while memory ends may also count as no image.
//
// A build without codecs (`ZULMETADATA_IMAGE_CODECS`) knows an image by its size. It encodes nothing and examines no
// more of a file than its headers: an image has no pixels, and every file that states a size passes for decodable, with
// four bytes for each pixel and without surplus.

#include "../SharedDependencies/Export.h"

#include <cstdint>
#include <optional>
#include <span>
#include <utility>
#include <vector>

namespace ZULMetaData {

/// What an encoded picture says of itself, for a caller who has to know before it is decoded.
struct EncodedImageInfo {
    std::uint32_t width;          ///< in pixels
    std::uint32_t height;         ///< in pixels
    std::uint64_t decodingMemory; ///< bytes that decoding asks for at most, beside the encoded ones
};

/// What reading an encoded picture from end to end tells, without its pixels being kept.
struct EncodedImageCheck {
    /// Whether `Image::fromEncodedBytes` returns an image.
    enum State : std::uint8_t {
        Undecodable, ///< it does not
        Decodable,   ///< it does
        NotUnpacked, ///< it may: its pixels were not unpacked, because they take too much time or memory
    };

    State state = Undecodable;       ///< the result of the check
    std::uint32_t width = 0;         ///< in pixels; 0 if the headers are damaged
    std::uint32_t height = 0;        ///< in pixels; 0 if the headers are damaged
    std::uint64_t unpackedBytes = 0; ///< of all pixels, before the file compressed them; 0 if the headers are damaged
    std::uint64_t surplusBytes = 0;  ///< of a PNG file: after the end chunk, or in bulk after the last pixel
};

/// Pixels of red, green, blue and straight alpha.
class ZULMETADATA_API Image {
public:
    /// `rgba` holds width * height pixels of four bytes (red, green, blue, straight alpha), rows from the top without
    /// padding. Any other amount is kept as it is; such an image cannot be encoded, and neither can one with a side
    /// of 0 or of more than 16384 pixels.
    Image(std::uint32_t width, std::uint32_t height, std::vector<std::uint8_t> rgba)
        : width_(width), height_(height), rgba_(std::move(rgba)) {}

    /// Decodes a whole PNG or TIFF file of at most 16384 pixels a side. A file that is damaged, cut short, or claims
    /// more pixels than its bytes can hold, is no image.
    static std::optional<Image> fromEncodedBytes(std::span<const std::uint8_t> encoded);

    /// Reads the headers alone. Returns nothing if they already rule out that the file can be decoded.
    static std::optional<EncodedImageInfo> infoOfEncodedBytes(std::span<const std::uint8_t> encoded);

    /// Reads the whole file and makes no image of it. Whatever the file claims, this takes less than 0.2 seconds, and
    /// beside the encoded bytes less than 32 MiB of memory or `memory` bytes, whichever is less. Much compressed data
    /// after the last pixel of a PNG file makes it undecodable, whatever that data unpacks to.
    static EncodedImageCheck checkEncodedBytes(std::span<const std::uint8_t> encoded,
                                               std::uint64_t memory = std::uint64_t{32} << 20);

    std::uint32_t width() const noexcept { return width_; }   ///< in pixels
    std::uint32_t height() const noexcept { return height_; } ///< in pixels

    /// Valid as long as the image.
    std::span<const std::uint8_t> rgba() const noexcept { return rgba_; }

    /// Uncompressed and lossless, also for the colours of pixels that are fully transparent. Empty if the image cannot
    /// be encoded.
    std::vector<std::uint8_t> tiffRepresentation() const;

private:
    std::uint32_t width_;
    std::uint32_t height_;
    std::vector<std::uint8_t> rgba_;
};

/// The pixels of a TIFF file, ready to be encoded again.
class ZULMETADATA_API BitmapImageRep {
public:
    /// Takes TIFF data only, under the conditions of Image::fromEncodedBytes.
    static std::optional<BitmapImageRep> fromTIFF(std::span<const std::uint8_t> tiff);

    /// RGBA of 8 bits a channel, lossless like the TIFF representation.
    std::vector<std::uint8_t> pngRepresentation() const;

private:
    explicit BitmapImageRep(Image image) : image_(std::move(image)) {}

    Image image_;
};

} // namespace ZULMetaData
