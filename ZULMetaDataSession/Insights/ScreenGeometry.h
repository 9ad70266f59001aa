#pragma once

// Rectangles and points of the screen, for the sources of this folder.

#include "ZULMetaDataBridge/Source/ApplicationValues.h"

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

inline ScreenRect screenRect(const Rect& rect) {
    return {static_cast<double>(rect.x), static_cast<double>(rect.y), static_cast<double>(rect.width),
            static_cast<double>(rect.height)};
}

} // namespace ZULMetaData::detail
