#pragma once

// RIFF files whose first chunk does not say in 32 bits how long it is: `RF64` and `BW64`, whose `ds64` chunk holds the
// size in 64 bits, and files that were written to a pipe, which hold a size of 0 or 0xffffffff.

#include "SharedDependencies/Export.h"
#include "ZULMetaData/StreamExtent.h"

#include <cstdint>
#include <istream>
#include <optional>

namespace ZULMetaData::detail {

/// Where the first chunk of such a file ends.
struct WideRIFF {
    std::uint64_t end = 0;   ///< in the file, or beyond it if the file was cut short; a pad byte follows an odd one
    bool isDeclared = false; ///< whether a `ds64` chunk says so; else it is where the metadata at the end begins
};

/// How much of the end of a file is searched for metadata that follows a chunk of unknown size.
inline constexpr std::uint64_t s_searchedTail = std::uint64_t{64} << 20;

/// Returns nothing for a file whose first chunk has its size in 32 bits. The chunk of a file from a pipe ends where a
/// `ZULM` chunk with a `DATA` chunk in it begins from which the chunks lead to the end of the file, else with the file.
ZULMETADATA_API std::optional<WideRIFF> wideRIFF(const ReadBytes& read, std::uint64_t fileSize);

/// Clears the state of `file` and moves its position. Throws `std::system_error` if reading fails.
ZULMETADATA_API std::optional<WideRIFF> wideRIFF(std::istream& file);

} // namespace ZULMetaData::detail
