#include "ZULMetaDataSession/Insights/Activity.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"
#include "ZULMetaDataSession/Insights/Insights.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <ostream>
#include <string>

namespace ZULMetaData {

static void PrintTo(const ApplicationTime& application, std::ostream* stream) {
    *stream << application.name << " from " << application.first << ", " << application.duration << " s";
}

namespace Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

Activity activityIn(const InsightSources& sources, double start, double end) {
    InsightOptions options;
    options.activity = {start, end};
    return activityOf(sources, options);
}

/// A cursor that moves by 10 units in each second, two clicks, three keys, two turns of the wheel and three
/// applications in ten seconds.
InsightSources session() {
    InsightSources sources;
    TrackEntries<CursorLocationKind> places;
    for (std::int32_t second = 0; second <= 10; ++second)
        places.push_back({static_cast<double>(second), {10 * second, 0}});
    sources.positions = positions(places);
    sources.actions = actions({{2, 1}, {2.5, 2}, {6, 4}, {6.5, 8}});
    sources.keys = keys({{1, {'a', 0}}, {3, {'b', 0}}, {10, {'c', 0}}});
    sources.scrolling = trackOf<ScrollActionKind>({{4, {0, 120}}, {5, {0, 120}}});
    sources.applications = trackOf<TopmostAppNameKind>({{1, "Editor"}, {4, "Shell"}, {5, "Editor"}, {9, "Browser"}});
    sources.duration = 10;
    return sources;
}

TEST(Activity, CountsEverythingInTheWholeRecordingIfNoSpanIsSet) {
    const Activity activity = activityOf(session(), {});
    EXPECT_EQ(activity.start, 0);
    EXPECT_EQ(activity.end, 10);
    EXPECT_EQ(activity.clicks, 2U);
    EXPECT_EQ(activity.keys, 3U);
    EXPECT_EQ(activity.scrolls, 2U);
    EXPECT_EQ(activity.distance, 100);
    EXPECT_THAT(activity.applications, ElementsAre(ApplicationTime{"Editor", 1, 7}, ApplicationTime{"Shell", 4, 1},
                                                   ApplicationTime{"Browser", 9, 1}));
}

TEST(Activity, ContainsTheStartOfASpanButNotItsEnd) {
    EXPECT_EQ(activityIn(session(), 2, 6).clicks, 1U);
    EXPECT_EQ(activityIn(session(), 1, 3).keys, 1U);
    EXPECT_EQ(activityIn(session(), 4.5, 5).scrolls, 0U);
    EXPECT_EQ(activityIn(session(), 9, 10).keys, 1U) << "the end of the recording is part of its last span";
}

TEST(Activity, MeasuresThePartsOfTheWayThatAreInTheSpan) {
    EXPECT_DOUBLE_EQ(activityIn(session(), 2.5, 4.25).distance, 17.5);
    EXPECT_DOUBLE_EQ(activityIn(session(), 0, 3.3).distance + activityIn(session(), 3.3, 10).distance, 100);
    EXPECT_EQ(activityIn(session(), 2.5, 2.5).distance, 0);
}

TEST(Activity, TakesACursorThatRestedToWhereItRested) {
    InsightSources sources;
    sources.positions = positions({{0, {0, 0}}, {1, {10, 0}}, {2, {20, 0}}, {12, {20, 30}}, {13, {20, 40}}});
    sources.duration = 13;
    EXPECT_EQ(activityIn(sources, 2, 11).distance, 0);
    EXPECT_EQ(activityIn(sources, 11, 12).distance, 30);
}

TEST(Activity, CutsApplicationsAtTheEdgesOfTheSpan) {
    EXPECT_THAT(activityIn(session(), 3, 7).applications,
                ElementsAre(ApplicationTime{"Editor", 3, 3}, ApplicationTime{"Shell", 4, 1}));
    EXPECT_THAT(activityIn(session(), 0, 1).applications, IsEmpty());
}

TEST(Activity, CutsIdleTimeAtTheEdgesOfTheSpan) {
    InsightSources sources;
    sources.keys = keys({{1, {'a', 0}}, {9, {'b', 0}}});
    sources.duration = 10;
    EXPECT_EQ(activityIn(sources, 0, 10).idle, 8);
    EXPECT_EQ(activityIn(sources, 3, 5).idle, 2);
    EXPECT_EQ(activityIn(sources, 8, 10).idle, 1);
}

TEST(Activity, CountsTheEndOfTheRecordingOnce) {
    InsightSources sources;
    sources.keys = keys({{10, {'a', 0}}});
    sources.duration = 10;
    EXPECT_EQ(activityIn(sources, 5, 10).keys, 1U);
    EXPECT_EQ(activityIn(sources, 10, 20).keys, 0U);
    EXPECT_EQ(activityIn(sources, 12, 15).keys, 0U);
}

TEST(Activity, LiesWithinTheRecording) {
    const Activity activity = activityIn(session(), -5, 1e300);
    EXPECT_EQ(activity.start, 0);
    EXPECT_EQ(activity.end, 10);
    EXPECT_EQ(activityIn(session(), 12, 15).end, 10);
    EXPECT_EQ(activityIn(session(), 6, 2).end, 6);
}

TEST(Activity, SurvivesAnything) {
    InsightSources sources = session();
    sources.positions = positions({{-1e300, {INT32_MIN, INT32_MIN}}, {1e300, {INT32_MAX, INT32_MAX}}});
    const double nothing = std::numeric_limits<double>::quiet_NaN();
    for (const double duration : {0.0, -1.0, nothing})
        for (const double time : {0.0, nothing, std::numeric_limits<double>::infinity()}) {
            sources.duration = duration;
            EXPECT_EQ(activityIn(sources, time, time).scrolls, 0U);
        }
    EXPECT_EQ(activityOf({}, {}).distance, 0);
}

} // namespace
} // namespace Test
} // namespace ZULMetaData
