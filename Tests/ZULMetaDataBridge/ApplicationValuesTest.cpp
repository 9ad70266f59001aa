#include "ZULMetaDataBridge/Source/ApplicationValues.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>

namespace ZULMetaData::Test {

namespace {

constexpr double s_infinity = std::numeric_limits<double>::infinity();
constexpr std::int32_t s_lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t s_highest = std::numeric_limits<std::int32_t>::max();

TEST(MediaTimes, AreTheirValueOverTheirTimescaleInSeconds) {
    EXPECT_EQ(MediaTime(1001, 30000).seconds(), 1001.0 / 30000.0);
    EXPECT_EQ(MediaTime(-7, 2).seconds(), -3.5);
    EXPECT_EQ(MediaTime(7, -2).seconds(), -3.5);
    EXPECT_EQ(MediaTime(0, 600).seconds(), 0.0);
}

TEST(MediaTimes, AreDividedAsFloatingPointNumbersOf64Bits) {
    EXPECT_EQ(MediaTime(9007199254740993, 1).seconds(), 9007199254740992.0);
    EXPECT_EQ(MediaTime(std::numeric_limits<std::int64_t>::min(), -1).seconds(), 9223372036854775808.0);
    EXPECT_EQ(MediaTime(1, s_highest).seconds(), 1.0 / 2147483647.0);
}

TEST(MediaTimes, AreInfiniteOrNotANumberForATimescaleOfZero) {
    EXPECT_EQ(MediaTime(1, 0).seconds(), s_infinity);
    EXPECT_EQ(MediaTime(-1, 0).seconds(), -s_infinity);
    EXPECT_TRUE(std::isnan(MediaTime(0, 0).seconds()));
    EXPECT_TRUE(std::isnan(MediaTime().seconds()));
}

TEST(MediaTimes, DoNotDependOnFlagsAndEpoch) {
    const MediaTime time{1, 4, 0xffffffff, -1};
    EXPECT_EQ(time.flags, 0xffffffffU);
    EXPECT_EQ(time.epoch, -1);
    EXPECT_EQ(time.seconds(), 0.25);
}

TEST(Coordinates, LoseTheirFraction) {
    EXPECT_EQ(truncated(10.9), 10);
    EXPECT_EQ(truncated(-3.7), -3);
    EXPECT_EQ(truncated(0.999999), 0);
    EXPECT_EQ(truncated(-0.999999), 0);
    EXPECT_EQ(truncated(-0.0), 0);
    EXPECT_EQ(truncated(std::numeric_limits<double>::denorm_min()), 0);
}

TEST(Coordinates, ReachBothEndsOf32Bits) {
    EXPECT_EQ(truncated(2147483646.9), s_highest - 1);
    EXPECT_EQ(truncated(2147483647.0), s_highest);
    EXPECT_EQ(truncated(-2147483647.9), s_lowest + 1);
    EXPECT_EQ(truncated(-2147483648.0), s_lowest);
}

TEST(Coordinates, StopAtTheEndsOf32Bits) {
    for (const double large : {2147483647.5, 2147483648.0, 1e300, s_infinity}) {
        EXPECT_EQ(truncated(large), s_highest) << large;
        EXPECT_EQ(truncated(-large - 1.0), s_lowest) << large;
    }
}

TEST(Coordinates, ThatAreNotNumbersAreZero) {
    EXPECT_EQ(truncated(std::numeric_limits<double>::quiet_NaN()), 0);
    EXPECT_EQ(truncated(-std::numeric_limits<double>::quiet_NaN()), 0);
}

TEST(Geometry, IsTruncatedCoordinateByCoordinate) {
    EXPECT_EQ(truncated(ScreenPoint(3.9, -2.7)), Point(3, -2));
    EXPECT_EQ(truncated(ScreenRect(10.9, -3.7, 100.5, 50.99)), Rect(10, -3, 100, 50));
    EXPECT_EQ(truncated(ScreenPoint()), Point(0, 0));
    EXPECT_EQ(truncated(ScreenRect()), Rect(0, 0, 0, 0));
}

/// Records as a platform declares them; single precision and other widths are as good.
struct NarrowPoint {
    float x, y;
};
struct NarrowSize {
    float width, height;
};
struct NarrowRect {
    NarrowPoint origin;
    NarrowSize size;
};
enum class TimeFlags : std::uint32_t;
struct TimeWithNarrowFields {
    std::int32_t value;
    std::int16_t timescale;
    std::uint8_t flags;
    std::int8_t epoch;
};
struct TimeWithTypedFlags {
    std::int64_t value;
    std::int32_t timescale;
    TimeFlags flags;
    std::int64_t epoch;
};

TEST(PlatformRecords, AreTakenByTheirShape) {
    const ScreenPoint point = NarrowPoint{1.5F, -2.5F};
    EXPECT_EQ(point.x, 1.5);
    EXPECT_EQ(point.y, -2.5);
    const ScreenRect rect = NarrowRect{{1.5F, 2.5F}, {3.5F, 4.5F}};
    EXPECT_EQ(rect.x, 1.5);
    EXPECT_EQ(rect.y, 2.5);
    EXPECT_EQ(rect.width, 3.5);
    EXPECT_EQ(rect.height, 4.5);
    const MediaTime time = TimeWithNarrowFields{-3, 2, 5, 7};
    EXPECT_EQ(time.value, -3);
    EXPECT_EQ(time.timescale, 2);
    EXPECT_EQ(time.flags, 5U);
    EXPECT_EQ(time.epoch, 7);
}

TEST(PlatformRecords, OfAnotherShapeAreNotTaken) {
    EXPECT_FALSE((std::is_convertible_v<NarrowSize, ScreenPoint>));
    EXPECT_FALSE((std::is_convertible_v<NarrowPoint, ScreenRect>));
    EXPECT_FALSE((std::is_convertible_v<NarrowPoint, MediaTime>));
    EXPECT_FALSE((std::is_convertible_v<double, MediaTime>));
    EXPECT_FALSE((std::is_convertible_v<TimeWithTypedFlags, MediaTime>));
}

} // namespace

} // namespace ZULMetaData::Test
