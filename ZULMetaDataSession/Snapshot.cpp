#include "ZULMetaDataSession/Snapshot.h"

#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <vector>

namespace ZULMetaData {

double usualDistance(std::span<const double> times) {
    std::vector<double> distances;
    distances.reserve(times.size());
    for (std::size_t i = 1; i < times.size(); ++i)
        if (times[i] > times[i - 1])
            distances.push_back(times[i] - times[i - 1]);
    if (distances.empty())
        return 0;
    const auto middle = distances.begin() + static_cast<std::ptrdiff_t>(distances.size() / 2);
    std::nth_element(distances.begin(), middle, distances.end());
    if (distances.size() % 2 == 1)
        return *middle;
    const double below = *std::max_element(distances.begin(), middle);
    return below + (*middle - below) / 2;
}

std::optional<ScreenPoint> cursorPositionAt(const Track<CursorLocationKind>& track, double time,
                                            Interpolation interpolation, double usual) {
    return detail::positionAfter(track.times(), track.values(), track.countUntil(time), time, interpolation, usual);
}

namespace detail {

std::optional<ScreenPoint> positionAfter(std::span<const double> times, std::span<const Point> points,
                                         std::size_t count, double time, Interpolation interpolation, double usual) {
    if (count == 0)
        return std::nullopt;
    const ScreenPoint here(points[count - 1]);
    if (interpolation == Interpolation::Held || count == times.size())
        return here;
    const double end = times[count];
    const double distance = end - times[count - 1];
    const double begin = distance > 2 * usual ? end - usual : times[count - 1];
    if (!(time > begin) || !std::isfinite(distance)) // times far apart may have no distance that is a number
        return here;
    const ScreenPoint next(points[count]);
    const double way = (time - begin) / (end - begin);
    return ScreenPoint(here.x + (next.x - here.x) * way, here.y + (next.y - here.y) * way);
}

} // namespace detail

} // namespace ZULMetaData
