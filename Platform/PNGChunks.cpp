#include "Platform/PNGChunks.h"

#include "Platform/ImageLimits.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace ZULMetaData {

namespace {

constexpr std::array<std::uint8_t, 8> s_signature{0x89, 'P', 'N', 'G', '\r', '\n', 0x1a, '\n'};
constexpr std::uint32_t s_maximumLength = 0x7fffffff;
constexpr std::uint8_t s_palette = 3; // the colour type

using Bytes = std::span<const std::uint8_t>;

std::uint32_t bigEndian(Bytes bytes) {
    return std::uint32_t{bytes[0]} << 24 | std::uint32_t{bytes[1]} << 16 | std::uint32_t{bytes[2]} << 8 | bytes[3];
}

std::uint32_t checkSum(Bytes bytes) {
    static const auto table = [] {
        std::array<std::uint32_t, 256> sums{};
        for (std::uint32_t byte = 0; byte < sums.size(); ++byte) {
            sums[byte] = byte;
            for (int bit = 0; bit < 8; ++bit)
                sums[byte] = sums[byte] >> 1 ^ ((sums[byte] & 1) != 0 ? 0xedb88320U : 0U);
        }
        return sums;
    }();
    std::uint32_t sum = 0xffffffff;
    for (const std::uint8_t byte : bytes)
        sum = table[(sum ^ byte) & 0xff] ^ sum >> 8;
    return ~sum;
}

struct Chunk {
    std::string_view type;
    Bytes data;
};

/// The chunks of a file, one after the other, up to the first one that is damaged.
class Chunks {
public:
    explicit Chunks(Bytes encoded) : size_(encoded.size()), rest_(encoded.subspan(s_signature.size())) {}

    std::optional<Chunk> next() {
        constexpr std::size_t around = 12; // length, type and check sum
        if (rest_.size() < around)
            return std::nullopt;
        const std::uint32_t length = bigEndian(rest_);
        if (length > s_maximumLength || length > rest_.size() - around)
            return std::nullopt;
        const Bytes summed = rest_.subspan(4, 4 + std::size_t{length});
        if (checkSum(summed) != bigEndian(rest_.subspan(4 + summed.size())))
            return std::nullopt;
        rest_ = rest_.subspan(around + length);
        return Chunk{{reinterpret_cast<const char*>(summed.data()), 4}, summed.subspan(4)};
    }

    /// Of the first byte after the last chunk that was returned.
    std::size_t offset() const { return size_ - rest_.size(); }

private:
    std::size_t size_;
    Bytes rest_;
};

struct Header {
    std::uint32_t width;
    std::uint32_t height;
    std::uint8_t depth;
    std::uint8_t colorType;

    std::uint64_t storedSize() const {
        constexpr std::array<std::uint8_t, 7> channels{1, 0, 3, 1, 2, 0, 4};
        return (std::uint64_t{width} * channels[colorType] * depth + 7) / 8 * height;
    }
};

bool isDepthAllowed(std::uint8_t depth, std::uint8_t colorType) {
    switch (colorType) {
    case 0: return depth == 1 || depth == 2 || depth == 4 || depth == 8 || depth == 16;
    case s_palette: return depth == 1 || depth == 2 || depth == 4 || depth == 8;
    case 2:
    case 4:
    case 6: return depth == 8 || depth == 16;
    default: return false;
    }
}

std::optional<Header> headerIn(const Chunk& chunk) {
    constexpr std::size_t size = 13;
    if (chunk.type != "IHDR" || chunk.data.size() != size)
        return std::nullopt;
    const Header header{bigEndian(chunk.data), bigEndian(chunk.data.subspan(4)), chunk.data[8], chunk.data[9]};
    const bool isKnown = chunk.data[10] == 0 && chunk.data[11] == 0 && chunk.data[12] <= 1;
    if (!isKnown || !isDepthAllowed(header.depth, header.colorType) || !isImageSizeAllowed(header.width, header.height))
        return std::nullopt;
    return header;
}

bool isCritical(std::string_view type) {
    return (type[0] & 0x20) == 0;
}

bool isPaletteSize(std::size_t size) {
    return size > 0 && size % 3 == 0 && size <= std::size_t{3} * 256;
}

enum class Part { BeforePixels, Whole };

/// Walks what follows the header, and notes in `found` where the pixels and the file end.
bool isSound(Chunks& chunks, const Header& header, Part part, PNGChunks& found) {
    bool hasPalette = false;
    bool hasPixels = false;
    bool arePixelsOver = false;
    while (const auto chunk = chunks.next()) {
        const bool isPixels = chunk->type == "IDAT";
        if (isPixels && (arePixelsOver || (header.colorType == s_palette && !hasPalette)))
            return false;
        if (isPixels && part == Part::BeforePixels)
            return true;
        if (isPixels)
            found.pixelsEnd = chunks.offset();
        found.end = chunks.offset();
        if (chunk->type == "IEND")
            return hasPixels && chunk->data.empty();
        if (chunk->type == "PLTE") {
            if (hasPalette || hasPixels || (header.colorType == s_palette && !isPaletteSize(chunk->data.size())))
                return false;
            hasPalette = true;
        } else if (!isPixels && isCritical(chunk->type)) {
            return false;
        }
        arePixelsOver = hasPixels && !isPixels;
        hasPixels |= isPixels;
    }
    return false;
}

std::optional<PNGChunks> walk(Bytes encoded, Part part) {
    if (!hasPNGSignature(encoded))
        return std::nullopt;
    Chunks chunks(encoded);
    const auto first = chunks.next();
    const auto header = first ? headerIn(*first) : std::nullopt;
    if (!header || header->storedSize() / s_maximumDeflateRatio > encoded.size())
        return std::nullopt;
    PNGChunks found{header->width, header->height, header->storedSize()};
    return isSound(chunks, *header, part, found) ? std::optional(found) : std::nullopt;
}

} // namespace

bool hasPNGSignature(Bytes encoded) noexcept {
    return encoded.size() >= s_signature.size() && std::equal(s_signature.begin(), s_signature.end(), encoded.begin());
}

std::optional<PNGChunks> walkPNGChunks(Bytes encoded) {
    return walk(encoded, Part::Whole);
}

std::optional<PNGChunks> walkPNGHeader(Bytes encoded) {
    return walk(encoded, Part::BeforePixels);
}

} // namespace ZULMetaData
