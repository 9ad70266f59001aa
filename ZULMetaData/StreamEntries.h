#pragma once

// The whole entries of a stream, one after the other, without believing what they say about themselves: an entry that
// is given lies inside the bytes that are there, and is decoded only where its inner sizes agree with its own.
//
//     StreamEntries entries(readingFrom(file), length);
//     while (const auto entry = entries.next())
//         if (const auto decoded = decodeEntry<std::string>(entries.bytesOf(*entry), entries.header()->version))
//             std::cout << decoded->time << ' ' << decoded->value << '\n';

#include "../SharedDependencies/Export.h"
#include "StreamExtent.h"
#include "ZULMMetaDataReader.h"
#include "ZULMMetaDataUUIDs.h"

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// Where an entry is, counted from the stream's header on. The size counts all of it.
struct StreamEntry {
    std::uint64_t offset = 0; ///< from the header's first byte on
    std::uint64_t size = 0;   ///< in bytes; of an entry that carries its size, the size field is part of it

    std::uint64_t end() const { return offset + size; } ///< where the next entry begins
};

/// Walks forward once, reading large pieces; needs little memory but for the bytes of one entry.
class ZULMETADATA_API StreamEntries {
public:
    /// `read` gives the stream's bytes by their position behind its start; it holds `length` of them.
    StreamEntries(ReadBytes read, std::uint64_t length);

    /// None where there are too few bytes for one; there are no entries then.
    const std::optional<MetaDataHeader>& header() const { return header_; }

    /// The size of every entry, 0 where each carries its own. The header's, unless a reader goes by another one.
    void setEntrySize(std::uint32_t size) { entrySize_ = size; }

    /// None behind the last whole entry.
    std::optional<StreamEntry> next();

    /// Valid until the next call of anything here. Fewer bytes than the entry has where they cannot be read.
    std::string_view bytesOf(const StreamEntry& entry);

    /// Header and whole entries given so far.
    std::uint64_t wholeBytes() const { return position_; }

    /// What stands there, once there is no next entry.
    StreamExtent::End end() const { return end_; }

private:
    std::string_view bytesAt(std::uint64_t position, std::uint64_t size);
    std::optional<std::uint64_t> sizeOfNext();

    ReadBytes read_;
    std::uint64_t length_;
    std::optional<MetaDataHeader> header_;
    std::uint32_t entrySize_ = 0;
    std::uint64_t position_ = 0;
    StreamExtent::End end_ = StreamExtent::AtEntry;
    std::vector<char> window_;
    std::uint64_t windowStart_ = 0;
    std::size_t windowSize_ = 0;
};

/// A decoded entry.
template <StreamValue T>
struct TimedValue {
    double time = 0; ///< in seconds
    T value{};       ///< texts as they are stored, perhaps not UTF-8
};

/// An entry by the layout of its value. None where its bytes do not fit it: too few or too many, or an inner size that
/// disagrees with them. Fields of a cursor image that do not fit into its data part are left out, as readers do. A
/// list's time is the one that its texts repeat; 0 for an empty one.
template <StreamValue T>
std::optional<TimedValue<T>> decodeEntry(std::string_view bytes, int version);

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

ZULMETADATA_API bool readEntryBytes(std::string_view bytes, double& time, std::string& text);
ZULMETADATA_API bool readEntryBytes(std::string_view bytes, double& time, std::list<std::string>& texts);
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
    } else if constexpr (std::same_as<T, CursorImage>) {
        fits = detail::readEntryBytes(bytes, decoded.time, decoded.value, version);
    } else {
        fits = detail::readEntryBytes(bytes, decoded.time, decoded.value);
    }
    if (!fits)
        return std::nullopt;
    return decoded;
}

} // namespace ZULMetaData
