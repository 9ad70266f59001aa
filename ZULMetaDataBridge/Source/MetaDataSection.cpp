#include "ZULMetaDataBridge/Source/MetaDataSection.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <cerrno>
#include <limits>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

namespace ZULMetaData {

MetaDataSection::MetaDataSection(std::ostream& out, Container::Type type)
    : out_(out), isMovie_(type == Container::QuickTime), begin_(open()), firstStream_(position()) {}

/// A stream does not call itself failed if it cannot tell its position, and what is written then would stand in the
/// wrong place.
std::uint64_t MetaDataSection::position() {
    const auto position = out_.tellp();
    if (position < 0)
        out_.setstate(std::ios_base::badbit);
    return static_cast<std::uint64_t>(position);
}

void MetaDataSection::moveTo(std::uint64_t position) {
    out_.seekp(static_cast<std::streamoff>(position));
}

/// Leaves room for the header, which is written when the size is known.
std::uint64_t MetaDataSection::open() {
    const std::uint64_t begin = position();
    moveTo(begin + (isMovie_ ? detail::s_extendedAtomHeaderSize : detail::s_chunkHeaderSize));
    return begin;
}

void MetaDataSection::close(std::uint64_t begin, FourCC type) {
    const std::uint64_t end = position();
    if (!out_)
        return;
    moveTo(begin);
    if (isMovie_) {
        const auto header = detail::extendedAtomHeader(type, end - begin);
        out_.write(header.data(), header.size());
        return moveTo(end);
    }
    const std::uint64_t size = end - begin - detail::s_chunkHeaderSize;
    if (size > std::numeric_limits<std::uint32_t>::max())
        throw std::length_error(std::to_string(size) + " bytes of metadata are more than a chunk can hold");
    const auto header = detail::chunkHeader(type, static_cast<std::uint32_t>(size));
    out_.write(header.data(), header.size());
    moveTo(end);
    out_.write("", static_cast<std::streamsize>(size % 2));
}

void MetaDataSection::finish() {
    if (position() == firstStream_)
        moveTo(begin_);
    else
        close(begin_, detail::s_metaDataAtom);
}

void appendBytes(const ByteSource& source, std::uint64_t offset, std::uint64_t size, std::ostream& out,
                 const std::function<void(std::uint64_t)>& advance) {
    constexpr std::uint64_t longestPiece = 1 << 20;
    std::vector<char> piece(static_cast<std::size_t>(std::min(size, longestPiece)));
    for (const std::uint64_t end = offset + size; offset < end;) {
        const auto wanted = static_cast<std::size_t>(std::min(end - offset, longestPiece));
        const std::string_view bytes(piece.data(), source.read(offset, {piece.data(), wanted}));
        if (bytes.empty())
            throw std::system_error(EIO, std::generic_category(), "it ends at offset " + std::to_string(offset));
        if (detail::isZero(bytes))
            out.seekp(static_cast<std::streamoff>(bytes.size()), std::ios_base::cur);
        else
            out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        offset += bytes.size();
        if (advance)
            advance(bytes.size());
    }
}

bool haveSameBytes(const ByteSource& left, const ByteSource& right) {
    constexpr std::size_t pieceSize = 1 << 18;
    std::string leftPiece(pieceSize, '\0');
    std::string rightPiece(pieceSize, '\0');
    bool isSame = left.size() == right.size();
    for (std::uint64_t position = 0; isSame && position < left.size(); position += pieceSize) {
        const std::size_t size = left.read(position, leftPiece);
        isSame = right.read(position, rightPiece) == size && size > 0 &&
                 std::string_view(leftPiece).substr(0, size) == std::string_view(rightPiece).substr(0, size);
    }
    return isSame;
}

} // namespace ZULMetaData
