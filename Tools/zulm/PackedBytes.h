#pragma once

// Bytes for a page, in the form that `DecompressionStream` of a browser reads.

#include <cstddef>
#include <string>
#include <string_view>

namespace Zulm {

/// The distance over which `packed` compares bytes: the length of an entry of the cursor's position, which a recording
/// has most of.
constexpr std::size_t s_packedDistance = 16;

/// Returns `bytes` in the format of zlib, after each byte was replaced by its difference to the byte
/// `s_packedDistance` before it. Entries resemble the entry before them, so the result is several times smaller.
std::string packed(std::string_view bytes);

} // namespace Zulm
