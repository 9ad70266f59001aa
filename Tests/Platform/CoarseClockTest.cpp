// The clock that is cheap to read: that it moves, and how far it is behind.

#include "Platform/CoarseClock.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {

namespace {

TEST(CoarseClock, NeverGoesBackwardAndMovesOn) {
    const auto start = CoarseClock::now();
    auto last = start;
    while (last == start) {
        const auto time = CoarseClock::now();
        ASSERT_GE(time, last);
        last = time;
    }
    EXPECT_GT(last, start);
}

TEST(CoarseClock, TicksAtLeastFiftyTimesASecond) {
    EXPECT_GE(CoarseClock::resolution().count(), 0);
    EXPECT_LE(CoarseClock::resolution(), std::chrono::milliseconds(20));
}

} // namespace

} // namespace ZULMetaData::Test
