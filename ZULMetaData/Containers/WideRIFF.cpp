#include "ZULMetaData/Containers/WideRIFF.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"

#include <algorithm>
#include <limits>
#include <string>

namespace ZULMetaData::detail {

namespace {

constexpr std::uint32_t s_unknownSize = 0xffffffff;
constexpr std::uint64_t s_formSize = 4;

/// How much of the end of a file is searched for metadata that follows a chunk of unknown size.
constexpr std::uint64_t s_searchedTail = std::uint64_t{64} << 20;

/// `RIFF` and its form stand before the first chunk inside.
constexpr std::uint64_t s_firstChunk = s_chunkHeaderSize + s_formSize;

/// More chunks after the first one are no metadata.
constexpr int s_mostChunks = 1000;

std::optional<std::uint64_t> declaredSize(const ItemWalk& chunks) {
    const auto sizes = chunks.itemAt(s_firstChunk);
    const auto size = sizes ? chunks.reader().numberAt<std::uint64_t>(sizes->payloadOffset()) : std::nullopt;
    constexpr std::uint64_t most = std::numeric_limits<std::uint64_t>::max();
    if (!size || sizes->type != "ds64" || sizes->payloadSize() < sizeof *size || *size == 0 || *size == most)
        return std::nullopt; // 0 and the greatest number mean that the file was written to a pipe
    return *size > most - 2 * s_chunkHeaderSize ? most - s_chunkHeaderSize : s_chunkHeaderSize + *size;
}

/// Returns whether chunks follow one another from `position` to the end of the file. The last one may lack its pad
/// byte.
bool leadsToEnd(const ItemWalk& chunks, std::uint64_t position) {
    for (int i = 0; i < s_mostChunks && position < chunks.end(); ++i) {
        const auto chunk = chunks.itemAt(position);
        if (!chunk || chunk->end() > chunks.end())
            return false;
        position = chunks.after(*chunk);
    }
    return position == chunks.end() || position == chunks.end() + 1;
}

bool beginsLikeStream(const ItemWalk& chunks, const ContainerItem& stream) {
    return streamTypeOfContents(chunks.reader().at(stream.payloadOffset(), s_metaDataHeaderSize)) ==
           Container::RawStream;
}

bool isMetaData(const ItemWalk& chunks, std::uint64_t position) {
    const auto metaData = chunks.itemAt(position);
    const auto stream = chunks.itemAt(position + s_chunkHeaderSize);
    if (!metaData || !stream || !stream->holdsStream() || stream->payloadSize() < s_metaDataHeaderSize ||
        !stream->fits(metaData->end()))
        return false;
    return leadsToEnd(chunks, chunks.after(*metaData)) ||
           (metaData->end() > chunks.end() && beginsLikeStream(chunks, *stream));
}

/// Chunks begin at even offsets.
std::uint64_t searchedEnd(const ItemWalk& chunks) {
    const std::uint64_t fileSize = chunks.end();
    const std::uint64_t tail = std::min(fileSize, s_searchedTail);
    const std::uint64_t begin = std::max((fileSize - tail + 1) / 2 * 2, s_firstChunk);
    if (begin >= fileSize)
        return fileSize;
    std::string bytes(static_cast<std::size_t>(fileSize - begin), '\0');
    bytes.resize(chunks.source().read(begin, bytes));
    const std::string type = s_metaDataAtom.text();
    for (std::size_t at = bytes.find(type); at != std::string::npos; at = bytes.find(type, at + 1))
        if (at % 2 == 0 && isMetaData(chunks, begin + at))
            return begin + at;
    return fileSize;
}

} // namespace

std::optional<ContainerItem> wideRIFF(const ItemWalk& chunks) {
    auto first = chunks.itemAt(0);
    if (!first || chunks.end() <= s_chunkHeaderSize)
        return std::nullopt;
    const bool isUnknown = first->sizeField == s_unknownSize;
    const bool isWide = first->type == "RF64" || first->type == "BW64";
    const bool isPiped = first->type == "RIFF" && (first->sizeField == 0 || isUnknown);
    if (isWide ? !isUnknown : !isPiped || (isUnknown && leadsToEnd(chunks, chunks.after(*first))))
        return std::nullopt;
    const auto declared = isWide ? declaredSize(chunks) : std::nullopt;
    first->sizeSource = declared ? ContainerItem::SizeChunk : ContainerItem::FileEnd;
    first->size = declared ? *declared : searchedEnd(chunks);
    return first;
}

} // namespace ZULMetaData::detail
