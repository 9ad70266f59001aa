#pragma once

#include <cmath>
#include <cstdint>

namespace Recorder {

inline constexpr std::int32_t s_notch = 120; ///< what one notch of a wheel is written as

/// An axis by which a device scrolls.
struct ScrollAxis {
    std::uint16_t number;
    bool isVertical;
    double increment; ///< of one notch; positive is down or right
    double rest = 0;  ///< parts of a unit that were not written yet

    /// Returns the whole units of a movement along the axis, up and left positive. What is left counts the next time.
    std::int32_t turned(double value) {
        constexpr double most = 1e9;
        const double whole = rest - value / increment * s_notch;
        if (!(std::abs(whole) < most)) // no hand moves that far
            return 0;
        const double written = std::trunc(whole);
        rest = whole - written;
        return static_cast<std::int32_t>(written);
    }
};

} // namespace Recorder
