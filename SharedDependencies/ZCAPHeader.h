#pragma once

// The 64-byte recording info that a movie carries in its `ZULR` atom.

#include "CreatorAttributes.h"

#include <cstdint>
#include <type_traits>

namespace ZULMetaData {

/// Written and read as it lies in memory, in the host's byte order (little-endian everywhere we run).
struct ZCAPHeader {
    std::int64_t headerVersion = 0; ///< of the record's layout; 1 is what is written
    CreatorAttributes creator;      ///< what recorded, and on which system
};

static_assert(sizeof(ZCAPHeader) == 64);
static_assert(std::is_trivially_copyable_v<ZCAPHeader>);

} // namespace ZULMetaData
