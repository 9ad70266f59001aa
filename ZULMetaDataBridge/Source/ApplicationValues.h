#pragma once

// The times, points and rectangles that an application passes to the writers. The types of the platform convert to
// these by the names of their members, so no headers of the platform are needed here.

#include "../../ZULMetaData/ZULMMetaDataCommon.h"

#include <concepts>
#include <cstdint>
#include <limits>

namespace ZULMetaData {

/// A type with the members of a point of the platform.
template <class R>
concept PlatformPoint = requires(const R& r) {
    { r.x } -> std::convertible_to<double>;
    { r.y } -> std::convertible_to<double>;
};

/// A type with the members of a rectangle of the platform.
template <class R>
concept PlatformRect = requires(const R& r) {
    { r.origin } -> PlatformPoint;
    { r.size.width } -> std::convertible_to<double>;
    { r.size.height } -> std::convertible_to<double>;
};

/// A type with the members of a media time of the platform.
template <class R>
concept PlatformTime = requires(const R& r) {
    { r.value } -> std::convertible_to<std::int64_t>;
    { r.timescale } -> std::convertible_to<std::int32_t>;
    { r.flags } -> std::convertible_to<std::uint32_t>;
    { r.epoch } -> std::convertible_to<std::int64_t>;
};

/// A time as a fraction of integers, which is how the platform's media services count time.
struct MediaTime {
    std::int64_t value = 0;     ///< in units of 1 / `timescale` seconds
    std::int32_t timescale = 0; ///< units of `value` in a second; 0 is no time, see `seconds`
    std::uint32_t flags = 0;    ///< ignored
    std::int64_t epoch = 0;     ///< ignored

    constexpr MediaTime() = default;

    /// Creates a time of `timeValue / scale` seconds.
    constexpr MediaTime(std::int64_t timeValue, std::int32_t scale, std::uint32_t timeFlags = 0,
                        std::int64_t timeEpoch = 0)
        : value(timeValue), timescale(scale), flags(timeFlags), epoch(timeEpoch) {}

    /// Converts a time of the platform.
    template <PlatformTime T>
    constexpr MediaTime(const T& time) : MediaTime(time.value, time.timescale, time.flags, time.epoch) {}

    /// Returns the time in seconds; flags and epoch are ignored. If the timescale is 0, as in a default `MediaTime`,
    /// the result is infinite or not a number; a writer stores it as it is, and its `isHealthy` returns false from then
    /// on.
    double seconds() const { return static_cast<double>(value) / static_cast<double>(timescale); }
};

/// A position or a delta, in pixels. Fractions are cut off when it is stored.
struct ScreenPoint {
    double x = 0; ///< horizontal; a position counts from the left edge of the display
    double y = 0; ///< vertical; a position counts from the upper edge of the display

    constexpr ScreenPoint() = default;
    constexpr ScreenPoint(double xValue, double yValue) : x(xValue), y(yValue) {} ///< takes x, then y

    /// Converts a point of the platform.
    template <PlatformPoint P>
    constexpr ScreenPoint(const P& point) : ScreenPoint(point.x, point.y) {}
};

/// A rectangle, in pixels. Fractions are cut off when it is stored.
struct ScreenRect {
    double x = 0;      ///< the left edge, counted from the left edge of the display
    double y = 0;      ///< the upper edge, counted from the upper edge of the display
    double width = 0;  ///< the extent to the right
    double height = 0; ///< the extent downward

    constexpr ScreenRect() = default;

    /// Takes the origin, then the size.
    constexpr ScreenRect(double xValue, double yValue, double widthValue, double heightValue)
        : x(xValue), y(yValue), width(widthValue), height(heightValue) {}

    /// Converts a rectangle of the platform.
    template <PlatformRect R>
    constexpr ScreenRect(const R& rect) : ScreenRect(rect.origin.x, rect.origin.y, rect.size.width, rect.size.height) {}
};

/// Returns the coordinate rounded toward zero. A coordinate outside the range of 32 bits becomes the nearest number in
/// it, and not-a-number becomes 0.
inline std::int32_t truncated(double coordinate) {
    using Limits = std::numeric_limits<std::int32_t>;
    if (coordinate >= Limits::max())
        return Limits::max();
    if (coordinate > Limits::min())
        return static_cast<std::int32_t>(coordinate);
    return coordinate <= Limits::min() ? Limits::min() : 0; // all comparisons with not-a-number are false
}

/// Returns both coordinates, each rounded toward zero.
inline Point truncated(const ScreenPoint& point) {
    return {truncated(point.x), truncated(point.y)};
}

/// Returns all four numbers, each rounded toward zero on its own. The size is not the difference of rounded edges.
inline Rect truncated(const ScreenRect& rect) {
    return {truncated(rect.x), truncated(rect.y), truncated(rect.width), truncated(rect.height)};
}

} // namespace ZULMetaData
