#include "Tools/demo/Cursors.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace ZULMetaData::Demo {

namespace {

constexpr int s_side = 32;
constexpr int s_samples = 4; // per pixel and direction

using Shape = std::vector<ScreenPoint>; // a polygon, in units of a 32-pixel image

const Shape s_arrow{{5, 3}, {5, 24}, {10, 19.5}, {13.5, 27.5}, {17, 26}, {13.5, 18.2}, {20, 18}};
const Shape s_hand{{11, 4},  {13.5, 4},  {14, 13}, {17, 12.5}, {17.5, 14}, {20.5, 13.5}, {21, 15},  {23.5, 15},
                   {25, 17}, {24.5, 23}, {22, 29}, {13, 29},   {7, 21},    {6, 18.5},    {8, 17.5}, {11, 20}};
const Shape s_beam{{11, 4},  {14, 4},  {16, 5.5},  {18, 4},  {21, 4},  {21, 6},  {17, 7},  {17, 25}, {21, 26},
                   {21, 28}, {18, 28}, {16, 26.5}, {14, 28}, {11, 28}, {11, 26}, {15, 25}, {15, 7},  {11, 6}};

bool contains(const Shape& shape, ScreenPoint point) {
    bool inside = false;
    for (std::size_t i = 0, j = shape.size() - 1; i < shape.size(); j = i++) {
        const ScreenPoint a = shape[i];
        const ScreenPoint b = shape[j];
        if ((a.y > point.y) != (b.y > point.y) && point.x < (b.x - a.x) * (point.y - a.y) / (b.y - a.y) + a.x)
            inside = !inside;
    }
    return inside;
}

double distanceToSegment(ScreenPoint point, ScreenPoint a, ScreenPoint b) {
    const double lengthSquared = (b.x - a.x) * (b.x - a.x) + (b.y - a.y) * (b.y - a.y);
    const double along = ((point.x - a.x) * (b.x - a.x) + (point.y - a.y) * (b.y - a.y)) / lengthSquared;
    const double t = std::clamp(along, 0.0, 1.0);
    return std::hypot(point.x - a.x - t * (b.x - a.x), point.y - a.y - t * (b.y - a.y));
}

double distanceToOutline(const Shape& shape, ScreenPoint point) {
    double nearest = s_side;
    for (std::size_t i = 0, j = shape.size() - 1; i < shape.size(); j = i++)
        nearest = std::min(nearest, distanceToSegment(point, shape[i], shape[j]));
    return nearest;
}

/// How much of a pixel is black, and how much is painted at all, of `s_samples` squared samples.
struct Coverage {
    int black = 0;
    int painted = 0;
};

Coverage coverageAt(const Shape& shape, int x, int y, int scale) {
    constexpr double rim = 1.1;
    Coverage coverage;
    for (int sample = 0; sample < s_samples * s_samples; ++sample) {
        const int column = sample % s_samples;
        const int row = sample / s_samples;
        const ScreenPoint point((x + (column + 0.5) / s_samples) / scale, (y + (row + 0.5) / s_samples) / scale);
        const bool inside = contains(shape, point);
        const bool nearOutline = distanceToOutline(shape, point) < rim;
        coverage.black += inside && !nearOutline;
        coverage.painted += inside || nearOutline;
    }
    return coverage;
}

/// Black with a white rim.
std::shared_ptr<const Image> drawn(const Shape& shape, int scale) {
    const int side = s_side * scale;
    std::vector<std::uint8_t> pixels;
    for (int y = 0; y < side; ++y)
        for (int x = 0; x < side; ++x) {
            const Coverage coverage = coverageAt(shape, x, y, scale);
            const int white = coverage.painted - coverage.black;
            const int grey = coverage.painted == 0 ? 0 : 255 * white / coverage.painted;
            pixels.insert(pixels.end(), 3, static_cast<std::uint8_t>(grey));
            pixels.push_back(static_cast<std::uint8_t>(255 * coverage.painted / (s_samples * s_samples)));
        }
    const auto width = static_cast<std::uint32_t>(side);
    return std::make_shared<const Image>(width, width, std::move(pixels));
}

} // namespace

std::vector<Cursor> drawnCursors(int scale) {
    const auto cursor = [scale](std::int64_t number, ScreenPoint hotSpot, const Shape& shape) {
        return Cursor{number + std::int64_t{10} * scale, static_cast<std::int32_t>(number),
                      ScreenPoint(hotSpot.x * scale, hotSpot.y * scale), drawn(shape, scale)};
    };
    return {cursor(1, {5, 3}, s_arrow), cursor(2, {12, 4}, s_hand), cursor(3, {16, 16}, s_beam)};
}

} // namespace ZULMetaData::Demo
