#include "ZULMetaDataSession/Insights/Insights.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaDataSession/Insights/Tracks.h"
#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

constexpr std::int32_t s_leftDown = 1;
constexpr std::int32_t s_leftUp = 2;

/// A minute with one click, three keys and two windows.
InsightSources aMinute() {
    InsightSources sources;
    sources.positions = positions({{0, {100, 100}}, {9, {100, 100}}, {9.5, {900, 500}}});
    sources.actions = actions({{0, 256}, {10, s_leftDown}, {10.1, s_leftUp}});
    sources.keys = keys({{20, {'a', 0}}, {20.2, {'b', 0}}, {20.4, {'c', 0}}});
    sources.scrolling = trackOf<ScrollActionKind>({{50, {0, 120}}});
    sources.windows = trackOf<TopmostWindowKind>({{0, {0, 0, 1920, 1080}}});
    sources.titles = trackOf<TopmostWindowTitleKind>({{0, "Mail"}, {30, "Code"}});
    sources.applications = trackOf<TopmostAppNameKind>({{0, "Post"}, {30, "Editor"}});
    sources.screen = {0, 0, 1920, 1080};
    sources.duration = 60;
    return sources;
}

std::string actionStream(const std::vector<std::pair<double, std::int32_t>>& entries) {
    std::string stream = streamHeader("2b7b6af0", 1, 12);
    for (const auto& [time, stored] : entries)
        stream += f64(time) + le32(static_cast<std::uint32_t>(stored));
    return stream;
}

std::string regionStream(const std::vector<Rect>& regions) {
    std::string stream = streamHeader("2b7b6af6", 1, 24);
    for (const Rect& rect : regions)
        stream += f64(0) + raw(rect.x) + raw(rect.y) + raw(rect.width) + raw(rect.height);
    return stream;
}

TEST(Insights, TellEverythingAtOnce) {
    const InsightSources sources = aMinute();
    const Insights insights = insightsOf(sources);
    EXPECT_EQ(insights.duration, 60);
    EXPECT_EQ(insights.screen.width, 1920);
    EXPECT_THAT(insights.clicks, ElementsAre(clicksOf(sources.actions, sources.positions, 60).at(0)));
    EXPECT_THAT(insights.captions, SizeIs(1));
    EXPECT_EQ(insights.captions[0].text, "\xe2\x80\xa2\xe2\x80\xa2\xe2\x80\xa2");
    EXPECT_THAT(insights.idle, ElementsAre(IdleSpan{0, 9.5}, IdleSpan{10.1, 20}, IdleSpan{20.4, 50}, IdleSpan{50, 60}));
    EXPECT_THAT(insights.chapters, SizeIs(2));
    EXPECT_EQ(insights.path.at(10)->x, 900);
    ASSERT_THAT(insights.zooms, SizeIs(2));
    EXPECT_EQ(insights.zooms[1].places[0].reason, ZoomReason::Typing);
    EXPECT_NEAR(insights.camera.at(11.5).zoom, 1.5, 0.01);
    EXPECT_EQ(insights.camera.at(0).area.width, 1920);
}

TEST(Insights, PassEveryOptionOn) {
    InsightOptions options;
    options.clicks.dragDistance = 0;
    options.captions.showsKeys = true;
    options.idle.least = 10;
    options.chapters.least = 40;
    options.zooms.factor = 3;
    options.camera.settleTime = 0.001;
    InsightSources sources = aMinute();
    sources.positions = positions({{0, {100, 100}}, {0.1, {110, 130}}, {0.2, {300, 140}}, {10.05, {900, 500}}});
    const Insights insights = insightsOf(sources, options);
    EXPECT_TRUE(insights.clicks.at(0).isDrag);
    EXPECT_EQ(insights.captions.at(0).text, "abc");
    EXPECT_THAT(insights.idle, ElementsAre(IdleSpan{20.4, 50}, IdleSpan{50, 60}));
    EXPECT_THAT(insights.chapters, SizeIs(1));
    EXPECT_EQ(insights.zooms.at(0).factor, 3);
    EXPECT_NEAR(insights.camera.at(9.7).zoom, 3, 1e-9);
    options.path.minCutoff = 20;
    EXPECT_NE(insightsOf(sources, options).path.at(0.1)->y, insights.path.at(0.1)->y);
}

