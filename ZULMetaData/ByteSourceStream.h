#pragma once

#include "../SharedDependencies/Export.h"
#include "ByteReader.h"

#include <cstdint>
#include <istream>
#include <streambuf>

namespace ZULMetaData {

/// An input stream over a source, for readers that take a stream. Reads small blocks after a seek and larger ones as
/// the reads follow one another. What the source throws passes through, and leaves
/// the stream bad.
class ZULMETADATA_API ByteSourceStream final : private std::streambuf, public std::istream {
public:
    explicit ByteSourceStream(ByteSource source); ///< begins at the first byte

    void close(); ///< lets go of the source; nothing can be read afterwards

private:
    std::streambuf::int_type underflow() override;
    std::streambuf::pos_type seekoff(std::streambuf::off_type offset, std::ios_base::seekdir from,
                                     std::ios_base::openmode which) override;
    std::streambuf::pos_type seekpos(std::streambuf::pos_type position, std::ios_base::openmode which) override;

    detail::ByteReader reader_;
    std::uint64_t blockEnd_ = 0; ///< the position in the source after the bytes of the get area
};

} // namespace ZULMetaData
