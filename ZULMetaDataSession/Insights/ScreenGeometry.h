#pragma once

// Rectangles and points of the screen, for the sources of this folder.

#include "ZULMetaDataBridge/Source/ApplicationValues.h"

#include <cmath>

namespace ZULMetaData::detail {

inline bool hasArea(const ScreenRect& rect) {
    return rect.width > 0 && rect.height > 0;
}

inline bool contains(const ScreenRect& rect, const ScreenPoint& point) {
    return point.x >= rect.x && point.x <= rect.x + rect.width && point.y >= rect.y && point.y <= rect.y + rect.height;
}

inline ScreenPoint middleOf(const ScreenRect& rect) {
    return {rect.x + rect.width / 2, rect.y + rect.height / 2};
}

inline ScreenPoint screenPoint(const Point& point) {
    return {static_cast<double>(point.x), static_cast<double>(point.y)};
}

/// Unlike `std::hypot`, equal on every machine.
inline double distanceBetween(const ScreenPoint& left, const ScreenPoint& right) {
    const ScreenPoint way{right.x - left.x, right.y - left.y};
    return std::sqrt(way.x * way.x + way.y * way.y);
}

inline ScreenRect screenRect(const Rect& rect) {
    return {static_cast<double>(rect.x), static_cast<double>(rect.y), static_cast<double>(rect.width),
            static_cast<double>(rect.height)};
}

} // namespace ZULMetaData::detail
