#include "Reports/Number.h"

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
using Zulm::secondsFrom;
using Zulm::shortestNumber;
using Zulm::Sign;
using Zulm::wholeNumber;

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

TEST(WholeNumber, IsDigitsAlone) {
    EXPECT_EQ(wholeNumber("0"), 0U);
    EXPECT_EQ(wholeNumber("007"), 7U);
    EXPECT_EQ(wholeNumber("18446744073709551615"), std::numeric_limits<std::uint64_t>::max());
    for (const char* text : {"", " ", "-1", "-0", "+1", "1.0", "1e3", "0x1", "1 ", " 1", "nan", "inf", "one", "1_000",
                             "18446744073709551616"})
        EXPECT_EQ(wholeNumber(text), std::nullopt) << text;
}

TEST(Seconds, AreADecimalNumber) {
    EXPECT_EQ(secondsFrom("0"), 0.0);
    EXPECT_EQ(secondsFrom("12.5"), 12.5);
    EXPECT_EQ(secondsFrom(".5"), 0.5);
    EXPECT_EQ(secondsFrom("1e3"), 1000.0);
}

TEST(Seconds, AreATimeCode) {
    EXPECT_EQ(secondsFrom("0:10"), 10.0);
    EXPECT_EQ(secondsFrom("0:5"), 5.0);
    EXPECT_EQ(secondsFrom("1:30"), 90.0);
    EXPECT_EQ(secondsFrom("90:00"), 5400.0);
    EXPECT_EQ(secondsFrom("00:01:02.5"), 62.5);
    EXPECT_EQ(secondsFrom("1:02:03"), 3723.0);
    EXPECT_EQ(secondsFrom("100:00:00.25"), 360000.25);
}

TEST(Seconds, AreNothingElse) {
    for (const char* word : {"",      " ",     "nan",     "-nan",   "NaN",      "inf",     "-inf",   "infinity",
                             "0x1",   "0x1p3", "+1",      " 1",     "1 ",       "1s",      "1,5",    "1e400",
                             "one",   ":",     ":10",     "10:",    "1::2",     "1:60",    "1:75",   "0:100",
                             "60:99", "1:2:",  "1:2:3:4", "1.5:10", "1:2.5:10", "1:60:00", "1:-5",   "0:1e1",
                             "0: 5",  "1:0x5", "0:nan",   "--1",    "-",        "0:.5",    "0:5.5.5"})
        EXPECT_EQ(secondsFrom(word, Sign::Any), std::nullopt) << word;
}

TEST(Seconds, AreNegativeOnlyIfThatIsAllowed) {
    for (const char* word : {"-1", "-0:10", "-0"})
        EXPECT_EQ(secondsFrom(word), std::nullopt) << word;
    EXPECT_EQ(secondsFrom("-1.5", Sign::Any), -1.5);
    EXPECT_EQ(secondsFrom("-0:10", Sign::Any), -10.0);
    EXPECT_EQ(secondsFrom("-1:02:03.5", Sign::Any), -3723.5);
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
