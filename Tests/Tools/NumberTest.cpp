#include "Tools/zulm/Number.h"

#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>

namespace ZULMetaData::Test {

namespace {

using Zulm::realNumber;
using Zulm::shortestNumber;

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

/// The one that the characters stand for.
double asWritten(float value) {
    std::array<char, 64> characters{};
    const auto end = std::to_chars(characters.data(), characters.data() + characters.size(), value).ptr;
    return realNumber(std::string(characters.data(), end)).value_or(0);
}

TEST(Number, IsShownWithTheFewestCharacters) {
    EXPECT_EQ(shortestNumber(39.00953f), 39.00953);
    EXPECT_EQ(shortestNumber(1e20f), 1e20);
    EXPECT_EQ(shortestNumber(123456789.0f), 123456792.0); // as long as 1.2345679e+08, and exact
    EXPECT_EQ(shortestNumber(-0.5f), -0.5);
    EXPECT_TRUE(std::signbit(shortestNumber(-0.0f)));
}

TEST(Number, IsShownAsTheLibraryWritesIt) {
    std::uint32_t bits = 1;
    for (int i = 0; i < 200'000; ++i, bits = bits * 1664525 + 1013904223) {
        const auto value = std::bit_cast<float>(bits);
        if (std::isfinite(value)) {
            ASSERT_EQ(shortestNumber(value), asWritten(value)) << std::hexfloat << value;
        }
    }
    for (float value = 1; std::isfinite(value); value *= 10)
        for (const float near : {value, 3 * value, std::nextafter(value, 0.0f), -12 * value})
            if (std::isfinite(near)) {
                ASSERT_EQ(shortestNumber(near), asWritten(near)) << std::hexfloat << near;
            }
}

} // namespace

} // namespace ZULMetaData::Test
