#include "ZULMetaData/Containers/ContainerScan.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/PositionedInput.h"

#include <array>
#include <cstring>
#include <iostream>

namespace ZULMetaData::detail {

namespace {

using HeaderBytes = std::array<char, s_metaDataHeaderSize>;

void store(const HeaderBytes& header, MetaDataParser::CachedFileData range, StreamCache& found) {
    uuid type;
    std::memcpy(&type, header.data(), sizeof type);
    found[type] = range;
}

/// Stores the stream that begins here. False where not even its header is left.
bool storeStream(PositionedInput& input, std::uint64_t length, StreamCache& found) {
    const std::uint64_t offset = input.position();
    HeaderBytes header;
    if (!input.read(header.data(), header.size()))
        return false;
    store(header, {offset, length}, found);
    return true;
}

/// Hands size, type and end of every atom from here to `end` to `visit`, which may read on and stops the walk by
/// false. So does an atom that has no end to go on from.
template <class Visit>
void walkAtoms(PositionedInput& input, std::uint64_t end, Visit visit) {
    while (input.position() < end && input.position() < input.total()) {
        const std::uint64_t start = input.position();
        std::uint64_t size = 0;
        std::uint32_t type = 0;
        if (!input.readAtomSizeAndType(size, type) || size == 0)
            return;
        const std::uint64_t atomEnd = start + size;
        const bool wrapsAround = atomEnd < start;
        if (!visit(size, type, atomEnd) || wrapsAround || !input.moveTo(atomEnd))
            return;
    }
}

bool visitStreamAtom(PositionedInput& input, std::uint64_t size, std::uint32_t type, StreamCache& found) {
    if (type == s_streamAtom) // always taken for one with an extended header, the only form that is written
        return storeStream(input, size - s_extendedAtomHeaderSize, found);
    std::cerr << "Found a non DATA atom mixed in the ZUL meta data\n";
    return true;
}

/// `visit` gets type and size of every chunk from here to `end`; false stops the walk. The walk gives false where
/// a chunk of size 0 ended it.
template <class Visit>
bool walkChunks(PositionedInput& input, std::uint64_t end, Visit visit) {
    while (input.position() < end && input.position() < input.total()) {
        const std::uint64_t dataStart = input.position() + s_chunkHeaderSize;
        std::uint32_t type = 0;
        std::uint32_t size = 0;
        if (!input.readChunkTypeAndSize(type, size))
            return true;
        if (size == 0)
            return false;
        if (!visit(type, size, dataStart))
            return true;
    }
    return true;
}

} // namespace

void scanAtoms(std::istream& stream, std::uint64_t total, StreamCache& found) {
    PositionedInput input(stream, 0, total);
    walkAtoms(input, total, [&](std::uint64_t, std::uint32_t type, std::uint64_t atomEnd) {
        if (type == s_metaDataAtom)
            walkAtoms(input, atomEnd, [&](std::uint64_t childSize, std::uint32_t childType, std::uint64_t) {
                return visitStreamAtom(input, childSize, childType, found);
            });
        return true;
    });
}

void scanChunks(std::istream& stream, std::uint64_t total, StreamCache& found, std::uint64_t begin) {
    PositionedInput input(stream, 0, total);
    input.moveTo(begin);
    const auto visitStreamChunk = [&](std::uint32_t type, std::uint32_t size, std::uint64_t dataStart) {
        if (type != chunkType(s_streamAtom))
            std::cerr << "Found a non DATA chunk mixed in the ZUL meta data\n";
        else if (!storeStream(input, size, found))
            return false;
        const std::uint32_t padded = size + (size & 1); // the largest odd size wraps to 0
        return input.moveTo(dataStart + padded);
    };
    walkChunks(input, total, [&](std::uint32_t type, std::uint32_t size, std::uint64_t dataStart) {
        const std::uint64_t chunkEnd = dataStart + size;
        if (type == chunkType(s_metaDataAtom) && !walkChunks(input, chunkEnd, visitStreamChunk))
            return false; // a stream chunk of size 0 ends the whole scan
        return input.moveTo(chunkEnd + (size & 1));
    });
}

void scanRawStream(std::istream& stream, std::uint64_t total, StreamCache& found) {
    HeaderBytes header{};
    stream.read(header.data(), header.size());
    store(header, {0, total}, found);
}

} // namespace ZULMetaData::detail
