#include "Tools/record/Instant.h"

#include <gtest/gtest.h>

using namespace Recorder;

TEST(Instant, LengthsAreRoundedToUnits) {
    EXPECT_EQ(inUnits(0, 90'000), 0);
    EXPECT_EQ(inUnits(5'555, 90'000), 0);
    EXPECT_EQ(inUnits(5'556, 90'000), 1);
    EXPECT_EQ(inUnits(s_second / 2, 48'000), 24'000);
}

TEST(Instant, ServerTimesAreUnwrapped) {
    constexpr Instant wrap = (std::int64_t{1} << 32) * s_millisecond; // 49.7 days
    EXPECT_EQ(unwrapped(1000, 5 * s_second), s_second);
    EXPECT_EQ(unwrapped(5, wrap + 7 * s_millisecond), wrap + 5 * s_millisecond);
    EXPECT_EQ(unwrapped(0xffffffff, wrap + 7 * s_millisecond), wrap - s_millisecond) << "just before it wrapped";
    EXPECT_EQ(unwrapped(0, wrap - s_millisecond), wrap) << "it wraps right after the clock was read";
    EXPECT_EQ(unwrapped(5, 3 * wrap), 3 * wrap + 5 * s_millisecond);
}

TEST(Instant, ServerTimesOfAnotherZeroStayNear) {
    constexpr Instant dayTwo = 2 * 24 * 3600 * s_second; // here; the server has just been started
    EXPECT_EQ(unwrapped(0x80000000 + 172'800'000, dayTwo), dayTwo - (std::int64_t{1} << 31) * s_millisecond);
}

TEST(Instant, LengthsOfManyDaysDoNotOverflow) {
    constexpr Instant days = 100 * 24 * 3600 * s_second;
    EXPECT_EQ(inUnits(days + s_second / 2, 90'000), std::int64_t{100} * 24 * 3600 * 90'000 + 45'000);
}
