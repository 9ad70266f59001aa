#include "ZULMetaDataSession/Insights/CursorPath.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <limits>

namespace ZULMetaData::Test {
namespace {

using testing::IsEmpty;
using testing::SizeIs;

constexpr std::int32_t s_lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t s_highest = std::numeric_limits<std::int32_t>::max();

void expectPoint(const std::optional<ScreenPoint>& point, double x, double y) {
    ASSERT_TRUE(point);
    EXPECT_EQ(point->x, x);
    EXPECT_EQ(point->y, y);
}

void expectNear(const std::optional<ScreenPoint>& point, double x, double y, double distance) {
    ASSERT_TRUE(point);
    EXPECT_NEAR(point->x, x, distance);
    EXPECT_NEAR(point->y, y, distance);
}

Click clickAt(double time, const std::optional<Point>& position) {
    Click click;
    click.start = time;
    click.end = time;
    click.position = position;
    return click;
}

CursorPath pathOf(const TrackEntries<CursorLocationKind>& entries, const std::vector<Click>& clicks = {},
                  const CursorPathOptions& options = {}) {
    return {positions(entries), clicks, options};
}

/// Moves and rests that look like those of a person, 64 entries in a second.
TrackEntries<CursorLocationKind> wandering(std::uint64_t seed, int entries) {
    Numbers numbers(seed);
    TrackEntries<CursorLocationKind> result;
    int x = 500;
    int y = 500;
    for (int i = 0; i < entries; ++i) {
        if (numbers.below(10) == 0)
            i += numbers.below(30); // nothing is recorded
        x += numbers.below(41) - 20;
        y += numbers.below(41) - 20;
        result.push_back({i / 64.0, {x, y}});
    }
    return result;
}

TEST(CursorPath, IsEmptyWithoutAnyPosition) {
    EXPECT_TRUE(CursorPath().empty());
    EXPECT_EQ(pathOf({}).at(1), std::nullopt);
    EXPECT_THAT(pathOf({}).resampled(0, 60, 10), IsEmpty());
    EXPECT_TRUE(pathOf({}, {clickAt(1, std::nullopt)}).empty());
}

TEST(CursorPath, OfOnePositionStaysThere) {
    const CursorPath path = pathOf({{5, {10, -20}}});
    for (const double time : {-1e300, 0.0, 5.0, 1e300})
        expectPoint(path.at(time), 10, -20);
    expectPoint(pathOf({}, {clickAt(1, Point(3, 4))}).at(0), 3, 4);
}

TEST(CursorPath, BeginsAndEndsWhereTheEntriesDo) {
    const CursorPath path = pathOf({{1, {0, 0}}, {1.05, {100, 50}}, {1.1, {80, 90}}, {1.15, {300, 10}}});
    expectPoint(path.at(0), 0, 0);
    expectPoint(path.at(1), 0, 0);
    expectPoint(path.at(1.15), 300, 10);
    expectPoint(path.at(9), 300, 10);
}

TEST(CursorPath, LeavesAStraightMovementAlone) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i <= 64; ++i)
        entries.push_back({i / 64.0, {10 * i, -5 * i}});
    const CursorPath path = pathOf(entries);
    for (int i = 0; i <= 640; ++i)
        expectNear(path.at(i / 640.0), i, -i / 2.0, 1e-9);
}

TEST(CursorPath, TakesOutTremor) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i <= 128; ++i)
        entries.push_back({i / 64.0, {4 * i, i % 2 == 0 ? 0 : 10}});
    const CursorPath path = pathOf(entries);
    for (int i = 32; i <= 96; ++i)
        expectNear(path.at(i / 64.0), 4 * i, 5, 1);
}

TEST(CursorPath, StaysWhereTheCursorRests) {
    const TrackEntries<CursorLocationKind> entries{{0, {0, 0}},       {0.02, {30, 10}},  {0.04, {70, 40}},
                                                   {0.06, {100, 50}}, {1.06, {100, 50}}, {1.08, {90, 80}},
                                                   {1.1, {30, 90}}};
    const CursorPath path = pathOf(entries);
    for (const double time : {0.06, 0.060001, 0.5, 1.059999, 1.06})
        expectPoint(path.at(time), 100, 50);
    EXPECT_LT(path.at(0.0599)->x, 100);
    EXPECT_NE(path.at(1.061)->y, 50);
}

TEST(CursorPath, RestsWhileNothingIsRecorded) {
    const CursorPath path = pathOf(
        {{0, {0, 0}}, {0.02, {30, 10}}, {0.04, {100, 50}}, {5, {120, 60}}, {5.02, {150, 70}}, {5.04, {200, 75}}});
    for (const double time : {0.04, 1.0, 4.979})
        expectPoint(path.at(time), 100, 50);
    EXPECT_GT(path.at(4.99)->x, 100) << "it moves within the usual 0.02 s";
}

