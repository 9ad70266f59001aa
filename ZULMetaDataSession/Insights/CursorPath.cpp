#include "ZULMetaDataSession/Insights/CursorPath.h"

#include "ZULMetaDataSession/Snapshot.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <utility>

// Everything is computed with + - * / and the square root of doubles, which are the same on every processor.

namespace ZULMetaData {

namespace {

constexpr double s_longestUsualDistance = 1;  ///< in seconds
constexpr double s_longestStay = 60;          ///< in seconds, within a movement
constexpr double s_samplesPerSecond = 120;    ///< how many points of a movement are smoothed
constexpr std::size_t s_samplesPerCorner = 4; ///< at most
constexpr double s_lowestCutoff = 0.001;      ///< in Hz
constexpr double s_twoPi = 6.283185307179586;

/// A recorded position, or one that must be passed.
struct Corner {
    double time = 0;
    ScreenPoint point;
    bool isPinned = false; ///< whether the path passes through it
};

bool areSamePoint(const ScreenPoint& left, const ScreenPoint& right) {
    return left.x == right.x && left.y == right.y;
}

ScreenPoint pointBetween(const ScreenPoint& from, const ScreenPoint& to, double part) {
    return {from.x + (to.x - from.x) * part, from.y + (to.y - from.y) * part};
}

/// Returns the point on the other side of `centre`.
ScreenPoint mirroredPoint(const ScreenPoint& point, const ScreenPoint& centre) {
    return {2 * centre.x - point.x, 2 * centre.y - point.y};
}

/// Returns the positions through which the path passes, ordered by their times, one for each time.
std::vector<Corner> pinsOf(const std::vector<Click>& clicks) {
    std::vector<Corner> pins;
    const auto add = [&pins](double time, const std::optional<Point>& position) {
        if (position && std::isfinite(time))
            pins.push_back({time, *position, true});
    };
    for (const Click& click : clicks) {
        add(click.start, click.position);
        if (click.isDrag && click.isReleased)
            add(click.end, click.endPosition);
    }
    std::stable_sort(pins.begin(), pins.end(),
                     [](const Corner& left, const Corner& right) { return left.time < right.time; });
    std::vector<Corner> lastOfEach;
    for (const Corner& pin : pins) {
        if (!lastOfEach.empty() && lastOfEach.back().time == pin.time)
            lastOfEach.pop_back();
        lastOfEach.push_back(pin);
    }
    return lastOfEach;
}

/// Smooths samples at equal distances, forward and backward.
class ZeroPhaseFilter {
public:
    ZeroPhaseFilter(const CursorPathOptions& options, double distance) : options_(options), distance_(distance) {}

    void smooth(std::vector<ScreenPoint>& samples) {
        weights_.assign(samples.size(), weightOf(options_.speedCutoff));
        std::vector<ScreenPoint> speeds = speedsOf(samples);
        runBothWays(speeds);
        for (std::size_t i = 0; i < samples.size(); ++i)
            weights_[i] = weightOf(options_.minCutoff + options_.beta * lengthOf(speeds[i]));
        runBothWays(samples);
    }

private:
    static double lengthOf(const ScreenPoint& vector) { return std::sqrt(vector.x * vector.x + vector.y * vector.y); }

    /// Returns the weight of a new sample for a cutoff frequency.
    double weightOf(double cutoff) const {
        const double turn = s_twoPi * std::max(s_lowestCutoff, cutoff) * distance_;
        return 1 / (1 + 1 / turn); // also if it is infinite
    }

    std::vector<ScreenPoint> speedsOf(const std::vector<ScreenPoint>& samples) const {
        std::vector<ScreenPoint> speeds(samples.size());
        for (std::size_t i = 0; i < samples.size(); ++i) {
            const std::size_t first = i == 0 ? 0 : i - 1;
            const std::size_t last = std::min(i + 1, samples.size() - 1);
            const double time = static_cast<double>(last - first) * distance_;
            speeds[i] = {(samples[last].x - samples[first].x) / time, (samples[last].y - samples[first].y) / time};
        }
        return speeds;
    }

    void runForward(std::vector<ScreenPoint>& samples) const {
        for (std::size_t i = 1; i < samples.size(); ++i)
            samples[i] = pointBetween(samples[i - 1], samples[i], weights_[i]);
    }

