#include "ZULMetaDataBridge/Source/MetaDataSection.h"

#include "ZULMetaData/Containers/AtomFormat.h"

#include <algorithm>
#include <cerrno>
#include <limits>
#include <span>
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
    out_.write("", size % 2);
}

void MetaDataSection::finish() {
    if (position() == firstStream_)
        moveTo(begin_);
    else
        close(begin_, detail::s_metaDataAtom);
}

void appendBytes(const ByteSource& source, std::ostream& out) {
    constexpr std::size_t pieceSize = 1 << 20;
    std::vector<char> piece(static_cast<std::size_t>(std::min<std::uint64_t>(source.size(), pieceSize)));
    for (std::uint64_t done = 0; done < source.size();) {
        const std::size_t size = source.read(done, piece);
        if (size == 0)
            throw std::system_error(EIO, std::generic_category(), "it ends at offset " + std::to_string(done));
        const std::span bytes = std::span(piece).first(size);
        if (std::all_of(bytes.begin(), bytes.end(), [](char byte) { return byte == 0; }))
            out.seekp(static_cast<std::streamoff>(size), std::ios_base::cur);
        else
            out.write(bytes.data(), static_cast<std::streamsize>(size));
        done += size;
    }
}

} // namespace ZULMetaData
