// TIFF files without libtiff, for programs that hand the encoded bytes on: an image is known by its size and has no
// pixels. The directory is checked, and that the pixels' bytes are in the file, but not what they unpack to.

#include "Platform/ImageLimits.h"
#include "Platform/TIFFCodec.h"

#include <algorithm>
#include <array>
#include <utility>

namespace ZULMetaData {

namespace {

using Bytes = std::span<const std::uint8_t>;

enum Tag : std::uint16_t {
    Width = 256,
    Height = 257,
    BitsPerSample = 258,
    Compression = 259,
    StripOffsets = 273,
    Orientation = 274,
    SamplesPerPixel = 277,
    RowsPerStrip = 278,
    StripSizes = 279,
    PlanarConfiguration = 284,
    TileOffsets = 324,
    TileSizes = 325,
};

constexpr std::uint64_t s_uncompressed = 1;
constexpr std::uint64_t s_separatePlanes = 2;

/// Numbers of either byte order at positions that need not be in the file.
class Numbers {
public:
    Numbers(Bytes bytes, bool isBigEndian) : bytes_(bytes), isBigEndian_(isBigEndian) {}

    std::optional<std::uint64_t> at(std::uint64_t position, std::uint64_t size) const {
        if (position > bytes_.size() || size > bytes_.size() - position)
            return std::nullopt;
        std::uint64_t number = 0;
        for (std::uint64_t i = 0; i < size; ++i) {
            const std::uint64_t place = isBigEndian_ ? i : size - 1 - i;
            number = number << 8 | bytes_[static_cast<std::size_t>(position + place)];
        }
        return number;
    }

private:
    Bytes bytes_;
    bool isBigEndian_;
};

struct Field {
    std::uint64_t type;
    std::uint64_t count;
    std::uint64_t values; ///< where they are
};

/// The first directory of a file, in either of its two widths.
class Directory {
public:
    Directory(const Numbers& numbers, bool isBig) : numbers_(numbers), isBig_(isBig) {}

    std::optional<Field> find(Tag tag) const {
        const auto start = numbers_.at(isBig_ ? 8 : 4, width());
        const auto count = start ? numbers_.at(*start, isBig_ ? 8 : 2) : std::nullopt;
        if (!count)
            return std::nullopt;
        std::uint64_t position = *start + (isBig_ ? 8 : 2);
        for (std::uint64_t i = 0; i < *count; ++i, position += entrySize()) {
            const auto found = numbers_.at(position, 2);
            if (!found)
                return std::nullopt;
            if (*found == tag)
                return fieldAt(position);
        }
        return std::nullopt;
    }

    /// One number of a field; `otherwise` where there is no such field.
    std::optional<std::uint64_t> number(Tag tag, std::uint64_t index, std::optional<std::uint64_t> otherwise) const {
        const auto field = find(tag);
        return field ? numberOf(*field, index) : otherwise;
    }

    std::optional<std::uint64_t> numberOf(const Field& field, std::uint64_t index) const {
        const std::uint64_t size = sizeOf(field.type);
        return size > 0 && index < field.count ? numbers_.at(field.values + index * size, size) : std::nullopt;
    }

private:
    static std::uint64_t sizeOf(std::uint64_t type) {
        constexpr std::array<std::uint8_t, 17> sizes{0, 1, 0, 2, 4, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 8};
        return type < sizes.size() ? sizes[static_cast<std::size_t>(type)] : 0;
    }

    std::uint64_t width() const { return isBig_ ? 8 : 4; }
    std::uint64_t entrySize() const { return 4 + 2 * width(); }

    std::optional<Field> fieldAt(std::uint64_t position) const {
        const auto type = numbers_.at(position + 2, 2);
        const auto count = numbers_.at(position + 4, width());
        const std::uint64_t place = position + 4 + width();
        if (!type || !count)
            return std::nullopt;
        const bool isInline = *count <= width() && *count * sizeOf(*type) <= width();
        const auto values = isInline ? place : numbers_.at(place, width());
        return values ? std::optional(Field{*type, *count, *values}) : std::nullopt;
    }

