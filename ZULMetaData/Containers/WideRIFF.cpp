#include "ZULMetaData/Containers/WideRIFF.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"

#include <algorithm>
#include <limits>
#include <string>

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
    explicit Finder(ByteReader& file) : file_(file) {}

    std::optional<ContainerItem> find() {
        auto first = chunkAt(0);
        if (!first || file_.size() <= s_chunkHeaderSize)
            return std::nullopt;
        const bool isUnknown = first->sizeField == s_unknownSize;
        if (first->type == "RF64" || first->type == "BW64") {
            if (!isUnknown)
                return std::nullopt;
            const auto declared = declaredSize();
            first->sizeSource = declared ? ContainerItem::SizeChunk : ContainerItem::FileEnd;
            first->size = declared ? *declared : searchedEnd();
            return first;
        }
        if (first->type != "RIFF" || !(first->sizeField == 0 || (isUnknown && !leadsToEnd(nextOf(*first)))))
            return std::nullopt;
        first->sizeSource = ContainerItem::FileEnd;
        first->size = searchedEnd();
        return first;
    }

private:
    static std::uint64_t nextOf(const ContainerItem& chunk) { return chunk.end() + chunk.size % 2; }

    std::optional<ContainerItem> chunkAt(std::uint64_t position) {
        ByteCursor cursor(file_, position, file_.size());
        ContainerItem chunk;
        return readChunkHeader(cursor, chunk) ? std::optional(chunk) : std::nullopt;
    }

    std::optional<std::uint64_t> declaredSize() {
        const auto sizes = chunkAt(s_firstChunk);
        const auto size = sizes ? file_.numberAt<std::uint64_t>(sizes->payloadOffset()) : std::nullopt;
        constexpr std::uint64_t most = std::numeric_limits<std::uint64_t>::max();
        if (!size || sizes->type != "ds64" || sizes->payloadSize() < sizeof *size || *size == 0 || *size == most)
            return std::nullopt; // 0 and the greatest number mean that the file was written to a pipe
        return *size > most - 2 * s_chunkHeaderSize ? most - s_chunkHeaderSize : s_chunkHeaderSize + *size;
    }

    /// Chunks begin at even offsets.
    std::uint64_t searchedEnd() {
        const std::uint64_t fileSize = file_.size();
        const std::uint64_t tail = std::min(fileSize, s_searchedTail);
        const std::uint64_t begin = std::max((fileSize - tail + 1) / 2 * 2, s_firstChunk);
        if (begin >= fileSize)
            return fileSize;
        std::string bytes(static_cast<std::size_t>(fileSize - begin), '\0');
        bytes.resize(file_.source().read(begin, bytes));
        const std::string type = s_metaDataAtom.text();
        for (std::size_t at = bytes.find(type); at != std::string::npos; at = bytes.find(type, at + 1))
            if (at % 2 == 0 && isMetaData(begin + at))
                return begin + at;
        return fileSize;
    }

    bool isMetaData(std::uint64_t position) {
        const auto metaData = chunkAt(position);
        const auto stream = chunkAt(position + s_chunkHeaderSize);
        if (!metaData || !stream || !stream->holdsStream() || stream->payloadSize() < s_metaDataHeaderSize ||
            stream->end() > metaData->end())
            return false;
        return leadsToEnd(nextOf(*metaData)) || (metaData->end() > file_.size() && beginsLikeStream(*stream));
    }

    bool beginsLikeStream(const ContainerItem& stream) {
        return streamTypeOfContents(file_.at(stream.payloadOffset(), s_metaDataHeaderSize)) == Container::RawStream;
    }

    /// Returns whether chunks follow one another from `position` to the end of the file. The last one may lack its pad
    /// byte.
    bool leadsToEnd(std::uint64_t position) {
        for (int i = 0; i < s_mostChunks && position < file_.size(); ++i) {
            const auto chunk = chunkAt(position);
            if (!chunk || chunk->end() > file_.size())
                return false;
            position = nextOf(*chunk);
        }
        return position == file_.size() || position == file_.size() + 1;
    }

    ByteReader& file_;
};

} // namespace

std::optional<ContainerItem> wideRIFF(ByteReader& file) {
    return Finder(file).find();
}

} // namespace ZULMetaData::detail
