// Times of pieces with two doubles against the same with fractions.

#include "ZULMetaDataSession/Retiming/PieceClock.h"

#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using detail::PieceClock;

PieceClock clockOf(const Rational& start, const Rational& end, const Rational& speed, const Rational& base) {
    return {EditPiece{start, end, speed, (end - start) / speed}, base};
}

TEST(PieceClock, MovesTimesByTheFractionsOfThePiece) {
    const PieceClock clock = clockOf({121, 10}, 20, {3, 2}, {1, 3});
    EXPECT_EQ(clock.start(), 12.1);
    EXPECT_EQ(clock.end(), 20);
    EXPECT_EQ(clock.first(), 1.0 / 3);
    EXPECT_EQ(clock.last(), 5.6);                  // 1/3 + 7.9 * 2/3
    EXPECT_EQ(clock.timeOf(12.5), 0.6);            // 1/3 + 0.4 * 2/3
    EXPECT_EQ(clock.timeOf(16.25), 3.1);           // 1/3 + 4.15 * 2/3
    EXPECT_EQ(clockOf(1, 3, 2, 0).timeOf(2), 0.5); // in doubles alone
    EXPECT_EQ(clockOf(1, 3, 1, 4).timeOf(2), 5);
}

TEST(PieceClock, KeepsEntriesOnEdgesInside) {
    const PieceClock clock = clockOf({61, 3}, {91, 3}, 1, 10);
    EXPECT_LT(Rational::of(61.0 / 3), Rational(61, 3)); // so it would be before the piece
    EXPECT_EQ(clock.timeOf(61.0 / 3), 10);
    EXPECT_EQ(clockOf({61, 3}, {91, 3}, 1, 0).timeOf(61.0 / 3), 0);
    EXPECT_LE(clock.timeOf(std::nextafter(91.0 / 3, 0)), 20);
}

TEST(PieceClock, CountsTimesWithoutALimit) {
    constexpr double infinity = std::numeric_limits<double>::infinity();
    const Rational huge = Rational::of(1e300);
    const PieceClock slow = clockOf(0, huge * huge, {1, 1000000000}, 0);
    EXPECT_EQ(slow.end(), infinity);
    EXPECT_EQ(slow.timeOf(1e290), 1e299);
    EXPECT_EQ(slow.timeOf(1e300), infinity);
    EXPECT_EQ(clockOf(0, 1, huge * huge, 1).timeOf(0.5), 1);
    EXPECT_EQ(clockOf(0, 1, 3, 0).timeOf(5e-324), 0);
    EXPECT_EQ(clockOf(0, 1, {1, 3}, 0).timeOf(5e-324), 1.5e-323);
}

/// Times as recorders write them, times that lie on edges or next to them, and any others.
class Times {
public:
    explicit Times(std::uint64_t seed) : random_(seed) {}

    double next(const PieceClock& clock) {
        const double length = clock.end() - clock.start();
        const double share = static_cast<double>(random_() >> 11) * 0x1p-53;
        switch (random_() % 6) {
        case 0: return std::round((clock.start() + share * length) * 1000) / 1000;
        case 1: return std::round((clock.start() + share * length) * 90000) / 90000;
        case 2: return std::ldexp(std::round(std::ldexp(clock.start() + share * length, 6)), -6);
        case 3: return std::nextafter(clock.start(), clock.end());
        case 4: return clock.start() + std::ldexp(share, -static_cast<int>(random_() % 60));
        default: return clock.start() + share * length;
        }
    }

    Rational fraction(std::int64_t limit) {
        constexpr std::array<std::int64_t, 8> denominators{1, 1, 2, 3, 10, 1000, 1001, 90000};
        const std::int64_t denominator = denominators[random_() % denominators.size()];
        const auto numerator = static_cast<std::int64_t>(random_() % static_cast<std::uint64_t>(limit * denominator));
        const Rational fraction(numerator, denominator);
        return random_() % 4 == 0 ? Rational::of(fraction.nearest()) : fraction;
    }

private:
    std::mt19937_64 random_;
};

TEST(PieceClock, RoundsAsFractionsDoForMillionsOfTimes) {
    Times times(1);
    std::uint64_t wrong = 0;
    for (int piece = 0; piece < 10'000; ++piece) {
        const Rational start = times.fraction(4000);
        const Rational end = start + times.fraction(200) + Rational(1, 1000);
        const PieceClock clock = clockOf(start, end, times.fraction(8) + Rational(1, 16), times.fraction(9000));
        for (int i = 0; i < 200; ++i) {
            const double time = times.next(clock);
            wrong += std::bit_cast<std::uint64_t>(clock.timeOf(time)) ==
                             std::bit_cast<std::uint64_t>(clock.exactTimeOf(time))
                         ? 0U
                         : 1U;
        }
    }
    EXPECT_EQ(wrong, 0U);
}

/// The sums of these end exactly between two doubles, where two doubles cannot tell on which side of it they are.
TEST(PieceClock, RoundsTiesToEven) {
    const PieceClock clock = clockOf(0, 100, {1, 3}, 1 + Rational(1, std::int64_t{1} << 54));
    for (int i = 1; i < 2000; ++i) {
        const double time = std::ldexp(static_cast<double>(2 * i + 1), -55);
        EXPECT_EQ(clock.timeOf(time), clock.exactTimeOf(time)) << i;
    }
    EXPECT_EQ(clockOf(0, 1, 1, 1).timeOf(0x1p-53), 1);
    EXPECT_EQ(clockOf(0, 1, 1, 1 + Rational(1, std::int64_t{1} << 52)).timeOf(0x1p-53), 1 + 0x1p-51);
}

} // namespace
} // namespace ZULMetaData::Test
