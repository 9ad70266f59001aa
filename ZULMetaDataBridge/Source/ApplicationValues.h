#pragma once

// What an application hands to the writers: times, points and rectangles in its own terms. The platform's own
// records convert to these by their shape, so that none of its headers is needed here.

#include "../../ZULMetaData/ZULMMetaDataCommon.h"

#include <concepts>
#include <cstdint>
#include <limits>

namespace ZULMetaData {

/// Has the shape of a point of the platform.
template <class R>
concept PlatformPoint = requires(const R& r) {
    { r.x } -> std::convertible_to<double>;
    { r.y } -> std::convertible_to<double>;
};

/// Has the shape of a rectangle of the platform.
template <class R>
concept PlatformRect = requires(const R& r) {
    { r.origin } -> PlatformPoint;
    { r.size.width } -> std::convertible_to<double>;
    { r.size.height } -> std::convertible_to<double>;
};

/// Has the shape of a media time of the platform.
template <class R>
concept PlatformTime = requires(const R& r) {
    { r.value } -> std::convertible_to<std::int64_t>;
    { r.timescale } -> std::convertible_to<std::int32_t>;
    { r.flags } -> std::convertible_to<std::uint32_t>;
    { r.epoch } -> std::convertible_to<std::int64_t>;
};

/// A time as the platform's media services count it.
struct MediaTime {
    std::int64_t value = 0;     ///< in units of 1 / `timescale` seconds
    std::int32_t timescale = 0; ///< units of `value` in a second; 0 is no time, see `seconds`
    std::uint32_t flags = 0;    ///< never looked at
    std::int64_t epoch = 0;     ///< never looked at

    constexpr MediaTime() = default;

    /// `timeValue / scale` seconds.
    constexpr MediaTime(std::int64_t timeValue, std::int32_t scale, std::uint32_t timeFlags = 0,
                        std::int64_t timeEpoch = 0)
        : value(timeValue), timescale(scale), flags(timeFlags), epoch(timeEpoch) {}

    /// Converts a time of the platform.
    template <PlatformTime T>
    constexpr MediaTime(const T& time) : MediaTime(time.value, time.timescale, time.flags, time.epoch) {}

    /// Flags and epoch do not count. If the timescale is 0, as in a default `MediaTime`, the result is infinite or not a
    /// number; a writer stores it as it is, and its `isHealthy` returns false from then on.
    double seconds() const { return static_cast<double>(value) / static_cast<double>(timescale); }
};

/// A position or a delta, in pixels; fractions are cut off where it is stored.
struct ScreenPoint {
    double x = 0; ///< horizontal; a position counts from the left edge of the display
    double y = 0; ///< vertical; a position counts from the upper edge of the display

    constexpr ScreenPoint() = default;
    constexpr ScreenPoint(double xValue, double yValue) : x(xValue), y(yValue) {} ///< horizontal, vertical

    /// Converts a point of the platform.
    template <PlatformPoint P>
    constexpr ScreenPoint(const P& point) : ScreenPoint(point.x, point.y) {}
};

/// Origin and size, in pixels; fractions are cut off where it is stored.
struct ScreenRect {
    double x = 0;      ///< from the left edge of the display
    double y = 0;      ///< from its upper edge
    double width = 0;  ///< to the right
    double height = 0; ///< downward

    constexpr ScreenRect() = default;

    /// Origin, then size.
    constexpr ScreenRect(double xValue, double yValue, double widthValue, double heightValue)
        : x(xValue), y(yValue), width(widthValue), height(heightValue) {}

    /// Converts a rectangle of the platform.
    template <PlatformRect R>
    constexpr ScreenRect(const R& rect) : ScreenRect(rect.origin.x, rect.origin.y, rect.size.width, rect.size.height) {}
};

/// Toward zero; saturates outside the 32-bit range, and not-a-number becomes 0.
inline std::int32_t truncated(double coordinate) {
    using Limits = std::numeric_limits<std::int32_t>;
    if (coordinate >= Limits::max())
        return Limits::max();
    if (coordinate > Limits::min())
        return static_cast<std::int32_t>(coordinate);
    return coordinate <= Limits::min() ? Limits::min() : 0; // all comparisons with not-a-number are false
}

/// Both coordinates, each as above.
inline Point truncated(const ScreenPoint& point) {
    return {truncated(point.x), truncated(point.y)};
}

/// All four numbers, each as above: the size is no difference of truncated edges.
inline Rect truncated(const ScreenRect& rect) {
    return {truncated(rect.x), truncated(rect.y), truncated(rect.width), truncated(rect.height)};
}

} // namespace ZULMetaData