    Numbers numbers_;
    bool isBig_;
};

std::optional<Directory> directoryOf(Bytes encoded) {
    if (encoded.size() < 8 || encoded[0] != encoded[1] || (encoded[0] != 'I' && encoded[0] != 'M'))
        return std::nullopt;
    const Numbers numbers(encoded, encoded[0] == 'M');
    const auto version = numbers.at(2, 2);
    if (version != 42 && version != 43)
        return std::nullopt;
    return Directory(numbers, version == 43);
}

/// How many bytes of pixels one byte of the file can stand for at best; 0 for a compression that is not read.
std::uint64_t maximumRatio(std::uint64_t compression) {
    switch (compression) {
    case s_uncompressed: return 1;
    case 5: return 2800; // LZW
    case 7: return 1600; // JPEG
    case 8:              // deflate, in its two numbers
    case 32946: return s_maximumDeflateRatio;
    case 32773: return 64; // PackBits
    default: return 0;
    }
}

struct Layout {
    std::uint32_t width;
    std::uint32_t height;
    std::uint64_t compression;
    std::uint64_t rowSize; ///< of all planes, before compression
};

std::optional<Layout> layoutOf(const Directory& directory) {
    const auto width = directory.number(Width, 0, std::nullopt);
    const auto height = directory.number(Height, 0, std::nullopt);
    const auto compression = directory.number(Compression, 0, s_uncompressed);
    const auto samples = directory.number(SamplesPerPixel, 0, 1);
    const auto depth = directory.number(BitsPerSample, 0, 1);
    if (!width || !height || !compression || !samples || !depth || *width > s_maximumImageSide ||
        *height > s_maximumImageSide || *samples == 0 || *samples > 64 || *depth == 0 || *depth > 64)
        return std::nullopt;
    const Layout layout{static_cast<std::uint32_t>(*width), static_cast<std::uint32_t>(*height), *compression,
                        (*width * *samples * *depth + 7) / 8};
    return isImageSizeAllowed(layout.width, layout.height) ? std::optional(layout) : std::nullopt;
}

/// Of the picture as it is shown: four of the eight orientations store its columns in place of its rows.
std::pair<std::uint32_t, std::uint32_t> uprightSize(const Directory& directory, const Layout& layout) {
    const std::uint64_t orientation = directory.number(Orientation, 0, 1).value_or(1);
    const bool isTurned = orientation >= 5 && orientation <= 8;
    return isTurned ? std::pair(layout.height, layout.width) : std::pair(layout.width, layout.height);
}

bool isPlausible(const Layout& layout, std::size_t encodedSize) {
    return layout.rowSize <= maximumRatio(layout.compression) * encodedSize / layout.height;
}

/// Whether all bytes of the pixels are in the file; uncompressed ones, enough of them.
bool arePixelsThere(const Directory& directory, const Layout& layout, std::size_t encodedSize) {
    const bool isTiled = directory.find(TileOffsets).has_value();
    const auto offsets = directory.find(isTiled ? TileOffsets : StripOffsets);
    const auto sizes = directory.find(isTiled ? TileSizes : StripSizes);
    if (!offsets || !sizes || offsets->count != sizes->count || offsets->count == 0)
        return false;
    std::uint64_t present = 0;
    for (std::uint64_t i = 0; i < offsets->count; ++i) {
        const auto offset = directory.numberOf(*offsets, i);
        const auto size = directory.numberOf(*sizes, i);
        if (!offset || !size || *offset > encodedSize || *size > encodedSize - *offset)
            return false;
        present += *size;
    }
    return layout.compression != s_uncompressed || present >= layout.rowSize * layout.height;
}

/// As much as decoding a picture in strips would hold at a time.
std::uint64_t memoryToDecode(const Directory& directory, const Layout& layout, std::size_t encodedSize) {
    const std::uint64_t rows = std::min<std::uint64_t>(
        directory.number(RowsPerStrip, 0, layout.height).value_or(layout.height), layout.height);
    const std::uint64_t planes = directory.number(PlanarConfiguration, 0, 1) == s_separatePlanes ? 1 : 4;
    return rgbaSize(layout.width, layout.height) + planes * rows * layout.rowSize + encodedSize;
}

} // namespace

std::optional<EncodedImageInfo> readTIFFInfo(Bytes encoded) {
    const auto directory = directoryOf(encoded);
    const auto layout = directory ? layoutOf(*directory) : std::nullopt;
    if (!layout || !isPlausible(*layout, encoded.size()))
        return std::nullopt;
    const auto [width, height] = uprightSize(*directory, *layout);
    return EncodedImageInfo{width, height, memoryToDecode(*directory, *layout, encoded.size())};
}

EncodedImageCheck checkTIFF(Bytes encoded, std::uint64_t) {
    const auto image = decodeTIFF(encoded);
    if (!image)
        return {};
    const auto layout = layoutOf(*directoryOf(encoded));
    return {EncodedImageCheck::Decodable, image->width(), image->height(), layout->rowSize * layout->height, 0};
}

std::optional<Image> decodeTIFF(Bytes encoded) {
    const auto directory = directoryOf(encoded);
    const auto layout = directory ? layoutOf(*directory) : std::nullopt;
    if (!layout || !isPlausible(*layout, encoded.size()) || !arePixelsThere(*directory, *layout, encoded.size()))
        return std::nullopt;
    const auto [width, height] = uprightSize(*directory, *layout);
    return Image(width, height, {});
}

std::vector<std::uint8_t> encodeTIFF(const Image&) {
    return {};
}

} // namespace ZULMetaData
