#include "ZULMetaDataSession/Insights/Clicks.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr double s_end = 100;
constexpr std::int32_t s_leftDown = 1;
constexpr std::int32_t s_leftUp = 2;
constexpr std::int32_t s_rightDown = 4;
constexpr std::int32_t s_rightUp = 8;
constexpr std::int32_t s_middleDown = 16;
constexpr std::int32_t s_middleUp = 32;
constexpr std::int32_t s_shift = 16;
constexpr std::int32_t s_command = 128;

const Track<CursorLocationKind> s_nowhere;

/// A press and a release after 0.1 s for each time.
Track<CursorActionKind> clicksAt(const std::vector<double>& times) {
    std::vector<std::pair<double, std::int32_t>> entries;
    for (const double time : times) {
        entries.emplace_back(time, s_leftDown);
        entries.emplace_back(time + 0.1, s_leftUp);
    }
    return actions(entries);
}

std::vector<int> countsOf(const std::vector<Click>& clicks) {
    std::vector<int> counts;
    for (const Click& click : clicks)
        counts.push_back(click.count);
    return counts;
}

std::vector<double> endsOf(const std::vector<Click>& clicks) {
    std::vector<double> ends;
    for (const Click& click : clicks)
        ends.push_back(click.end);
    return ends;
}

TEST(Clicks, LastFromThePressToTheRelease) {
    const std::vector<Click> clicks =
        clicksOf(actions({{0, 256}, {1, s_leftDown | s_shift | s_command}, {1.25, s_leftUp}}),
                 positions({{0, {10, 20}}, {1, {11, 21}}, {1.2, {12, 22}}}), s_end);
    Click expected;
    expected.start = 1;
    expected.end = 1.25;
    expected.modifiers = {Modifier::Shift, Modifier::Command};
    expected.position = Point(11, 21);
    expected.endPosition = Point(12, 22);
    EXPECT_THAT(clicks, ElementsAre(expected));
}

TEST(Clicks, AreNoneWithoutAPress) {
    EXPECT_THAT(clicksOf({}, {}, s_end), IsEmpty());
    EXPECT_THAT(clicksOf(actions({{0, 256}, {1, s_leftUp}, {2, 0}}), s_nowhere, s_end), IsEmpty());
}

TEST(Clicks, HaveThePositionOfTheLastEntryUntilThen) {
    const Track<CursorLocationKind> track = positions({{1, {1, 1}}, {2, {2, 2}}});
    const std::vector<Click> clicks = clicksOf(clicksAt({0.5, 1.5, 50}), track, s_end);
    ASSERT_EQ(clicks.size(), 3U);
    EXPECT_EQ(clicks[0].position, std::nullopt);
    EXPECT_EQ(clicks[0].endPosition, std::nullopt);
    EXPECT_EQ(clicks[1].position, Point(1, 1));
    EXPECT_EQ(clicks[2].position, Point(2, 2));
}

TEST(Clicks, OfTwoButtonsMayOverlap) {
    const std::vector<Click> clicks = clicksOf(
        actions({{1, s_leftDown}, {2, s_rightDown}, {3, s_middleDown}, {4, s_leftUp}, {5, s_middleUp}, {6, s_rightUp}}),
        s_nowhere, s_end);
    ASSERT_EQ(clicks.size(), 3U);
    EXPECT_EQ(clicks[0].button, MouseButton::Left);
    EXPECT_EQ(clicks[1].button, MouseButton::Right);
    EXPECT_EQ(clicks[2].button, MouseButton::Middle);
    EXPECT_THAT(endsOf(clicks), ElementsAre(4, 6, 5));
}

TEST(Clicks, EndASecondAfterAPressThatWasNeverReleased) {
    const std::vector<Click> clicks = clicksOf(actions({{1, s_leftDown}}), s_nowhere, s_end);
    EXPECT_THAT(endsOf(clicks), ElementsAre(2));
    EXPECT_FALSE(clicks[0].isReleased);
    ClickOptions options;
    options.unreleased = 5;
    EXPECT_THAT(endsOf(clicksOf(actions({{1, s_leftDown}}), s_nowhere, s_end, options)), ElementsAre(6));
}

TEST(Clicks, WithoutAReleaseEndWithTheRecordingOrTheNextPress) {
    EXPECT_THAT(endsOf(clicksOf(actions({{1, s_leftDown}}), s_nowhere, 1.5)), ElementsAre(1.5));
    EXPECT_THAT(endsOf(clicksOf(actions({{2, s_leftDown}}), s_nowhere, 1.5)), ElementsAre(2));
    const std::vector<Click> clicks =
        clicksOf(actions({{1, s_leftDown}, {1.5, s_leftDown}, {9, s_leftDown}, {9.1, s_leftUp}}), s_nowhere, s_end);
    EXPECT_THAT(endsOf(clicks), ElementsAre(1.5, 2.5, 9.1));
    EXPECT_FALSE(clicks[1].isReleased);
    EXPECT_TRUE(clicks[2].isReleased);
}

