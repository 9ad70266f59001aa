#pragma once

// Instants of the machine's monotonic clock, which every part of the recorder uses.

#include <cstdint>

namespace Recorder {

/// Nanoseconds of CLOCK_MONOTONIC.
using Instant = std::int64_t;

inline constexpr Instant s_second = 1'000'000'000;  ///< nanoseconds of a second
inline constexpr Instant s_millisecond = 1'000'000; ///< nanoseconds of a millisecond

/// Returns the present instant.
Instant now();

/// Returns a length of nanoseconds in units of which `scale` are a second, also if the length is of many days.
constexpr std::int64_t inUnits(Instant length, std::int64_t scale) {
    return length / s_second * scale + (length % s_second * scale + s_second / 2) / s_second;
}

/// Returns the whole time whose lower 32 bits are these milliseconds, as near to `about` as can be.
constexpr Instant unwrapped(std::uint32_t milliseconds, Instant about) {
    const auto present = static_cast<std::uint64_t>(about / s_millisecond);
    const auto difference = static_cast<std::int32_t>(milliseconds - static_cast<std::uint32_t>(present));
    return (static_cast<Instant>(present) + difference) * s_millisecond;
}

/// Returns the middle between two instants.
constexpr Instant middleOf(Instant first, Instant second) {
    return first + (second - first) / 2;
}

} // namespace Recorder
