#include "ZULMetaDataSession/Insights/CursorSpeed.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <ostream>

namespace ZULMetaData {

static void PrintTo(const CursorSpeed& speed, std::ostream* stream) {
    *stream << speed.speed << " from " << speed.start;
}

namespace Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::int32_t s_far = std::numeric_limits<std::int32_t>::max();

std::vector<CursorSpeed> speedsOf(const TrackEntries<CursorLocationKind>& entries) {
    return cursorSpeedsOf(positions(entries));
}

/// Returns the speeds of a cursor that is 10 units farther to the right at each of these times.
std::vector<CursorSpeed> speedsOfSteps(const std::vector<double>& times) {
    TrackEntries<CursorLocationKind> entries;
    for (const double time : times)
        entries.push_back({time, {10 * static_cast<std::int32_t>(entries.size()), 0}});
    return speedsOf(entries);
}

TEST(CursorSpeed, IsUnknownWithoutAnyPosition) {
    EXPECT_THAT(speedsOf({}), IsEmpty());
}

TEST(CursorSpeed, IsThatOfTheWayToTheNextPosition) {
    EXPECT_THAT(speedsOf({{0, {0, 0}}, {0.5, {30, 40}}, {1, {30, 30}}, {1.5, {30, 30}}}),
                ElementsAre(CursorSpeed{0, 100}, CursorSpeed{0.5, 20}, CursorSpeed{1, 0}, CursorSpeed{1.5, 0}));
}

TEST(CursorSpeed, IsNoneAfterTheLastPosition) {
    EXPECT_THAT(speedsOf({{3, {7, 8}}}), ElementsAre(CursorSpeed{3, 0}));
    EXPECT_THAT(speedsOf({{3, {7, 8}}, {3, {70, 80}}}), ElementsAre(CursorSpeed{3, 0}));
}

TEST(CursorSpeed, LeavesOutAJumpAtOneTime) {
    EXPECT_THAT(speedsOf({{0, {0, 0}}, {0.5, {50, 0}}, {0.5, {80, 0}}, {1, {80, 0}}}),
                ElementsAre(CursorSpeed{0, 100}, CursorSpeed{0.5, 0}, CursorSpeed{1, 0}));
}

TEST(CursorSpeed, IsNoneDuringARestAndThatOfTheMoveInTheLastUsualDistance) {
    EXPECT_THAT(speedsOfSteps({0, 0.5, 1, 1.5, 8, 8.5}),
                ElementsAre(CursorSpeed{0, 20}, CursorSpeed{0.5, 20}, CursorSpeed{1, 20}, CursorSpeed{1.5, 0},
                            CursorSpeed{7.5, 20}, CursorSpeed{8, 20}, CursorSpeed{8.5, 0}));
}

TEST(CursorSpeed, DoesNotRestForTwiceTheUsualDistance) {
    EXPECT_THAT(speedsOfSteps({0, 1, 2, 4}),
                ElementsAre(CursorSpeed{0, 10}, CursorSpeed{1, 10}, CursorSpeed{2, 5}, CursorSpeed{4, 0}));
}

TEST(CursorSpeed, RestsByTheMedianOfTheDistancesBetweenDifferentTimes) {
    EXPECT_THAT(
        speedsOfSteps({0, 0, 0, 0, 2, 4, 10, 10}), // 2, 2 and 6: the last one is a rest of 4 and a move of 2
        ElementsAre(CursorSpeed{0, 5}, CursorSpeed{2, 5}, CursorSpeed{4, 0}, CursorSpeed{8, 5}, CursorSpeed{10, 0}));
    EXPECT_THAT(
        speedsOfSteps({0, 1, 3, 8}), // 1, 2 and 5: 2 is usual
        ElementsAre(CursorSpeed{0, 10}, CursorSpeed{1, 5}, CursorSpeed{3, 0}, CursorSpeed{6, 5}, CursorSpeed{8, 0}));
    EXPECT_THAT(speedsOfSteps({0, 1, 2, 5, 14}), // 1, 1, 3 and 9: 2 is usual
                ElementsAre(CursorSpeed{0, 10}, CursorSpeed{1, 10}, CursorSpeed{2, 10.0 / 3}, CursorSpeed{5, 0},
                            CursorSpeed{12, 5}, CursorSpeed{14, 0}));
}

TEST(CursorSpeed, IsFoundInEntriesWithoutOrder) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    EXPECT_THAT(speedsOf({{2, {20, 0}}, {nan, {3, 3}}, {1, {0, 0}}}),
                ElementsAre(CursorSpeed{1, 20}, CursorSpeed{2, 0}));
}

TEST(CursorSpeed, CrossesTheWholeRangeOfPositions) {
    EXPECT_THAT(speedsOf({{0, {-s_far, 5}}, {2, {s_far, 5}}}), ElementsAre(CursorSpeed{0, s_far}, CursorSpeed{2, 0}));
}

TEST(CursorSpeed, IsAlwaysFinite) {
    constexpr double least = std::numeric_limits<double>::denorm_min();
    constexpr double most = std::numeric_limits<double>::max();
    EXPECT_THAT(speedsOf({{0, {0, 0}}, {least, {s_far, 0}}}), ElementsAre(CursorSpeed{0, 0}, CursorSpeed{least, 0}));
    EXPECT_THAT(speedsOf({{-most, {0, 0}}, {most, {s_far, 0}}}),
                ElementsAre(CursorSpeed{-most, 0}, CursorSpeed{most, 0}));
}

TEST(CursorSpeed, IsFoundAmongAMillionEntriesAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    std::vector<double> times(count, 1);
    times.back() = 3;
    std::vector<Point> places(count, Point(0, 0));
    places.back() = {10, 0};
    EXPECT_THAT(cursorSpeedsOf({times, places}), ElementsAre(CursorSpeed{1, 5}, CursorSpeed{3, 0}));
}

} // namespace
} // namespace Test
} // namespace ZULMetaData
