#pragma once

// Opens files in the way that the whole library does, and converts positions and byte order.

#include "Export.h"

#include <cstdint>
#include <fstream>
#include <ios>
#include <iosfwd>

namespace ZULMetaData {

// These functions never wait: they refuse to open a pipe. If opening fails, they set the fail bit of the stream, and
// `errno` says why; otherwise they clear its state.

/// Opens `path` with `mode` plus the input mode.
ZULMETADATA_API void fileOpen(std::ifstream& stream, const char* path, std::ios_base::openmode mode);

/// Opens `path` with `mode` plus the output mode.
ZULMETADATA_API void fileOpen(std::ofstream& stream, const char* path, std::ios_base::openmode mode);

/// Opens `path` with `mode`.
ZULMETADATA_API void fileOpen(std::fstream& stream, const char* path, std::ios_base::openmode mode);

/// Moves the write position to `position`, in bytes from the start. Sets the fail bit if that fails.
ZULMETADATA_API void seekWritePos(std::ostream& stream, std::int64_t position);

/// Returns the position as a number of bytes, or -1 if it is the position of a failed stream.
ZULMETADATA_API std::int64_t toInt64(std::streampos position);

/// Returns the value with its bytes in reverse order. This converts between the byte order of the host and that of the
/// atoms in a movie, in both directions.
constexpr std::uint64_t swapInt(std::uint64_t value) {
    std::uint64_t swapped = 0;
    for (int byte = 0; byte < 8; ++byte, value >>= 8)
        swapped = swapped << 8 | (value & 0xff);
    return swapped;
}

/// Does the same for a value of 32 bits.
constexpr std::uint32_t swapInt(std::uint32_t value) {
    return value << 24 | (value & 0xff00) << 8 | (value >> 8 & 0xff00) | value >> 24;
}

} // namespace ZULMetaData
