#pragma once

// Walks along the whole entries of a stream without trusting their sizes. Every entry that is returned lies inside the
// existing bytes, and an entry is decoded only if the sizes inside it agree with its own size.
//
//     StreamEntries entries(ByteSource::file("slideTitle.dat"));
//     while (const auto entry = entries.next())
//         if (const auto decoded = decodeEntry<std::string>(entries.bytesOf(*entry), entries.header()->version))
//             std::cout << decoded->time << ' ' << decoded->value << '\n';

#include "../SharedDependencies/Export.h"
#include "ByteReader.h"
#include "ByteSource.h"
#include "ZULMMetaDataReader.h"
#include "ZULMMetaDataUUIDs.h"

#include <cstdint>
#include <optional>
#include <string_view>

namespace ZULMetaData {

/// The place of an entry in its stream.
struct StreamEntry {
    std::uint64_t offset = 0; ///< counted from the first byte of the header
    std::uint64_t size = 0;   ///< in bytes; includes the size field if the entry has one

    std::uint64_t end() const { return offset + size; } ///< returns where the next entry begins
};

/// How much of a stream is whole: its header and the entries before the first one that is cut short.
struct StreamExtent {
    /// What follows the last whole entry.
    enum End : std::int32_t {
        AtEntry,     ///< nothing
        InsideEntry, ///< an entry whose end is missing; even its size field may be cut short
        EmptyEntry,  ///< an entry that declares a size of 0; no reader gets past it
    };

    MetaDataHeader header;        ///< the header as it is stored
    std::uint64_t wholeBytes = 0; ///< bytes of the header and the whole entries
    std::uint64_t entries = 0;    ///< the number of whole entries
    End end = AtEntry;            ///< why the walk ended
};

/// Walks forward once and reads large pieces. It needs memory for one entry and little more. This is the only walk over
/// the entries of streams that are not trusted.
class ZULMETADATA_API StreamEntries {
public:
    explicit StreamEntries(ByteSource stream); ///< takes the bytes of the stream, header included

    /// Returns the header. It is empty if the stream is shorter than a header; there are no entries then.
    const std::optional<MetaDataHeader>& header() const { return header_; }

    /// Returns the next whole entry, or nothing after the last one.
    std::optional<StreamEntry> next();

    /// Returns the bytes of the entry, or fewer if they cannot be read. They are valid until the next call of any
    /// function of this object.
    std::string_view bytesOf(const StreamEntry& entry) { return reader_.at(entry.offset, entry.size); }

    /// Returns the number of bytes of the header and of the entries returned so far.
    std::uint64_t wholeBytes() const { return position_; }

    /// Returns what follows the last whole entry, once `next` has returned nothing.
    StreamExtent::End end() const { return end_; }

    detail::ByteReader& reader() { return reader_; } ///< is for the library itself

private:
    detail::ByteReader reader_;
    std::optional<MetaDataHeader> header_;
    std::uint64_t position_ = 0;
    StreamExtent::End end_ = StreamExtent::AtEntry;
};

/// Walks along a whole stream. Returns nothing if it is shorter than a header. Entries of equal size are not read.
ZULMETADATA_API std::optional<StreamExtent> measureStream(const ByteSource& stream);

/// An entry that was decoded.
template <StreamValue T>
struct TimedValue {
    double time = 0; ///< in seconds
    T value{};       ///< texts are as they are stored and may be invalid UTF-8
};

/// Decodes the bytes of an entry that holds a `T`. Returns nothing if they do not fit: if there are too few or too
/// many, or if a size inside the entry disagrees with them. Fields of a cursor image that do not fit into its data part
/// are left out, as readers do. The time of a list is the time of its texts, or 0 if the list is empty. Throws
/// `std::bad_alloc` if there is no memory for the value.
template <StreamValue T>
std::optional<TimedValue<T>> decodeEntry(std::string_view bytes, int version);

/// Returns whether the data part of an entry that holds a cursor image has room for all fields that it should have.
ZULMETADATA_API bool hasRoomForCursorFields(std::string_view bytes, int version);

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

ZULMETADATA_API bool readEntryBytes(std::string_view bytes, double& time, std::string& text, int version);
ZULMETADATA_API bool readEntryBytes(std::string_view bytes, double& time, std::list<std::string>& texts, int version);
ZULMETADATA_API bool readEntryBytes(std::string_view bytes, double& time, CursorImage& image, int version);

} // namespace detail

template <StreamValue T>
std::optional<TimedValue<T>> decodeEntry(std::string_view bytes, [[maybe_unused]] int version) {
    TimedValue<T> decoded;
    bool fits = false;
    if constexpr (FixedSizeValue<T>) {
        fits = bytes.size() == sizeof decoded.time + sizeof decoded.value;
        if (fits) {
            std::memcpy(&decoded.time, bytes.data(), sizeof decoded.time);
            std::memcpy(&decoded.value, bytes.data() + sizeof decoded.time, sizeof decoded.value);
        }
    } else {
        fits = detail::readEntryBytes(bytes, decoded.time, decoded.value, version);
    }
    if (!fits)
        return std::nullopt;
    return decoded;
}

} // namespace ZULMetaData
