#include "ZULMetaData/Containers/WideRIFF.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <limits>
#include <string>
#include <string_view>

namespace ZULMetaData::detail {

namespace {

constexpr std::uint32_t s_unknownSize = 0xffffffff;
constexpr std::uint64_t s_formSize = 4;

/// `RIFF` and its form stand before the first chunk inside.
constexpr std::uint64_t s_firstChunk = s_chunkHeaderSize + s_formSize;

/// More chunks after the first one are no metadata.
constexpr int s_mostChunks = 1000;

class Finder {
public:
    Finder(const ReadBytes& read, std::uint64_t fileSize) : read_(read), fileSize_(fileSize) {}

    std::optional<WideRIFF> find() {
        const auto first = chunkAt(0);
        if (!first || fileSize_ <= s_chunkHeaderSize)
            return std::nullopt;
        if (first->type == fourCC("RF64") || first->type == fourCC("BW64"))
            return first->size == s_unknownSize ? std::optional(declared().value_or(searched())) : std::nullopt;
        const bool isUnknown = first->size == 0 || (first->size == s_unknownSize && !leadsToEnd(nextOf(*first)));
        return isUnknown && first->type == fourCC("RIFF") ? std::optional(searched()) : std::nullopt;
    }

private:
    struct Chunk {
        std::uint64_t start = 0;
        std::uint32_t type = 0; ///< as `fourCC` gives it
        std::uint32_t size = 0; ///< of its data
    };

    static std::uint64_t endOf(const Chunk& chunk) { return chunk.start + s_chunkHeaderSize + chunk.size; }
    static std::uint64_t nextOf(const Chunk& chunk) { return endOf(chunk) + chunk.size % 2; }

    std::optional<Chunk> chunkAt(std::uint64_t position) {
        std::array<char, s_chunkHeaderSize> header;
        if (read_(position, header) < header.size())
            return std::nullopt;
        Chunk chunk{position};
        std::memcpy(&chunk.type, header.data(), sizeof chunk.type);
        std::memcpy(&chunk.size, header.data() + sizeof chunk.type, sizeof chunk.size);
        chunk.type = chunkType(chunk.type);
        return chunk;
    }

    std::optional<WideRIFF> declared() {
        const auto sizes = chunkAt(s_firstChunk);
        std::uint64_t size = 0;
        std::array<char, sizeof size> bytes;
        if (!sizes || sizes->type != fourCC("ds64") || sizes->size < sizeof size ||
            read_(s_firstChunk + s_chunkHeaderSize, bytes) < bytes.size())
            return std::nullopt;
        std::memcpy(&size, bytes.data(), sizeof size);
        constexpr std::uint64_t most = std::numeric_limits<std::uint64_t>::max();
        if (size == 0 || size == most)
            return std::nullopt; // written to a pipe
        return WideRIFF{size > most - 2 * s_chunkHeaderSize ? most - s_chunkHeaderSize : s_chunkHeaderSize + size,
                        true};
    }

    /// Chunks begin at even offsets.
    WideRIFF searched() {
        const std::uint64_t tail = std::min(fileSize_, s_searchedTail);
        const std::uint64_t begin = std::max((fileSize_ - tail + 1) / 2 * 2, s_firstChunk);
        if (begin >= fileSize_)
            return {fileSize_};
        std::string bytes(static_cast<std::size_t>(fileSize_ - begin), '\0');
        bytes.resize(read_(begin, bytes));
        for (std::size_t at = bytes.find("ZULM"); at != std::string::npos; at = bytes.find("ZULM", at + 1))
            if (at % 2 == 0 && isMetaData(begin + at))
                return {begin + at};
        return {fileSize_};
    }

    bool isMetaData(std::uint64_t position) {
        const auto metaData = chunkAt(position);
        const auto stream = chunkAt(position + s_chunkHeaderSize);
        if (!metaData || !stream || stream->type != s_streamAtom || stream->size < s_metaDataHeaderSize ||
            endOf(*stream) > endOf(*metaData))
            return false;
        return leadsToEnd(nextOf(*metaData)) || (endOf(*metaData) > fileSize_ && isOfFamily(stream->start));
    }

    /// Whether a stream of the registry's family begins in the chunk at `position`.
    bool isOfFamily(std::uint64_t position) {
        std::array<char, s_metaDataHeaderSize> header;
        const std::size_t size = read_(position + s_chunkHeaderSize, header);
        return streamTypeOfContents({header.data(), size}) == Container::RawStream;
    }

    /// Whether chunks follow one another from `position` to the end of the file. The last one may lack its pad byte.
    bool leadsToEnd(std::uint64_t position) {
        for (int i = 0; i < s_mostChunks && position < fileSize_; ++i) {
            const auto chunk = chunkAt(position);
            if (!chunk || endOf(*chunk) > fileSize_)
                return false;
            position = nextOf(*chunk);
        }
        return position == fileSize_ || position == fileSize_ + 1;
    }

    const ReadBytes& read_;
    std::uint64_t fileSize_;
};

} // namespace

std::optional<WideRIFF> wideRIFF(const ReadBytes& read, std::uint64_t fileSize) {
    return Finder(read, fileSize).find();
}

std::optional<WideRIFF> wideRIFF(std::istream& file) {
    const std::uint64_t size = sizeOfInput(file);
    return wideRIFF(readingFrom(file), size);
}

} // namespace ZULMetaData::detail
