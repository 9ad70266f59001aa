// PNG files without libpng, for programs that hand the encoded bytes on, such as to a browser: an image is known by its
// size and has no pixels. Everything but the compressed pixels themselves is checked, and those by their check sums.

#include "Platform/ImageLimits.h"
#include "Platform/PNGChunks.h"
#include "Platform/PNGCodec.h"

namespace ZULMetaData {

using Bytes = std::span<const std::uint8_t>;

std::optional<EncodedImageInfo> readPNGInfo(Bytes encoded) {
    const auto header = walkPNGHeader(encoded);
    if (!header)
        return std::nullopt;
    return EncodedImageInfo{header->width, header->height, memoryToDecodePNG(header->width, header->height)};
}

EncodedImageCheck checkPNG(Bytes encoded) {
    const auto chunks = walkPNGChunks(encoded);
    if (!chunks)
        return {};
    return {EncodedImageCheck::Decodable, chunks->width, chunks->height, chunks->unpackedBytes,
            encoded.size() - chunks->end};
}

std::optional<Image> decodePNG(Bytes encoded) {
    const auto chunks = walkPNGChunks(encoded);
    if (!chunks)
        return std::nullopt;
    return Image(chunks->width, chunks->height, {});
}

std::vector<std::uint8_t> encodePNG(const Image&) {
    return {};
}

} // namespace ZULMetaData
