#include "Tools/record/ScrollAxis.h"

#include <gtest/gtest.h>

#include <limits>

using namespace Recorder;

TEST(ScrollAxis, OneNotchIs120UpAndLeftPositive) {
    ScrollAxis axis{3, true, 15};
    EXPECT_EQ(axis.turned(15), -120);
    EXPECT_EQ(axis.turned(-15), 120);
    EXPECT_EQ(axis.turned(-30), 240);
}

TEST(ScrollAxis, AnIncrementBelow0TurnsTheOtherWay) {
    ScrollAxis axis{2, false, -2};
    EXPECT_EQ(axis.turned(2), 120);
}

TEST(ScrollAxis, PartsOfAUnitAreCountedLater) {
    ScrollAxis axis{3, true, 120};
    EXPECT_EQ(axis.turned(0.5), 0);
    EXPECT_EQ(axis.turned(0.25), 0);
    EXPECT_EQ(axis.turned(0.5), -1);
    EXPECT_EQ(axis.turned(0.75), -1);
    EXPECT_EQ(axis.turned(-1), 1);
    EXPECT_EQ(axis.rest, 0);
}

TEST(ScrollAxis, WhatNoHandDoesIsLeftOut) {
    ScrollAxis axis{3, true, 1};
    EXPECT_EQ(axis.turned(std::numeric_limits<double>::infinity()), 0);
    EXPECT_EQ(axis.turned(std::numeric_limits<double>::quiet_NaN()), 0);
    EXPECT_EQ(axis.turned(1e300), 0);
    EXPECT_EQ(axis.turned(1), -120);
}
