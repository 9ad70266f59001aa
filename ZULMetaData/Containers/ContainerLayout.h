#pragma once

// The atoms of a movie or the chunks of a RIFF file as their headers declare them. Nothing between the headers is read.
//
//     ItemWalk atoms(ByteSource::file("Recording.mp4"), Container::QuickTime);
//     while (const auto atom = atoms.next())
//         std::cout << atom->offset << ' ' << atom->type.text() << '\n';

#include "../../SharedDependencies/Export.h"
#include "../ByteSource.h"
#include "ContainerType.h"
#include "FourCC.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace ZULMetaData {

namespace detail {

inline constexpr FourCC s_metaDataAtom = "ZULM";
inline constexpr FourCC s_streamAtom = "DATA";
inline constexpr FourCC s_recordingInfoAtom = "ZULR";

class ByteReader;
enum class ExtendedSizes;

} // namespace detail

/// An atom of a movie or a chunk of a RIFF file, as its header describes it.
struct ContainerItem {
    FourCC type;                  ///< the four characters in the header
    std::uint64_t offset = 0;     ///< the position of the header in the file
    std::uint64_t headerSize = 0; ///< 8, or 16 for an atom in extended form

    /// The size of the whole item, with its header and without its pad byte, as the header declares it.
    std::uint64_t size = 0;

    /// The 32-bit number in the header. It is 0 in an atom that players take to reach to the end of the file. The
    /// search for metadata reads a 64-bit size after every number below 8; `size` is then that size.
    std::uint32_t sizeField = 0;

    /// What declares the size, if the header does not.
    enum SizeSource : std::int32_t {
        Header,
        SizeChunk, ///< the `ds64` chunk inside an `RF64` or `BW64` chunk
        FileEnd,   ///< the end of the file or the metadata at its end: the RIFF file was written to a pipe
    };
    SizeSource sizeSource = Header; ///< `Header` for every atom

    bool isExtended() const { return headerSize == 16; } ///< returns whether the size is stored in 64 bits

    /// These go by the type alone. At the top of a container, the children of an item with metadata are streams.
    ///@{
    bool holdsMetaData() const { return type == detail::s_metaDataAtom; }
    bool holdsStream() const { return type == detail::s_streamAtom; }
    bool holdsRecordingInfo() const { return type == detail::s_recordingInfoAtom; }
    ///@}

    std::uint64_t payloadOffset() const { return offset + headerSize; } ///< returns a position in the file

    /// Returns the position after the item, without its pad byte. Has no meaning if the size is 0 or overflows.
    std::uint64_t end() const { return offset + size; }

    /// Returns 0 if the declared size does not even cover the header.
    std::uint64_t payloadSize() const { return size < headerSize ? 0 : size - headerSize; }

    /// Returns whether the whole item lies before `limit`.
    bool fits(std::uint64_t limit) const { return offset <= limit && size <= limit - offset; }
};

/// Walks over the items of a container, or over the children of one of them. This is the only walk over the items of
/// files that are not trusted; the search for metadata of `MetaDataParser` and `Util::finalizeAtomsInFile` have loops
/// of their own, because what they do with a malformed file never changes.
class ZULMETADATA_API ItemWalk {
public:
    /// Begins at the first item. There are no items in a bare stream or a file of unknown type.
    ItemWalk(ByteSource file, Container::Type type);

    /// Returns the next item, or nothing after an item that nothing can follow: one whose declared end is not after its
    /// beginning, or lies beyond the file. Throws `std::system_error` if reading fails.
    std::optional<ContainerItem> next();

    /// Returns a walk over the children of an item, which ends with the item.
    ItemWalk inside(const ContainerItem& parent) const;

    /// Returns the item whose header is at `position`. Empty if the header does not end before the walk does.
    std::optional<ContainerItem> itemAt(std::uint64_t position) const;

    void moveTo(std::uint64_t position) { position_ = position; }  ///< the next item is read there
    std::uint64_t position() const { return position_; }           ///< returns the position of the next item
    std::uint64_t end() const { return end_; }                     ///< returns the last position that a walk can reach
    bool isMovie() const { return type_ == Container::QuickTime; } ///< returns whether the items are atoms
    const ByteSource& source() const;                              ///< returns the file
    detail::ByteReader& reader() const { return *reader_; }        ///< is for the library itself

    /// Returns the position of the item after this one. A byte of padding follows a chunk of an odd size.
    std::uint64_t after(const ContainerItem& item) const { return item.end() + (isMovie() ? 0 : item.size % 2); }

    /// Takes the 32-bit sizes 0 and 2 to 7 literally, as a repair does.
    void takeSizesLiterally();

private:
    std::shared_ptr<detail::ByteReader> reader_;
    Container::Type type_;
    detail::ExtendedSizes sizes_;
    std::optional<ContainerItem> first_; ///< the first chunk of a RIFF file whose size is not in its header
    std::uint64_t position_ = 0;
    std::uint64_t end_;
};

/// Returns all items at the top of a container. A movie may hold hundreds of thousands; a walk keeps none of them.
ZULMETADATA_API std::vector<ContainerItem> topLevelItems(const ByteSource& file, Container::Type type);

} // namespace ZULMetaData