    void runBackward(std::vector<ScreenPoint>& samples) const {
        for (std::size_t i = samples.size() - 1; i > 0; --i)
            samples[i - 1] = pointBetween(samples[i], samples[i - 1], weights_[i - 1]);
    }

    /// Takes the mean of both orders, so that a path and its reverse are smoothed alike.
    void runBothWays(std::vector<ScreenPoint>& samples) {
        other_ = samples;
        runForward(samples);
        runBackward(samples);
        runBackward(other_);
        runForward(other_);
        for (std::size_t i = 0; i < samples.size(); ++i)
            samples[i] = {(samples[i].x + other_[i].x) / 2, (samples[i].y + other_[i].y) / 2};
    }

    const CursorPathOptions& options_;
    double distance_; ///< between two samples, in seconds
    std::vector<double> weights_;
    std::vector<ScreenPoint> other_;
};

/// A movement from one pinned corner to the next.
class Movement {
public:
    explicit Movement(const std::vector<Corner>& corners) : corners_(corners) {
        if (isStraight())
            return;
        const auto most = static_cast<double>(s_samplesPerCorner * corners.size());
        steps_ = static_cast<std::size_t>(std::clamp(std::ceil(duration() * s_samplesPerSecond), 1.0, most));
    }

    std::size_t steps() const { return steps_; }

    double timeOf(std::size_t step) const {
        const double time = corners_.front().time + static_cast<double>(step) * distance();
        return step == steps_ ? corners_.back().time : std::min(time, corners_.back().time);
    }

    /// Returns the smoothed points at all steps. The first and the last are those of the corners.
    std::vector<ScreenPoint> smoothed(const CursorPathOptions& options) const {
        std::vector<ScreenPoint> points = sampled();
        if (isStraight())
            return points;
        const std::size_t margin = marginFor(options);
        std::vector<ScreenPoint> samples = extended(points, margin);
        ZeroPhaseFilter(options, distance()).smooth(samples);
        const ScreenPoint atStart = missing(points.front(), samples[margin]);
        const ScreenPoint atEnd = missing(points.back(), samples[margin + steps_]);
        for (std::size_t i = 1; i < steps_; ++i) {
            const ScreenPoint add = pointBetween(atStart, atEnd, static_cast<double>(i) / static_cast<double>(steps_));
            points[i] = {samples[margin + i].x + add.x, samples[margin + i].y + add.y};
        }
        return points;
    }

private:
    bool isStraight() const { return corners_.size() < 3 || duration() <= 0; }
    double duration() const { return corners_.back().time - corners_.front().time; }
    double distance() const { return duration() / static_cast<double>(steps_); }

    static ScreenPoint missing(const ScreenPoint& wanted, const ScreenPoint& point) {
        return {wanted.x - point.x, wanted.y - point.y};
    }

    std::vector<ScreenPoint> sampled() const {
        std::vector<ScreenPoint> points(steps_ + 1);
        std::size_t next = 1;
        for (std::size_t i = 0; i < steps_; ++i) {
            const double time = timeOf(i);
            while (next + 1 < corners_.size() && corners_[next].time <= time)
                ++next;
            const Corner& from = corners_[next - 1];
            const Corner& to = corners_[next];
            points[i] = time < to.time ? pointBetween(from.point, to.point, (time - from.time) / (to.time - from.time))
                                       : to.point;
        }
        points.front() = corners_.front().point;
        points.back() = corners_.back().point;
        return points;
    }

    /// Returns how many samples before and after the movement the filter needs, as far as there are any.
    std::size_t marginFor(const CursorPathOptions& options) const {
        const double memory = 1 / std::max(s_lowestCutoff, options.minCutoff);
        return static_cast<std::size_t>(std::min(std::ceil(memory / distance()), static_cast<double>(steps_)));
    }

    /// Continues the movement on both sides by its own image, turned around the end. The filter then leaves the ends
    /// where they are.
    std::vector<ScreenPoint> extended(const std::vector<ScreenPoint>& points, std::size_t margin) const {
        std::vector<ScreenPoint> samples(points.size() + 2 * margin);
        std::copy(points.begin(), points.end(), samples.begin() + static_cast<std::ptrdiff_t>(margin));
        for (std::size_t i = 1; i <= margin; ++i) {
            samples[margin - i] = mirroredPoint(points[i], points.front());
            samples[margin + steps_ + i] = mirroredPoint(points[steps_ - i], points.back());
        }
        return samples;
    }

