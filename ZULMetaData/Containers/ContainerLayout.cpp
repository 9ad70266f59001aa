#include "ZULMetaData/Containers/ContainerLayout.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/WideRIFF.h"
#include "ZULMetaData/PositionedInput.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <cstring>
#include <limits>
#include <optional>
#include <system_error>

namespace ZULMetaData {

namespace {

constexpr std::uint64_t s_anywhere = std::numeric_limits<std::uint64_t>::max();

std::string fourCharacters(std::uint32_t storedType) {
    std::string characters(sizeof storedType, '\0');
    std::memcpy(characters.data(), &storedType, sizeof storedType);
    return characters;
}

/// Positions the stream, whatever its state, and counts from there.
detail::PositionedInput inputAt(std::istream& stream, std::uint64_t position, std::uint64_t total) {
    stream.clear();
    stream.seekg(0);
    detail::PositionedInput input(stream, 0, total);
    input.moveTo(position);
    return input;
}

bool readAtom(detail::PositionedInput& input, ContainerItem& atom) {
    std::uint32_t type = 0;
    atom.offset = input.position();
    if (!input.readBigEndian(atom.sizeField) || !input.readBigEndian(type))
        return false;
    atom.size = atom.sizeField;
    if (atom.sizeField < detail::s_atomHeaderSize && !input.readBigEndian(atom.size) && atom.sizeField != 0)
        return false; // an open end needs no more bytes
    atom.type = fourCharacters(swapInt(type));
    atom.headerSize = input.position() - atom.offset;
    return true;
}

bool readChunk(detail::PositionedInput& input, ContainerItem& chunk) {
    std::uint32_t type = 0;
    std::uint32_t size = 0;
    chunk.offset = input.position();
    if (!input.readChunkTypeAndSize(type, size))
        return false;
    chunk.type = fourCharacters(type);
    chunk.headerSize = detail::s_chunkHeaderSize;
    chunk.size = chunk.headerSize + size;
    chunk.sizeField = size;
    return true;
}

/// Where the next chunk begins.
std::uint64_t behindChunk(const ContainerItem& chunk) {
    return chunk.end() + chunk.size % 2;
}

/// `endOf` gives where the next item begins.
template <class Read, class EndOf>
void visitItems(detail::PositionedInput input, std::uint64_t end, Read read, EndOf endOf,
                const ContainerVisitor& visit) {
    while (input.position() < end && input.position() < input.total()) {
        ContainerItem item;
        if (!read(input, item) || !visit(item))
            break;
        const std::uint64_t next = endOf(item);
        if (next <= item.offset || !input.moveTo(next))
            break;
    }
}

/// What `visitEach` hands to its visitor.
template <class VisitEach>
std::vector<ContainerItem> listOf(VisitEach visitEach) {
    std::vector<ContainerItem> items;
    visitEach([&](const ContainerItem& item) {
        items.push_back(item);
        return true;
    });
    return items;
}

} // namespace

bool ContainerItem::isExtended() const {
    return headerSize == detail::s_extendedAtomHeaderSize;
}

bool ContainerItem::holdsMetaData() const {
    return type == fourCharacters(swapInt(detail::s_metaDataAtom));
}

bool ContainerItem::holdsStream() const {
    return type == fourCharacters(swapInt(detail::s_streamAtom));
}

bool ContainerItem::holdsRecordingInfo() const {
    return type == fourCharacters(swapInt(detail::s_recordingInfoAtom));
}

void visitAtoms(std::istream& stream, std::uint64_t begin, std::uint64_t end, std::uint64_t total,
                const ContainerVisitor& visit) {
    visitItems(
        inputAt(stream, begin, total), end, readAtom, [](const ContainerItem& atom) { return atom.end(); }, visit);
}

void visitChunks(std::istream& stream, std::uint64_t begin, std::uint64_t end, std::uint64_t total,
                 const ContainerVisitor& visit) {
    visitItems(inputAt(stream, begin, total), end, readChunk, behindChunk, visit);
}

namespace {

/// The first chunk of a RIFF file may not have its size in its header.
void visitTopChunks(std::istream& stream, std::uint64_t total, const ContainerVisitor& visit) {
    std::optional<detail::WideRIFF> wide;
    try {
        wide = detail::wideRIFF(stream);
    } catch (const std::system_error&) {
        stream.setstate(std::ios_base::badbit); // as a walk that cannot read leaves it
        return;
    }
    const auto read = [&](detail::PositionedInput& input, ContainerItem& chunk) {
        if (!readChunk(input, chunk))
            return false;
        if (wide && chunk.offset == 0) {
            chunk.size = wide->end;
            chunk.sizeSource = wide->isDeclared ? ContainerItem::SizeChunk : ContainerItem::FileEnd;
        }
        return true;
    };
    visitItems(inputAt(stream, 0, total), s_anywhere, read, behindChunk, visit);
}

} // namespace

void visitTopLevel(std::istream& stream, Container::Type type, const ContainerVisitor& visit) {
    stream.clear();
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    if (stream.fail())
        return;
    if (type == Container::QuickTime)
        visitAtoms(stream, 0, s_anywhere, total, visit);
    else if (type == Container::Riff)
        visitTopChunks(stream, total, visit);
}

std::vector<ContainerItem> listAtoms(std::istream& stream, std::uint64_t begin, std::uint64_t end,
                                     std::uint64_t total) {
    return listOf([&](const ContainerVisitor& visit) { visitAtoms(stream, begin, end, total, visit); });
}

std::vector<ContainerItem> listChunks(std::istream& stream, std::uint64_t begin, std::uint64_t end,
                                      std::uint64_t total) {
    return listOf([&](const ContainerVisitor& visit) { visitChunks(stream, begin, end, total, visit); });
}

std::vector<ContainerItem> listTopLevel(std::istream& stream, Container::Type type) {
    return listOf([&](const ContainerVisitor& visit) { visitTopLevel(stream, type, visit); });
}

} // namespace ZULMetaData
