#include "ZULMetaDataSession/Insights/CursorSpeed.h"

#include "ZULMetaDataSession/Insights/ScreenGeometry.h"
#include "ZULMetaDataSession/Snapshot.h"

#include <cmath>
#include <cstddef>
#include <span>

namespace ZULMetaData {

namespace {

double speedOver(const Point& from, const Point& to, double time) {
    const double speed = detail::distanceBetween(detail::screenPoint(from), detail::screenPoint(to)) / time;
    return std::isfinite(speed) ? speed : 0;
}

} // namespace

std::vector<CursorSpeed> cursorSpeedsOf(const Track<CursorLocationKind>& positions) {
    std::vector<CursorSpeed> speeds;
    if (positions.empty())
        return speeds;
    const std::span<const double> times = positions.times();
    const std::span<const Point> points = positions.values();
    const double usual = usualDistance(times);
    speeds.reserve(times.size() + times.size() / 2); // at most half of the distances exceed the median
    for (std::size_t i = 1; i < times.size(); ++i) {
        const double passed = times[i] - times[i - 1];
        if (passed > 2 * usual) {
            speeds.push_back({times[i - 1], 0});
            speeds.push_back({times[i] - usual, speedOver(points[i - 1], points[i], usual)});
        } else if (passed > 0) {
            speeds.push_back({times[i - 1], speedOver(points[i - 1], points[i], passed)});
        }
    }
    speeds.push_back({times.back(), 0});
    return speeds;
}

} // namespace ZULMetaData
