#pragma once

// How sound is made faster or slower: the filters of libavfilter, and the rates that encoders take.

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <string>

namespace Zulm {

/// Returns the rate of sound that is written: that of the source if encoders take it.
inline int soundRateFor(int sourceRate) {
    constexpr std::array rates{8000, 11025, 12000, 16000, 22050, 24000, 32000, 44100, 48000};
    constexpr int usual = 48000;
    return std::find(rates.begin(), rates.end(), sourceRate) == rates.end() ? usual : sourceRate;
}

/// Returns whether anything can be heard at a speed. Sound that is a thousand times faster or slower is left silent.
inline bool isHeardAt(double speed) {
    constexpr double fastest = 1000;
    return speed >= 1 / fastest && speed <= fastest;
}

/// Returns the filters for a speed at which sound is heard, with a comma between any two. One filter changes the tempo
/// by a limited factor.
inline std::string tempoFilters(double speed) {
    constexpr double most = 100;
    constexpr double least = 0.5;
    std::string filters = "anull";
    while (speed != 1) {
        const double factor = std::clamp(speed, least, most);
        filters += fmt::format(",atempo={:.17g}", factor);
        speed /= factor;
    }
    return filters;
}

} // namespace Zulm
