#pragma once

// The recording info of 64 bytes that a movie has in its `ZULR` atom.

#include "CreatorAttributes.h"

#include <cstdint>
#include <type_traits>

namespace ZULMetaData {

/// Recording info. It is written and read as it lies in memory, in little-endian byte order.
struct ZCAPHeader {
    std::int64_t headerVersion = 0; ///< the version of the record's layout; 1 is written
    CreatorAttributes creator;      ///< the application and the operating system
};

static_assert(sizeof(ZCAPHeader) == 64);
static_assert(std::is_trivially_copyable_v<ZCAPHeader>);

} // namespace ZULMetaData
