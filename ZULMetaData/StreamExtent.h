#pragma once

// Measures how much of a metadata stream is whole: its header and the entries before the first one that is cut short.
// The walk never leaves the existing bytes, whatever sizes they declare, and needs constant memory.

#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataUUIDs.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <optional>
#include <span>

namespace ZULMetaData {

/// The result of a walk along a stream.
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

/// Reads bytes at a position and returns their number. It is smaller than the number asked for only at the end.
using ReadBytes = Callback<std::size_t(std::uint64_t position, std::span<char> bytes)>;

/// Walks along a stream of `length` bytes. Returns nothing if they are too few for a header.
ZULMETADATA_API std::optional<StreamExtent> measureStream(const ReadBytes& read, std::uint64_t length);

/// Walks along the `length` bytes of `input` that begin at `offset`. Clears the state of `input` first.
ZULMETADATA_API std::optional<StreamExtent> measureStream(std::istream& input, std::uint64_t offset,
                                                          std::uint64_t length);

/// Returns a function that reads `input` at any position. `input` must outlive it. The function throws
/// `std::system_error` if reading fails.
ZULMETADATA_API ReadBytes readingFrom(std::istream& input);

/// Throws `std::system_error` if `input` has failed for another reason than its end. Otherwise bytes that cannot be
/// read would be taken for bytes that do not exist.
ZULMETADATA_API void requireReadable(const std::istream& input);

/// Returns the number of bytes in `input`, whatever its state is. Throws `std::system_error` if the number cannot be
/// determined.
ZULMETADATA_API std::uint64_t sizeOfInput(std::istream& input);

} // namespace ZULMetaData
