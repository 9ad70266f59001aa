#pragma once

// A cache for sources whose every read calls JavaScript.

#include "ZULMetaData/ByteSource.h"

#include <cstddef>

namespace ZULMetaData::Bindings {

inline constexpr std::size_t s_blockSize = std::size_t{1} << 16;

/// Returns a source that reads whole blocks of `bytes` and keeps the ones used last. Walks from atom to atom touch a
/// block here and there, and come back to the first and the last ones. What is larger than a block is read at once and
/// leaves the blocks alone. `bytes` may return fewer bytes than asked for as long as there are more.
ByteSource cachedInBlocks(const ByteSource& bytes);

} // namespace ZULMetaData::Bindings