TEST(CursorPath, RestsOnlyWhereTheCursorStaysLongEnough) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i <= 10; ++i)
        entries.push_back({i / 50.0, {5 * i, i * i}});
    for (int i = 0; i <= 10; ++i)
        entries.push_back({0.3 + i / 50.0, {50 + 5 * i, 100 - i * i}});
    const auto restsFor = [&](double rest) {
        CursorPathOptions options;
        options.rest = rest;
        const CursorPath path = pathOf(entries, {}, options);
        return path.at(0.24)->y == 100 && path.at(0.25)->y == 100;
    };
    EXPECT_TRUE(restsFor(0.05));
    EXPECT_FALSE(restsFor(0.15));
    EXPECT_FALSE(restsFor(std::numeric_limits<double>::infinity()));
}

TEST(CursorPath, PassesThroughEveryClick) {
    for (std::uint64_t seed = 0; seed < 50; ++seed) {
        const TrackEntries<CursorLocationKind> entries = wandering(seed, 2000);
        const Track<CursorLocationKind> track = positions(entries);
        Numbers numbers(seed);
        std::vector<Click> clicks;
        for (int i = 0; i < 100; ++i) {
            const double time = numbers.below(40'000) / 1000.0;
            if (const Point* position = track.at(time))
                clicks.push_back(clickAt(time, *position));
        }
        const CursorPath path(track, clicks);
        for (const Click& click : clicks)
            expectPoint(path.at(click.start), click.position->x, click.position->y);
    }
}

TEST(CursorPath, PassesThroughTheEndOfADrag) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i <= 64; ++i)
        entries.push_back({i / 64.0, {i * i, 0}});
    Click drag = clickAt(0.25, Point(256, 0));
    drag.end = 0.75;
    drag.endPosition = Point(2304, 0);
    drag.isDrag = true;
    expectPoint(pathOf(entries, {drag}).at(0.75), 2304, 0);
    drag.isDrag = false;
    EXPECT_NE(pathOf(entries, {drag}).at(0.75)->x, 2304);
}

TEST(CursorPath, PassesThroughTheLastOfSeveralClicksAtOneTime) {
    const CursorPath path = pathOf({{0, {0, 0}}, {1, {0, 0}}},
                                   {clickAt(0.5, Point(1, 1)), clickAt(0.25, Point(9, 9)), clickAt(0.5, Point(2, 2)),
                                    clickAt(std::numeric_limits<double>::quiet_NaN(), Point(7, 7))});
    expectPoint(path.at(0.5), 2, 2);
    expectPoint(path.at(0.25), 9, 9);
}

TEST(CursorPath, LeavesACornerAsItReachesIt) {
    TrackEntries<CursorLocationKind> entries; // to the right, and back the same way
    for (int i = 0; i <= 128; ++i)
        entries.push_back({i / 64.0, {i <= 64 ? 10 * i : 10 * (128 - i), i <= 64 ? i * i : (128 - i) * (128 - i)}});
    const CursorPath path = pathOf(entries, {clickAt(0.5, Point(320, 1024)), clickAt(1.5, Point(320, 1024))});
    for (int i = 0; i <= 512; ++i) {
        const std::optional<ScreenPoint> mirrored = path.at(2 - i / 512.0);
        expectNear(path.at(i / 512.0), mirrored->x, mirrored->y, 1e-9);
    }
}

TEST(CursorPath, OfTheReverseIsTheReverse) {
    for (std::uint64_t seed = 0; seed < 20; ++seed) {
        Numbers numbers(seed);
        TrackEntries<CursorLocationKind> entries;
        TrackEntries<CursorLocationKind> reversed;
        for (int i = 0; i <= 256; ++i) {
            const Point point(numbers.below(500), numbers.below(500));
            entries.push_back({i / 64.0, point});
            reversed.push_back({4 - i / 64.0, point});
        }
        const CursorPath path = pathOf(entries);
        const CursorPath back = pathOf(reversed);
        for (int i = 0; i <= 1024; ++i) {
            const std::optional<ScreenPoint> point = back.at(4 - i / 256.0);
            expectNear(path.at(i / 256.0), point->x, point->y, 1e-6);
        }
    }
}

/// Returns how far the middle of a hill of `height` pixels remains.
double hillAfter(const CursorPathOptions& options, int height = 400) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i <= 128; ++i)
        entries.push_back({i / 64.0, {i, height - std::abs(i - 64) * height / 64}});
    return pathOf(entries, {}, options).at(1)->y;
}

TEST(CursorPath, IsSmootherWithALowerCutoff) {
    CursorPathOptions options;
    options.beta = 0;
    options.minCutoff = 0.5;
    const double low = hillAfter(options);
    options.minCutoff = 1;
    const double usual = hillAfter(options);
    options.minCutoff = 8;
    const double high = hillAfter(options);
    EXPECT_LT(low, usual - 10);
    EXPECT_LT(usual, high - 10);
    EXPECT_LT(high, 400);
    for (const double odd : {0.0, -1.0, 1e300, std::numeric_limits<double>::quiet_NaN()}) {
        options.minCutoff = odd;
        EXPECT_TRUE(std::isfinite(hillAfter(options))) << odd;
    }
}

