#include "ZULMetaDataSession/Insights/Insights.h"

#include "ZULMetaDataSession/Insights/ScreenGeometry.h"
#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

namespace {

constexpr double s_day = 86400;                     ///< in seconds
constexpr double s_longestDuration = 366.0 * s_day; ///< a later time is damaged
constexpr std::size_t s_mostDamaged = 64;           ///< times at the end of each stream that may be damaged

/// Returns the last times of all streams in ascending order. Streams that cannot be read have none.
std::vector<double> lastTimesOf(const Recording& recording) {
    std::vector<double> last;
    RecordedKinds::forEach([&]<class Kind>() {
        try {
            const std::span<const double> times = recording.track<Kind>().times();
            const auto looked = times.last(std::min(times.size(), s_mostDamaged));
            last.insert(last.end(), looked.begin(), looked.end());
        } catch (const Error&) { // which `insightSourcesOf` reports if it needs the stream
        }
    });
    std::sort(last.begin(), last.end());
    return last;
}

/// Returns the last time that is not damaged. A damaged time is later than a day, and ten times as late as all others.
/// The times are in ascending order.
double believableEnd(const std::vector<double>& times) {
    double end = times.empty() ? 0 : times.front();
    for (const double time : times) {
        const bool isFar = time > s_day && time > 10 * std::max(1.0, end);
        if (isFar && time != times.front())
            break;
        end = time;
    }
    return std::clamp(end, 0.0, s_longestDuration);
}

double durationOf(const Recording& recording) {
    const double told = recording.duration().value_or(0);
    return told > 0 ? told : believableEnd(lastTimesOf(recording));
}

} // namespace

InsightSources insightSourcesOf(const Recording& recording, const Callback<void(const Error& error)>& leaveOut) {
    InsightSources sources;
    Track<RecordingRegionKind> regions;
    const auto read = [&]<class Kind>(Track<Kind>& track) {
        try {
            track = recording.track<Kind>();
        } catch (const Error& error) {
            leaveOut(error);
        }
    };
    read(sources.positions);
    read(sources.actions);
    read(sources.keys);
    read(sources.scrolling);
    read(sources.windows);
    read(sources.titles);
    read(sources.applications);
    read(sources.slides);
    read(regions);
    if (const std::optional<Rect> region = detail::areaOf(regions, {}).region)
        sources.screen = detail::screenRect(*region);
    sources.duration = durationOf(recording);
    return sources;
}

Insights insightsOf(const InsightSources& sources, const InsightOptions& options) {
    Insights insights;
    const double duration = sources.duration;
    insights.duration = duration;
    insights.screen = sources.screen;
    insights.clicks = clicksOf(sources.actions, sources.positions, duration, options.clicks);
    insights.captions = keyCaptions(sources.keys, options.captions, duration);
    insights.idle =
        idleSpansOf(sources.positions, sources.actions, sources.keys, sources.scrolling, duration, options.idle);
    insights.chapters = chaptersOf(sources.titles, sources.applications, sources.slides, duration, options.chapters);
    insights.path = CursorPath(sources.positions, insights.clicks, options.path);
    insights.zooms = zoomsOf(insights.clicks, sources.keys, sources.positions, sources.windows, sources.screen,
                             duration, options.zooms);
    insights.camera = Camera(insights.zooms, insights.path, sources.screen, options.camera);
    return insights;
}

Insights insightsOf(const Recording& recording, const InsightOptions& options) {
    return insightsOf(insightSourcesOf(recording, [](const Error& error) { throw error; }), options);
}

} // namespace ZULMetaData
