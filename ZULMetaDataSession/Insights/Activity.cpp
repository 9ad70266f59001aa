#include "ZULMetaDataSession/Insights/Activity.h"

#include "ZULMetaDataSession/Insights/Insights.h"
#include "ZULMetaDataSession/Insights/ScreenGeometry.h"
#include "ZULMetaDataSession/Snapshot.h"

#include <algorithm>
#include <map>
#include <optional>
#include <span>
#include <string_view>

namespace ZULMetaData {

namespace {

/// A span within a recording.
class SpanWithin {
public:
    SpanWithin(const ActivitySpan& span, double duration)
        : start_(std::clamp(span.start, 0.0, duration)), end_(std::clamp(span.end, start_, duration)),
          containsEnd_(span.end >= duration && (span.start < duration || duration == 0)) {}

    double start() const { return start_; }
    double end() const { return end_; }

    bool contains(double time) const { return time >= start_ && (time < end_ || (containsEnd_ && time == end_)); }

    /// Returns how much of a time is in the span.
    double partOf(double start, double end) const {
        return std::max(0.0, std::min(end, end_) - std::max(start, start_));
    }

    std::size_t count(std::span<const double> times) const {
        return static_cast<std::size_t>(
            std::count_if(times.begin(), times.end(), [&](double time) { return contains(time); }));
    }

private:
    double start_;
    double end_;
    bool containsEnd_;
};

double distanceIn(const Track<CursorLocationKind>& positions, const SpanWithin& span) {
    const double usual = usualDistance(positions.times());
    const auto placeAt = [&](double time) { return cursorPositionAt(positions, time, Interpolation::Linear, usual); };
    std::optional<ScreenPoint> before = placeAt(span.start());
    double distance = 0;
    const auto moveTo = [&](const ScreenPoint& place) {
        if (before)
            distance += detail::distanceBetween(*before, place);
        before = place;
    };
    const std::span<const double> times = positions.times();
    const auto first = std::upper_bound(times.begin(), times.end(), span.start());
    for (auto time = first; time != times.end() && *time <= span.end(); ++time)
        moveTo(detail::screenPoint(positions.values()[static_cast<std::size_t>(time - times.begin())]));
    if (const std::optional<ScreenPoint> last = placeAt(span.end()))
        moveTo(*last);
    return distance;
}

std::vector<ApplicationTime> applicationsIn(const Track<TopmostAppNameKind>& applications, double duration,
                                            const SpanWithin& span) {
    std::map<std::string_view, ApplicationTime> byName;
    for (std::size_t i = 0; i < applications.size(); ++i) {
        const double start = applications.times()[i];
        const double end = i + 1 < applications.size() ? applications.times()[i + 1] : duration;
        const double part = span.partOf(start, end);
        if (!(part > 0))
            continue;
        const std::string_view name = applications.values()[i];
        ApplicationTime& application =
            byName.try_emplace(name, ApplicationTime{std::string(name), std::max(start, span.start()), 0})
                .first->second;
        application.duration += part;
    }
    std::vector<ApplicationTime> sorted;
    sorted.reserve(byName.size());
    for (auto& [name, application] : byName)
        sorted.push_back(std::move(application));
    std::stable_sort(sorted.begin(), sorted.end(), [](const ApplicationTime& left, const ApplicationTime& right) {
        return left.duration != right.duration ? left.duration > right.duration : left.first < right.first;
    });
    return sorted;
}

} // namespace

Activity activityOf(const InsightSources& sources, const InsightOptions& options) {
    const SpanWithin within(options.activity, std::max(0.0, sources.duration));
    Activity activity;
    activity.start = within.start();
    activity.end = within.end();
    for (const Click& click : clicksOf(sources.actions, sources.positions, sources.duration, options.clicks))
        if (within.contains(click.start))
            ++activity.clicks;
    activity.keys = within.count(sources.keys.times());
    activity.scrolls = within.count(sources.scrolling.times());
    for (const IdleSpan& idle : idleSpansOf(sources.positions, sources.actions, sources.keys, sources.scrolling,
                                            sources.duration, options.idle))
        activity.idle += within.partOf(idle.start, idle.end);
    activity.distance = distanceIn(sources.positions, within);
    activity.applications = applicationsIn(sources.applications, sources.duration, within);
    return activity;
}

} // namespace ZULMetaData