TEST(CursorPath, FollowsAFastCursorMoreClosely) {
    CursorPathOptions options;
    const double usual = hillAfter(options) / 400;
    EXPECT_LT(hillAfter(options, 40) / 40, usual - 0.01) << "a slower cursor";
    options.beta = 0;
    EXPECT_LT(hillAfter(options) / 400, usual - 0.01);
    options.beta = 1;
    EXPECT_GT(hillAfter(options) / 400, usual + 0.01);
    options.beta = 0.007;
    options.speedCutoff = 10;
    EXPECT_NE(hillAfter(options) / 400, usual);
}

TEST(CursorPath, IsResampledAtAnyRate) {
    const CursorPath path = pathOf(wandering(1, 500));
    for (const double rate : {1.0, 29.97, 60.0, 1000.0}) {
        const std::vector<ScreenPoint> points = path.resampled(0.5, rate, 50);
        ASSERT_THAT(points, SizeIs(50));
        for (int i = 0; i < 50; ++i)
            expectPoint(path.at(0.5 + i / rate), points[static_cast<std::size_t>(i)].x,
                        points[static_cast<std::size_t>(i)].y);
    }
}

TEST(CursorPath, TakesTheLastOfSeveralPositionsAtOneTime) {
    const CursorPath path = pathOf({{1, {5, 5}}, {0, {0, 0}}, {1, {6, 6}}, {2, {7, 7}}, {2, {8, 8}}});
    expectPoint(path.at(2), 8, 8);
    expectPoint(pathOf({{0, {1, 1}}, {0, {2, 2}}}).at(0), 2, 2);
}

TEST(CursorPath, StaysFiniteForOddNumbers) {
    const double huge = std::numeric_limits<double>::max();
    const double tiny = std::numeric_limits<double>::denorm_min();
    const CursorPath path = pathOf({{-huge, {s_lowest, s_highest}},
                                    {-1, {s_highest, s_lowest}},
                                    {0, {0, 0}},
                                    {tiny, {s_highest, s_highest}},
                                    {2 * tiny, {s_lowest, s_lowest}},
                                    {3 * tiny, {1, 1}},
                                    {1e300, {s_lowest, 7}},
                                    {huge, {s_highest, 8}}},
                                   {clickAt(1e299, Point(3, 4))});
    for (const double time :
         {-huge, -1e300, -1.0, -0.5, 0.0, tiny, 2 * tiny, 1e-300, 1.0, 1e9, 1e299, 1e300, 1e308, huge}) {
        const std::optional<ScreenPoint> point = path.at(time);
        ASSERT_TRUE(point);
        EXPECT_TRUE(std::isfinite(point->x) && std::isfinite(point->y)) << time;
    }
    expectPoint(path.at(1e299), 3, 4);
    expectPoint(path.at(huge), s_highest, 8);
    EXPECT_LT(path.times().size(), 100U);
}

TEST(CursorPath, HasFewCornersHoweverFarApartTheEntriesAre) {
    TrackEntries<CursorLocationKind> entries;
    for (int i = 0; i < 1000; ++i)
        entries.push_back({i * 1e9, {i, i * i % 100}});
    EXPECT_LE(pathOf(entries).times().size(), 2000U);
}

TEST(CursorPath, IsMadeOfAMillionEntriesAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    std::vector<Point> places(count);
    std::vector<Click> clicks(count, clickAt(1, Point(5, 6)));
    for (std::size_t i = 0; i < count; ++i)
        places[i] = {static_cast<std::int32_t>(i), 0};
    const CursorPath path({std::vector<double>(count, 1), places}, clicks);
    EXPECT_EQ(path.times().size(), 1U);
    expectPoint(path.at(1), 5, 6);
}

TEST(CursorPath, IsMadeOfAMillionEntriesWithoutARest) {
    constexpr std::size_t count = 1'000'000;
    std::vector<double> times(count);
    std::vector<Point> places(count);
    for (std::size_t i = 0; i < count; ++i) {
        times[i] = static_cast<double>(i) / 1000;
        places[i] = {static_cast<std::int32_t>(i % 1000), static_cast<std::int32_t>(i % 777)};
    }
    EXPECT_EQ(CursorPath({times, places}, {}).times().size(), 120'001U) << "120 in a second";
}

TEST(CursorPath, IsTheSameOnEveryMachine) {
    std::uint64_t digest = 14695981039346656037ULL; // FNV-1a
    const auto mix = [&digest](double number) {
        for (int shift = 0; shift < 64; shift += 8) {
            digest ^= (std::bit_cast<std::uint64_t>(number) >> shift) & 0xff;
            digest *= 1099511628211ULL;
        }
    };
    const CursorPath path = pathOf(wandering(7, 5000), {clickAt(3.3, Point(400, 300)), clickAt(20.1, Point(1, 2))});
    for (const ScreenPoint& point : path.resampled(0, 59.94, 5000)) {
        mix(point.x);
        mix(point.y);
    }
    EXPECT_EQ(digest, 18021581020325323529ULL);
}

} // namespace
} // namespace ZULMetaData::Test
