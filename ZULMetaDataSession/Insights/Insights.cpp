#include "ZULMetaDataSession/Insights/Insights.h"

#include "ZULMetaDataSession/Insights/ScreenGeometry.h"
#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <optional>

namespace ZULMetaData {

namespace {

constexpr double s_longestDuration = 366.0 * 86400; ///< in seconds; a later time is damaged

template <class... Kinds>
double lastTimeOf(const Track<Kinds>&... tracks) {
    double last = 0;
    ((last = tracks.empty() ? last : std::max(last, tracks.times().back())), ...);
    return std::min(last, s_longestDuration);
}

double durationOf(const Recording& recording, const InsightSources& sources) {
    const double told = recording.duration().value_or(0);
    return told > 0 ? told
                    : lastTimeOf(sources.positions, sources.actions, sources.keys, sources.scrolling, sources.windows,
                                 sources.titles, sources.applications, sources.slides);
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
    sources.duration = durationOf(recording, sources);
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