TEST(Clicks, ThatFollowQuicklyAreCounted) {
    EXPECT_THAT(countsOf(clicksOf(clicksAt({1, 1.5, 2, 2.75, 3}), s_nowhere, s_end)), ElementsAre(1, 2, 3, 1, 2));
    ClickOptions options;
    options.multipleTime = 0.25;
    EXPECT_THAT(countsOf(clicksOf(clicksAt({1, 1.5, 2, 2.75, 3}), s_nowhere, s_end, options)),
                ElementsAre(1, 1, 1, 1, 2));
}

TEST(Clicks, FarFromEachOtherAreNotCountedTogether) {
    const Track<CursorLocationKind> track = positions({{0, {0, 0}}, {1.2, {3, 4}}, {1.7, {9, 4}}});
    EXPECT_THAT(countsOf(clicksOf(clicksAt({1, 1.5, 2}), track, s_end)), ElementsAre(1, 2, 1));
    ClickOptions options;
    options.multipleDistance = 6;
    EXPECT_THAT(countsOf(clicksOf(clicksAt({1, 1.5, 2}), track, s_end, options)), ElementsAre(1, 2, 3));
}

TEST(Clicks, OfAnotherButtonAreNotCountedTogether) {
    const std::vector<Click> clicks =
        clicksOf(actions({{1, s_leftDown}, {1.1, s_leftUp}, {1.2, s_rightDown}, {1.3, s_rightUp}, {1.4, s_leftDown}}),
                 s_nowhere, s_end);
    EXPECT_THAT(countsOf(clicks), ElementsAre(1, 1, 1));
}

TEST(Clicks, AreDragsIfTheCursorMovesFarBeforeTheRelease) {
    const auto isDrag = [](const TrackEntries<CursorLocationKind>& entries, const ClickOptions& options = {}) {
        return clicksOf(clicksAt({1}), positions(entries), s_end, options).at(0).isDrag;
    };
    EXPECT_TRUE(isDrag({{0, {0, 0}}, {1.05, {9, 0}}, {1.1, {0, 0}}})) << "also if it comes back";
    EXPECT_FALSE(isDrag({{0, {0, 0}}, {1.05, {8, 0}}}));
    EXPECT_FALSE(isDrag({{0, {0, 0}}, {1.15, {9, 0}}})) << "after the release";
    EXPECT_FALSE(isDrag({{0, {-9, 0}}, {0.9, {0, 0}}})) << "before the press";
    EXPECT_FALSE(isDrag({{1.05, {0, 0}}, {1.06, {50, 0}}})) << "from nobody knows where";
    ClickOptions options;
    options.dragDistance = 3;
    EXPECT_TRUE(isDrag({{0, {0, 0}}, {1.05, {8, 0}}}, options));
}

TEST(Clicks, AfterADragBeginToCountAgain) {
    const Track<CursorLocationKind> track = positions({{0, {0, 0}}, {1.05, {20, 0}}, {1.2, {0, 0}}});
    EXPECT_THAT(countsOf(clicksOf(clicksAt({1, 1.25}), track, s_end)), ElementsAre(1, 1));
}

TEST(Clicks, AreOrderedByTheirTimes) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const std::vector<Click> clicks =
        clicksOf(actions({{3, s_leftUp}, {1, s_leftDown}, {nan, s_leftDown}, {2.5, s_leftDown}, {2, s_leftUp}}),
                 s_nowhere, s_end);
    EXPECT_THAT(endsOf(clicks), ElementsAre(2, 3));
}

TEST(Clicks, KeepOddNumbersApart) {
    constexpr std::int32_t low = std::numeric_limits<std::int32_t>::min();
    constexpr std::int32_t high = std::numeric_limits<std::int32_t>::max();
    const std::vector<Click> clicks = clicksOf(actions({{-1e300, s_leftDown}, {-1, s_leftUp}, {1e300, s_leftDown}}),
                                               positions({{-1e300, {low, low}}, {-2, {high, high}}}), s_end);
    ASSERT_EQ(clicks.size(), 2U);
    EXPECT_TRUE(clicks[0].isDrag);
    EXPECT_EQ(clicks[0].position, Point(low, low));
    EXPECT_EQ(clicks[1].end, 1e300);
    EXPECT_EQ(clicks[1].count, 1);
}

TEST(Clicks, MayBeAMillionAtOneTime) {
    constexpr int count = 1'000'000;
    const std::vector<double> times(count, 1);
    const Track<CursorActionKind> presses(times, std::vector<ButtonAction>(count, buttonActionOf(s_leftDown)));
    const Track<CursorLocationKind> places(times, std::vector<Point>(count, Point(1, 2)));
    const std::vector<Click> clicks = clicksOf(presses, places, s_end);
    ASSERT_EQ(clicks.size(), 1'000'000U);
    EXPECT_EQ(clicks.front().end, 1);
    EXPECT_EQ(clicks.back().end, 2);
    EXPECT_EQ(clicks.back().count, count);
}

} // namespace
} // namespace ZULMetaData::Test
