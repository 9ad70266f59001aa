#include "ZULMetaDataSession/Insights/Camera.h"

#include "ZULMetaDataSession/Insights/ScreenGeometry.h"

#include <algorithm>
#include <cstddef>
#include <span>

// As in CursorPath.cpp, everything is computed with + - * and / of doubles.

namespace ZULMetaData {

namespace {

constexpr double s_settled = 4.743864518390578; ///< a spring of frequency 1 is 95 percent there after these seconds
constexpr double s_shortestSettleTime = 0.001;  ///< in seconds
constexpr double s_shortestPull = 1e-6;         ///< in seconds; a target that moves faster jumps
constexpr double s_forever = 1e15;              ///< in seconds
constexpr double s_atRest = 50;                 ///< nothing can be seen of e to the power of minus this

/// Returns e to the power of -x, which is not negative. The function of the standard library has other last bits on
/// other machines.
double exponentialOfMinus(double x) {
    if (x > s_atRest)
        return 0;
    constexpr int halvings = 6;
    constexpr int terms = 16;
    const double part = -x / (1 << halvings);
    double result = 1;
    for (int term = terms; term > 0; --term)
        result = 1 + part * result / term;
    for (int i = 0; i < halvings; ++i)
        result *= result;
    return result;
}

/// Returns `place`, or the nearest place to it that is at most `distance` from `other`.
double pulledTo(double other, double place, double distance) {
    return std::max(other - distance, std::min(place, other + distance));
}

} // namespace

/// Finds out what pulls the camera when.
class Camera::Maker {
public:
    Maker(Camera& camera, const CursorPath& path, const CameraOptions& options)
        : camera_(camera), path_(path), options_(options) {}

    void add(const Zoom& zoom) {
        for (std::size_t i = 0; i < zoom.places.size(); ++i) {
            const double end = i + 1 < zoom.places.size() ? zoom.places[i + 1].start : zoom.end;
            const ZoomPlace& place = zoom.places[i];
            pullTo(place.start, place.centre, zoom.factor);
            if (options_.followsCursor)
                follow(place, end, zoom.factor);
        }
        pullTo(zoom.end, detail::middleOf(camera_.screen_), 1);
    }

private:
    /// From `time` on, pulls to a place that stays.
    void pullTo(double time, const ScreenPoint& place, double zoom) {
        Pull pull = reached(time);
        pull.x.target = place.x;
        pull.y.target = place.y;
        pull.zoom.target = zoom;
        pull.x.targetSpeed = pull.y.targetSpeed = pull.zoom.targetSpeed = 0;
        pushBack(pull);
    }

    /// From `time` until `end`, pulls to a place that moves.
    void pullAlong(double time, double end, const ScreenPoint& from, const ScreenPoint& to) {
        Pull pull = reached(time);
        pull.x.target = from.x;
        pull.y.target = from.y;
        pull.x.targetSpeed = (to.x - from.x) / (end - time);
        pull.y.targetSpeed = (to.y - from.y) / (end - time);
        pushBack(pull);
    }

    void pushBack(const Pull& pull) {
        if (!camera_.pulls_.empty() && camera_.pulls_.back().time == pull.time)
            camera_.pulls_.back() = pull;
        else
            camera_.pulls_.push_back(pull);
    }

    /// Returns where the camera is at a time that is not before the last pull.
    Pull reached(double time) const {
        if (camera_.pulls_.empty()) {
            const ScreenPoint middle = detail::middleOf(camera_.screen_);
            return {time, {middle.x, 0, middle.x, 0}, {middle.y, 0, middle.y, 0}, {1, 0, 1, 0}};
        }
        const Pull& last = camera_.pulls_.back();
        return camera_.after(last, std::max(0.0, time - last.time));
    }

    /// Moves the target as little as keeps the cursor near the middle.
    void follow(const ZoomPlace& place, double end, double factor) {
        const auto times = path_.times();
        const auto first = std::upper_bound(times.begin(), times.end(), place.first);
        double time = place.first;
        ScreenPoint target = place.centre;
        for (auto i = static_cast<std::size_t>(first - times.begin()); i < times.size() && time < end; ++i) {
            const double next = std::min(times[i], end);
            const ScreenPoint moved = followed(target, *path_.at(next), place.area, factor);
            if (next - time < s_shortestPull) {
                target = moved; // nothing to see on the way
                continue;
            }
            pullAlong(time, next, target, moved);
            time = next;
            target = moved;
        }
        if (time < end)
            pullTo(time, target, factor);
    }

    ScreenPoint followed(const ScreenPoint& target, const ScreenPoint& cursor, const ScreenRect& area,
                         double factor) const {
        const ScreenPoint moved(pulledTo(cursor.x, target.x, area.width * options_.deadZone),
                                pulledTo(cursor.y, target.y, area.height * options_.deadZone));
        return detail::middleOf(zoomedArea(camera_.screen_, moved, factor));
    }

    Camera& camera_;
    const CursorPath& path_;
    const CameraOptions& options_;
};

Camera::Camera(const std::vector<Zoom>& zooms, const CursorPath& path, const ScreenRect& screen,
               const CameraOptions& options)
    : screen_(screen), stiffness_(s_settled / std::max(s_shortestSettleTime, options.settleTime)) {
    Maker maker(*this, path, options);
    for (const Zoom& zoom : zooms)
        maker.add(zoom);
}

Camera::Pull Camera::after(const Pull& pull, double seconds) const {
    const double decay = exponentialOfMinus(stiffness_ * seconds);
    const auto moved = [&](const Spring& spring) -> Spring {
        const double lag = 2 * spring.targetSpeed / stiffness_;
        const double away = spring.place - spring.target + lag;
        const double push = spring.speed - spring.targetSpeed + stiffness_ * away;
        const double target = spring.target + spring.targetSpeed * seconds;
        const double rest = (away + push * seconds) * decay;
        return {target, spring.targetSpeed, target - lag + rest, spring.targetSpeed + push * decay - stiffness_ * rest};
    };
    return {pull.time + seconds, moved(pull.x), moved(pull.y), moved(pull.zoom)};
}

CameraView Camera::at(double time) const {
    const auto next = std::upper_bound(pulls_.begin(), pulls_.end(), time,
                                       [](double asked, const Pull& pull) { return asked < pull.time; });
    ScreenPoint centre = detail::middleOf(screen_);
    double zoom = 1;
    if (next != pulls_.begin()) {
        const Pull& last = *(next - 1);
        const Pull now = after(last, std::min(s_forever, time - last.time));
        centre = {now.x.place, now.y.place};
        zoom = std::max(1.0, now.zoom.place);
    }
    const ScreenRect area = zoomedArea(screen_, centre, zoom);
    return {detail::middleOf(area), zoom, area};
}

} // namespace ZULMetaData
