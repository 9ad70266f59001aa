#pragma once

// The atoms of a movie or the chunks of a RIFF file as their headers declare them, for tools that show or check a
// container. Nothing between the headers is read.

#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "ContainerType.h"

#include <cstdint>
#include <istream>
#include <string>
#include <vector>

namespace ZULMetaData {

/// An atom of a movie or a chunk of a RIFF file, by what its header says.
struct ZULMETADATA_API ContainerItem {
    std::string type;         ///< four characters as they are stored, whatever bytes they are
    std::uint64_t offset;     ///< where the header begins
    std::uint64_t headerSize; ///< 8, or 16 for an atom in extended form
    std::uint64_t size;       ///< of the whole item, header included, pad byte excluded. As declared: 0 is an open end

    /// The 32-bit number in the header. 0 in an atom that others take to reach to the end of the file; the search for
    /// metadata reads a 64-bit size behind every number below 8, which is then `size`.
    std::uint32_t sizeField = 0;

    /// Who tells the size, if the header does not.
    enum SizeSource : std::int32_t {
        Header,
        SizeChunk, ///< the `ds64` chunk inside of an `RF64` or `BW64` chunk
        FileEnd,   ///< the end of the file or the metadata at it: the RIFF file was written to a pipe
    };
    SizeSource sizeSource = Header; ///< `Header` for every atom

    bool isExtended() const;    ///< its size stands in 64 bits behind its type
    bool holdsMetaData() const; ///< by its type; at the top of a container it is the one whose children are streams
    bool holdsStream() const;   ///< by its type
    bool holdsRecordingInfo() const; ///< by its type; at the top of a movie

    std::uint64_t payloadOffset() const { return offset + headerSize; } ///< in the file

    /// Where the next item begins, but for a pad byte. Means nothing where the size is 0 or overflows.
    std::uint64_t end() const { return offset + size; }

    /// Of the payload, 0 where the declared size does not even cover the header.
    std::uint64_t payloadSize() const { return size < headerSize ? 0 : size - headerSize; }
};

/// Gets one item after the other and ends the walk by false. The stream stands anywhere meanwhile and must be left
/// there.
using ContainerVisitor = Callback<bool(const ContainerItem&)>;

/// The items between `begin` and `end` of `stream`, which holds `total` bytes. Ends with the first item that nothing
/// can follow: one with an open end, one whose end no file position can hold, or one that reaches beyond the total.
/// All of these clear the stream's state first.
///@{
ZULMETADATA_API void visitAtoms(std::istream& stream, std::uint64_t begin, std::uint64_t end, std::uint64_t total,
                                const ContainerVisitor& visit);
ZULMETADATA_API void visitChunks(std::istream& stream, std::uint64_t begin, std::uint64_t end, std::uint64_t total,
                                 const ContainerVisitor& visit);
ZULMETADATA_API std::vector<ContainerItem> listAtoms(std::istream& stream, std::uint64_t begin, std::uint64_t end,
                                                     std::uint64_t total);
ZULMETADATA_API std::vector<ContainerItem> listChunks(std::istream& stream, std::uint64_t begin, std::uint64_t end,
                                                      std::uint64_t total);
///@}

/// The items at the top of a container; none where `type` is a bare stream or unknown. A movie may hold hundreds of
/// thousands: visiting them keeps none.
///@{
ZULMETADATA_API void visitTopLevel(std::istream& stream, Container::Type type, const ContainerVisitor& visit);
ZULMETADATA_API std::vector<ContainerItem> listTopLevel(std::istream& stream, Container::Type type);
///@}

} // namespace ZULMetaData
