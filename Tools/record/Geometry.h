#pragma once

#include <cstdint>

namespace Recorder {

struct Position {
    std::int32_t x = 0;
    std::int32_t y = 0;

    friend bool operator==(const Position&, const Position&) = default;
};

/// Pixels of the root window.
struct Area {
    std::int32_t x = 0;
    std::int32_t y = 0;
    std::int32_t width = 0;
    std::int32_t height = 0;

    bool contains(Position position) const {
        return position.x >= x && position.y >= y && position.x < x + width && position.y < y + height;
    }

    friend bool operator==(const Area&, const Area&) = default;
};

} // namespace Recorder