TEST(Insights, HaveNoZoomsWithoutAScreen) {
    InsightSources sources = aMinute();
    sources.screen = {};
    const Insights insights = insightsOf(sources);
    EXPECT_THAT(insights.zooms, IsEmpty());
    EXPECT_THAT(insights.clicks, SizeIs(1));
    EXPECT_EQ(insights.camera.at(10).zoom, 1);
}

TEST(Insights, AreEmptyIfNothingWasRecorded) {
    const MemoryRecording recording(media());
    const Insights insights = insightsOf(*recording);
    EXPECT_EQ(insights.duration, 0);
    EXPECT_THAT(insights.clicks, IsEmpty());
    EXPECT_THAT(insights.captions, IsEmpty());
    EXPECT_THAT(insights.idle, IsEmpty());
    EXPECT_THAT(insights.chapters, IsEmpty());
    EXPECT_TRUE(insights.path.empty());
    EXPECT_THAT(insights.zooms, IsEmpty());
    EXPECT_EQ(insights.camera.at(0).area.width, 0);
}

TEST(Insights, AreReadFromARecording) {
    const MemoryRecording recording(
        movieOf({actionStream({{1, s_leftDown}, {1.5, s_leftUp}, {20, s_leftDown}}),
                 streamHeader(s_cursorLocations, 1, 16) + pointEntry(0, 10, 20) + pointEntry(30, 5, 5),
                 regionStream({{0, 0, 800, 600}, {10, 0, 400, 300}, {0, 0, 0, 300}})}));
    const Insights insights = insightsOf(*recording);
    EXPECT_EQ(insights.duration, 30) << "the last entry";
    EXPECT_EQ(insights.screen.x, 10) << "the last region with an area";
    ASSERT_THAT(insights.clicks, SizeIs(2));
    EXPECT_EQ(insights.clicks[0].position, Point(10, 20));
    EXPECT_THAT(insights.zooms, SizeIs(2));
}

TEST(Insights, LastAtMostAYearIfTheMovieTellsNoDuration) {
    const MemoryRecording recording(movieOf({actionStream({{1e300, s_leftDown}, {1e300, s_leftUp}})}));
    const Insights insights = insightsOf(*recording);
    EXPECT_EQ(insights.duration, 366 * 86400);
}

TEST(Insights, LastUntilTheLastEntryOfAnyKind) {
    const std::string cpuUsage = streamHeader("2b7b6a08", 1, 12) + f64(40) + raw(0.5F);
    const MemoryRecording recording(movieOf({actionStream({{1, s_leftDown}, {2, s_leftUp}}), cpuUsage}));
    EXPECT_EQ(insightsOf(*recording).duration, 40);
}

double durationWith(const std::vector<double>& times) {
    std::vector<std::pair<double, std::int32_t>> entries{{1, s_leftDown}, {8, s_leftUp}};
    for (const double time : times)
        entries.emplace_back(time, s_leftDown);
    const MemoryRecording recording(movieOf({actionStream(entries)}));
    return insightsOf(*recording).duration;
}

TEST(Insights, LastNoLongerForADamagedTime) {
    EXPECT_EQ(durationWith({25.5}), 25.5);
    EXPECT_EQ(durationWith({1e9}), 8);
    EXPECT_EQ(durationWith({9, 1e9, 2e9, 1e300}), 9);
    EXPECT_EQ(durationWith({30000, 50000, 90000, 100000}), 100000);
}

TEST(Insights, FailIfATrackCannotBeRead) {
    const MemoryRecording recording(movieOf({streamHeader("2b7b6af0", 9, 12), regionStream({{0, 0, 800, 600}})}));
    EXPECT_THROW(insightsOf(*recording), Error);
    std::vector<std::string> errors;
    const InsightSources sources =
        insightSourcesOf(*recording, [&](const Error& error) { errors.emplace_back(error.what()); });
    EXPECT_THAT(errors, ElementsAre(HasSubstr("cursorAction has version 9")));
    EXPECT_TRUE(sources.actions.empty());
    EXPECT_EQ(sources.screen.width, 800);
}

} // namespace
} // namespace ZULMetaData::Test