    const std::vector<Corner>& corners_;
    std::size_t steps_ = 1;
};

/// Takes corners in the order of their times and makes the path of them.
class PathMaker {
public:
    PathMaker(const CursorPathOptions& options, double usualDistance, std::vector<double>& times,
              std::vector<ScreenPoint>& points)
        : options_(options), usualDistance_(usualDistance), times_(times), points_(points) {}

    void add(const Corner& corner) {
        if (!stay_.empty() && !areSamePoint(stay_.back().point, corner.point)) {
            stayUntilTheMoveTo(corner);
            endStay();
        }
        stay(corner);
    }

    void finish() {
        if (stay_.empty())
            return;
        stay_.back().isPinned = true;
        endStay();
    }

private:
    /// If nothing was recorded for long, the cursor moved at the end of that time.
    void stayUntilTheMoveTo(const Corner& corner) {
        const double last = stay_.back().time;
        if (corner.time - last > 2 * usualDistance_)
            stay({corner.time - usualDistance_, stay_.back().point, false});
    }

    /// Keeps the first, the last and the pinned corners at one position. The others do not matter.
    void stay(const Corner& corner) {
        if (stay_.size() > 1 && !stay_.back().isPinned)
            stay_.back() = corner;
        else
            stay_.push_back(corner);
    }

    /// Passes the corners at one position on.
    void endStay() {
        const bool isRest = stay_.back().time - stay_.front().time >= std::min(options_.rest, s_longestStay);
        stay_.front().isPinned |= isRest || times_.empty();
        stay_.back().isPinned |= isRest;
        for (const Corner& corner : stay_)
            move(corner);
        stay_.clear();
    }

    void move(const Corner& corner) {
        movement_.push_back(corner);
        if (!corner.isPinned)
            return;
        if (movement_.size() == 1) {
            append(corner.time, corner.point);
            return;
        }
        const Movement movement(movement_);
        const std::vector<ScreenPoint> points = movement.smoothed(options_);
        for (std::size_t i = 1; i <= movement.steps(); ++i)
            append(movement.timeOf(i), points[i]);
        movement_.assign(1, corner);
    }

    void append(double time, const ScreenPoint& point) {
        times_.push_back(time);
        points_.push_back(point);
    }

    const CursorPathOptions& options_;
    double usualDistance_;
    std::vector<double>& times_;
    std::vector<ScreenPoint>& points_;
    std::vector<Corner> stay_;     ///< the last corners, which are at one position
    std::vector<Corner> movement_; ///< the corners since the last pinned one
};

} // namespace

CursorPath::CursorPath(const Track<CursorLocationKind>& positions, const std::vector<Click>& clicks,
                       const CursorPathOptions& options) {
    const std::span<const double> times = positions.times();
    PathMaker maker(options, std::min(usualDistance(times), s_longestUsualDistance), times_, points_);
    const std::vector<Corner> pins = pinsOf(clicks);
    auto pin = pins.begin();
    for (std::size_t i = 0; i < times.size(); ++i) {
        if (i + 1 < times.size() && times[i + 1] == times[i])
            continue; // the last of them counts
        for (; pin != pins.end() && pin->time < times[i]; ++pin)
            maker.add(*pin);
        if (pin != pins.end() && pin->time == times[i])
            maker.add(*pin++);
        else
            maker.add({times[i], positions.values()[i], false});
    }
    for (; pin != pins.end(); ++pin)
        maker.add(*pin);
    maker.finish();
}

std::optional<ScreenPoint> CursorPath::at(double time) const {
    if (empty())
        return std::nullopt;
    const auto after = std::upper_bound(times_.begin(), times_.end(), time);
    const auto next = static_cast<std::size_t>(after - times_.begin());
    if (next == 0 || next == times_.size())
        return next == 0 ? points_.front() : points_.back();
    const ScreenPoint& from = points_[next - 1];
    if (areSamePoint(from, points_[next]))
        return from;
    return pointBetween(from, points_[next], (time - times_[next - 1]) / (times_[next] - times_[next - 1]));
}

std::vector<ScreenPoint> CursorPath::resampled(double start, double rate, std::size_t count) const {
    std::vector<ScreenPoint> points;
    if (empty())
        return points;
    points.reserve(count);
    for (std::size_t i = 0; i < count; ++i)
        points.push_back(*at(start + static_cast<double>(i) / rate));
    return points;
}

} // namespace ZULMetaData
