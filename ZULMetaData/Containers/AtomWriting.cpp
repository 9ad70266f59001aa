#include "ZULMetaData/Containers/AtomWriting.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/StreamBufferAccess.h"

namespace ZULMetaData::detail {

namespace {

constexpr std::uint64_t s_pageSize = 4096;

} // namespace

OpenAtom beginAtom(std::ofstream& movie, FourCC type) {
    movie.seekp(0, std::ios_base::end);
    const std::int64_t start = toInt64(movie.tellp());
    const auto header = extendedAtomHeader(type, 0);
    movie.write(header.data(), header.size());
    movie.flush();
    const auto intoPage = static_cast<std::size_t>(
        static_cast<std::uint64_t>(start + static_cast<std::int64_t>(header.size())) % s_pageSize);
    StreamBufferAccess::shortenPutArea(*movie.rdbuf(), intoPage); // the blocks that follow end on page boundaries
    return {start, start < 0 ? start : start + static_cast<std::int64_t>(s_extendedSizeOffset)};
}

std::uint64_t endAtom(std::ofstream& movie, const OpenAtom& atom) {
    movie.flush(); // a disk that is full shows only now
    const std::int64_t end = toInt64(movie.tellp());
    if (movie.fail()) // closing would write what stands in the buffer a second time
        StreamBufferAccess::discardPut(*movie.rdbuf());
    movie.close();
    return static_cast<std::uint64_t>(end) - static_cast<std::uint64_t>(atom.start);
}

void writeAtomSize(std::fstream& movie, std::int64_t sizeField, std::uint64_t size) {
    seekWritePos(movie, sizeField);
    const auto bytes = bigEndianBytes(size);
    movie.write(bytes.data(), bytes.size());
    movie.close();
}

} // namespace ZULMetaData::detail
