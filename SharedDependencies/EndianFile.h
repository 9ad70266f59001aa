#pragma once

// Opening files the way the whole library does, and the byte order and position
// helpers that its containers need.

#include "Export.h"

#include <cstdint>
#include <fstream>
#include <ios>
#include <iosfwd>

namespace ZULMetaData {

// A pipe cannot be opened, whatever waits at its other end: no opening ever hangs. `errno` says why one failed.

/// Opens `path` with `mode` plus the input mode. Sets the fail bit where it cannot; otherwise clears the state.
ZULMETADATA_API void fileOpen(std::ifstream& stream, const char* path, std::ios_base::openmode mode);

/// Opens `path` with `mode` plus the output mode. Sets the fail bit where it cannot; otherwise clears the state.
ZULMETADATA_API void fileOpen(std::ofstream& stream, const char* path, std::ios_base::openmode mode);

/// Opens `path` with `mode` as given. Sets the fail bit where it cannot; otherwise clears the state.
ZULMETADATA_API void fileOpen(std::fstream& stream, const char* path, std::ios_base::openmode mode);

/// Moves the write position to `position` bytes from the start. A failed seek sets the fail bit.
ZULMETADATA_API void seekWritePos(std::ostream& stream, std::int64_t position);

/// -1 for the position of a stream that has failed.
ZULMETADATA_API std::int64_t toInt64(std::streampos position);

/// Reverses the byte order: between the host's and that of a movie's atoms, in both directions.
constexpr std::uint64_t swapInt(std::uint64_t value) {
    std::uint64_t swapped = 0;
    for (int byte = 0; byte < 8; ++byte, value >>= 8)
        swapped = swapped << 8 | (value & 0xff);
    return swapped;
}

/// The same for 32 bits.
constexpr std::uint32_t swapInt(std::uint32_t value) {
    return value << 24 | (value & 0xff00) << 8 | (value >> 8 & 0xff00) | value >> 24;
}

} // namespace ZULMetaData
