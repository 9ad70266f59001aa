#include "Tools/zulm/Number.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace ZULMetaData::Test {

namespace {

using Zulm::realNumber;

TEST(Number, IsReadWhole) {
    EXPECT_EQ(realNumber("0"), 0.0);
    EXPECT_EQ(realNumber("-1.5"), -1.5);
    EXPECT_EQ(realNumber(".5"), 0.5);
    EXPECT_EQ(realNumber("5."), 5.0);
    EXPECT_EQ(realNumber("1e3"), 1000.0);
    EXPECT_EQ(realNumber("0.1"), 0.1);
    EXPECT_EQ(realNumber("17976931348623157e292"), std::numeric_limits<double>::max());
}

TEST(Number, MayBeInfiniteOrNone) {
    EXPECT_EQ(realNumber("inf"), std::numeric_limits<double>::infinity());
    EXPECT_EQ(realNumber("-inf"), -std::numeric_limits<double>::infinity());
    EXPECT_TRUE(std::isnan(realNumber("nan").value_or(0)));
}

TEST(Number, IsNothingElse) {
    for (const char* text : {"", "-", "+1", " 1", "1 ", "\t1", "--1", "-+1", "1x", "0x10", "1,5", "1e", "one", "1e400"})
        EXPECT_EQ(realNumber(text), std::nullopt) << text;
}

} // namespace

} // namespace ZULMetaData::Test
