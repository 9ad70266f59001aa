#pragma once

// How much of a metadata stream is whole: its header and the entries in front of the first one that is cut short.
// Bounded by the bytes that are there, whatever sizes they declare, and in constant memory.

#include "../SharedDependencies/Callback.h"
#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataUUIDs.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <optional>
#include <span>

namespace ZULMetaData {

/// What a walk along a stream found.
struct StreamExtent {
    /// What stands behind the last whole entry.
    enum End : std::int32_t {
        AtEntry,     ///< nothing
        InsideEntry, ///< an entry whose end is missing, its size field included
        EmptyEntry,  ///< an entry that declares no bytes, where each carries its size: no reader gets past it
    };

    MetaDataHeader header;        ///< as it is stored, whatever it says
    std::uint64_t wholeBytes = 0; ///< header included
    std::uint64_t entries = 0;    ///< whole ones
    End end = AtEntry;            ///< why the walk ended
};

/// Gives how many bytes it read: fewer than asked for only where there are no more.
using ReadBytes = Callback<std::size_t(std::uint64_t position, std::span<char> bytes)>;

/// Walks the `length` bytes of a stream. None where they do not hold a stream's header.
ZULMETADATA_API std::optional<StreamExtent> measureStream(const ReadBytes& read, std::uint64_t length);

/// The same for `length` bytes from `offset` on. Clears the input's state first.
ZULMETADATA_API std::optional<StreamExtent> measureStream(std::istream& input, std::uint64_t offset,
                                                          std::uint64_t length);

/// What `input` holds, to be read at any position. Uses an input of the caller, which must outlive it. Throws
/// `std::system_error` where reading fails.
ZULMETADATA_API ReadBytes readingFrom(std::istream& input);

/// Throws `std::system_error` where `input` has failed otherwise than by its end: what cannot be read must not pass for
/// what is not there.
ZULMETADATA_API void requireReadable(const std::istream& input);

/// How many bytes `input` holds, whatever state it was in. Throws `std::system_error` where that cannot be told.
ZULMETADATA_API std::uint64_t sizeOfInput(std::istream& input);

} // namespace ZULMetaData
