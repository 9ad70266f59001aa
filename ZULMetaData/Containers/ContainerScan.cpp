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

/// Stores the stream that begins here. Returns false if fewer bytes than its header are left.
bool storeStream(PositionedInput& input, std::uint64_t length, StreamCache& found) {
    const std::uint64_t offset = input.position();
    HeaderBytes header;
    if (!input.read(header.data(), header.size()))
        return false;
    store(header, {offset, length}, found);
    return true;
}

/// Calls `visit` with every atom from here to `end`. It may read on, and ends the walk by returning false. An
/// atom of no size ends it too.
template <class Visit>
void walkAtoms(PositionedInput& input, std::uint64_t end, Visit visit) {
    while (input.position() < end && input.position() < input.total()) {
        ContainerItem atom;
        if (!readAtomHeader(input, ExtendedSizes::BelowHeader, atom) || atom.size == 0)
            return;
        const bool wrapsAround = atom.end() < atom.offset;
        if (!visit(atom) || wrapsAround || !input.moveTo(atom.end()))
            return;
    }
}

bool visitStreamAtom(PositionedInput& input, const ContainerItem& atom, StreamCache& found, ScanMessages messages) {
    if (atom.holdsStream()) // always taken for one with an extended header, the only form that is written
        return storeStream(input, atom.size - s_extendedAtomHeaderSize, found);
    if (messages == ScanMessages::Printed)
        std::cerr << "Found a non DATA atom mixed in the ZUL meta data\n";
    return true;
}

/// Calls `visit` with every chunk from here to `end`; it ends the walk by returning false. Returns false if a chunk of
/// size 0 ended the walk.
template <class Visit>
bool walkChunks(PositionedInput& input, std::uint64_t end, Visit visit) {
    while (input.position() < end && input.position() < input.total()) {
        ContainerItem chunk;
        if (!readChunkHeader(input, chunk))
            return true;
        if (chunk.sizeField == 0)
            return false;
        if (!visit(chunk))
            return true;
    }
    return true;
}

} // namespace

void scanAtoms(std::istream& stream, std::uint64_t total, StreamCache& found, ScanMessages messages) {
    PositionedInput input(stream, 0, total);
    walkAtoms(input, total, [&](const ContainerItem& atom) {
        if (atom.holdsMetaData())
            walkAtoms(input, atom.end(),
                      [&](const ContainerItem& child) { return visitStreamAtom(input, child, found, messages); });
        return true;
    });
}

void scanChunks(std::istream& stream, std::uint64_t total, StreamCache& found, ScanMessages messages,
                std::uint64_t begin) {
    PositionedInput input(stream, 0, total);
    input.moveTo(begin);
    const auto visitStreamChunk = [&](const ContainerItem& chunk) {
        if (chunk.holdsStream() && !storeStream(input, chunk.sizeField, found))
            return false;
        if (!chunk.holdsStream() && messages == ScanMessages::Printed)
            std::cerr << "Found a non DATA chunk mixed in the ZUL meta data\n";
        const std::uint32_t padded = chunk.sizeField + (chunk.sizeField & 1); // the largest odd size wraps to 0
        return input.moveTo(chunk.payloadOffset() + padded);
    };
    walkChunks(input, total, [&](const ContainerItem& chunk) {
        if (chunk.holdsMetaData() && !walkChunks(input, chunk.end(), visitStreamChunk))
            return false; // a stream chunk of size 0 ends the whole scan
        return input.moveTo(chunk.end() + (chunk.size & 1));
    });
}

void scanRawStream(std::istream& stream, std::uint64_t total, StreamCache& found) {
    HeaderBytes header{};
    stream.read(header.data(), header.size());
    store(header, {0, total}, found);
}

} // namespace ZULMetaData::detail
