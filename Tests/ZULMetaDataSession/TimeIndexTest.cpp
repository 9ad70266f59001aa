#include "ZULMetaDataSession/TimeIndex.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

namespace ZULMetaData::Test {
namespace {

constexpr double s_infinity = std::numeric_limits<double>::infinity();
constexpr double s_largest = std::numeric_limits<double>::max();
constexpr double s_smallest = std::numeric_limits<double>::denorm_min();

std::size_t countUntil(const detail::TimeIndex& index, double time) {
    return index.countUntil(index.slotOf(time), time);
}

/// Asks for every time, for the numbers around it, and for times far away.
void expectCounts(const std::vector<double>& times) {
    const detail::TimeIndex index(times);
    std::vector<double> questions{-s_infinity, -s_largest, -1, 0, 0.5, 1, s_largest, s_infinity};
    for (const double time : times)
        for (const double question : {time, std::nextafter(time, -s_infinity), std::nextafter(time, s_infinity)})
            questions.push_back(question);
    for (const double question : questions) {
        const auto expected = std::upper_bound(times.begin(), times.end(), question) - times.begin();
        ASSERT_EQ(countUntil(index, question), static_cast<std::size_t>(expected)) << question;
    }
    EXPECT_EQ(countUntil(index, std::nan("")), 0U);
}

TEST(TimeIndex, CountsNothingWithoutTimes) {
    expectCounts({});
}

TEST(TimeIndex, CountsFewTimes) {
    expectCounts({0});
    expectCounts({0, 0, 0});
    expectCounts({-5, -1, 0, 0, 2, 2.5, 100});
}

TEST(TimeIndex, CountsTimesAtASteadyPace) {
    std::vector<double> times;
    for (int i = 0; i < 5000; ++i)
        times.push_back(3 + i / 60.0);
    expectCounts(times);
}

TEST(TimeIndex, CountsBurstsAfterLongRests) {
    std::vector<double> times;
    for (int burst = 0; burst < 5; ++burst)
        for (int i = 0; i < 300; ++i)
            times.push_back(burst * 1e6 + i / 100 * 1e-6);
    expectCounts(times);
}

TEST(TimeIndex, CountsManyEntriesAtOneTime) {
    expectCounts(std::vector<double>(1000, 7.0));
    std::vector<double> times(1000, 7.0);
    times.push_back(8);
    expectCounts(times);
}

TEST(TimeIndex, CountsTimesThatAreFurtherApartThanAnyNumber) {
    std::vector<double> times{-s_largest};
    times.resize(100, 0.0);
    times.push_back(s_largest);
    expectCounts(times);
}

TEST(TimeIndex, CountsTimesThatAreCloserThanAnyOrdinaryNumber) {
    std::vector<double> times;
    for (int i = 0; i < 100; ++i)
        times.push_back(i * s_smallest);
    expectCounts(times);
}

TEST(TimeIndex, CountsTimesAtRandom) {
    std::mt19937 random(18);
    for (int round = 0; round < 50; ++round) {
        std::vector<double> times(random() % 500);
        for (double& time : times)
            time = std::ldexp(static_cast<double>(random()), -static_cast<int>(random() % 60));
        std::sort(times.begin(), times.end());
        expectCounts(times);
    }
}

} // namespace
} // namespace ZULMetaData::Test
