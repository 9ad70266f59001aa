#include "Tools/record/Instant.h"

#include <gtest/gtest.h>

using namespace Recorder;

TEST(Instant, LengthsAreRoundedToUnits) {
    EXPECT_EQ(inUnits(0, 90'000), 0);
    EXPECT_EQ(inUnits(5'555, 90'000), 0);
    EXPECT_EQ(inUnits(5'556, 90'000), 1);
    EXPECT_EQ(inUnits(s_second / 2, 48'000), 24'000);
}

TEST(Instant, LengthsOfManyDaysDoNotOverflow) {
    constexpr Instant days = 100 * 24 * 3600 * s_second;
    EXPECT_EQ(inUnits(days + s_second / 2, 90'000), std::int64_t{100} * 24 * 3600 * 90'000 + 45'000);
}
