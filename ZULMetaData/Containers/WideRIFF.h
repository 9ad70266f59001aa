#pragma once

// RIFF files whose first chunk does not say in 32 bits how long it is: `RF64` and `BW64`, whose `ds64` chunk holds the
// size in 64 bits, and files that were written to a pipe, which hold a size of 0 or 0xffffffff.

#include "ZULMetaData/Containers/ContainerLayout.h"

#include <optional>

namespace ZULMetaData::detail {

/// Returns the first chunk with its true size, which may reach beyond a file that was cut short. Returns nothing if the
/// chunk has its size in 32 bits. In a file from a pipe the chunk ends before a `ZULM` chunk that holds a `DATA` chunk
/// and from which chunks lead to the end of the file; if there is none, it ends with the file.
std::optional<ContainerItem> wideRIFF(const ItemWalk& chunks);

} // namespace ZULMetaData::detail
