#include "ZULMetaDataSession/Rational.h"

#include <gtest/gtest.h>

#include <cmath>
#include <concepts>
#include <cstdint>
#include <limits>
#include <random>
#include <string>

namespace ZULMetaData {
namespace {

constexpr double s_infinity = std::numeric_limits<double>::infinity();
constexpr double s_least = std::numeric_limits<double>::denorm_min();
constexpr double s_most = std::numeric_limits<double>::max();

/// Fails if the text is no number.
Rational number(const std::string& text) {
    const auto parsed = Rational::parse(text);
    EXPECT_TRUE(parsed) << text;
    return parsed.value_or(0);
}

/// Two to the power of an exponent that is not negative.
Rational power(int exponent) {
    if (exponent == 0)
        return 1;
    const Rational half = power(exponent / 2);
    return half * half * (exponent % 2 == 0 ? 1 : 2);
}

TEST(Rational, IsZeroAtFirst) {
    EXPECT_EQ(Rational().text(), "0");
    EXPECT_TRUE(Rational().isZero());
    EXPECT_FALSE(Rational().isNegative());
    EXPECT_EQ(Rational(0, -5), Rational());
}

TEST(Rational, IsInLowestTermsWithTheSignAbove) {
    EXPECT_EQ(Rational(6, 4).text(), "3/2");
    EXPECT_EQ(Rational(-6, 4).text(), "-3/2");
    EXPECT_EQ(Rational(6, -4).text(), "-3/2");
    EXPECT_EQ(Rational(-6, -4).text(), "3/2");
    EXPECT_EQ(Rational(10, 5).text(), "2");
}

TEST(Rational, HoldsTheLeastInteger) {
    constexpr std::int64_t least = std::numeric_limits<std::int64_t>::min();
    EXPECT_EQ(Rational(least).text(), "-9223372036854775808");
    EXPECT_EQ(Rational(1, least).text(), "-1/9223372036854775808");
    EXPECT_EQ(Rational(least, least).text(), "1");
    EXPECT_TRUE(Rational(least).isNegative());
    EXPECT_FALSE(Rational(least).isZero());
    EXPECT_EQ((Rational(least) + 1).text(), "-9223372036854775807");
}

TEST(Rational, ReadsDigitsAndFractions) {
    EXPECT_EQ(number("10").text(), "10");
    EXPECT_EQ(number("12.5").text(), "25/2");
    EXPECT_EQ(number("61/3").text(), "61/3");
    EXPECT_EQ(number("0").text(), "0");
    EXPECT_EQ(number("0/7").text(), "0");
    EXPECT_EQ(number("007.250").text(), "29/4");
    EXPECT_EQ(number("0.1").text(), "1/10");
    EXPECT_EQ(number("18446744073709551616/36893488147419103232").text(), "1/2");
    EXPECT_EQ(number("123456789012345678901234567890").text(), "123456789012345678901234567890");
}

TEST(Rational, RefusesOtherTexts) {
    for (const char* text :
         {"",      "-1",    "+1",    " 1",   "1 ",   "1e3", ".5",  "5.",  "1/0",  "1/",       "/2",
          "1/2/3", "1.5/2", "1/2.5", "1..2", "0x10", "1,5", "inf", "nan", "1/-2", "\xc2\xb2", "1/00"})
        EXPECT_FALSE(Rational::parse(text)) << text;
    EXPECT_FALSE(Rational::parse(std::string_view("1\0", 2)));
}

TEST(Rational, ReadsAThousandDigitsAndNoMore) {
    const std::string thousand(1000, '7');
    EXPECT_EQ(number(thousand).text(), thousand);
    EXPECT_EQ(number(thousand + '/' + thousand).text(), "1");
    EXPECT_EQ(number("0." + std::string(998, '0') + '1').text(), "1/1" + std::string(999, '0'));
    EXPECT_FALSE(Rational::parse(thousand + '7'));
    EXPECT_FALSE(Rational::parse("1/" + thousand + '7'));
    EXPECT_FALSE(Rational::parse("0." + thousand));
}

struct Calculation {
    const char* left;
    const char* right;
    const char* sum;
    const char* difference;
    const char* product;
    const char* quotient;
    double nearest; ///< to `left`
};

// The results are those of the fractions of Python.
const Calculation s_calculations[] = {
    {"1/3", "2/3", "1", "-1/3", "2/9", "1/2", 0x1.5555555555555p-2},
    {"61/3", "10", "91/3", "31/3", "610/3", "61/30", 0x1.4555555555555p+4},
    {"30000/1001", "24000/1001", "54000/1001", "6000/1001", "720000000/1002001", "5/4", 0x1.df853e2556b28p+4},
    {"9223372036854775807", "1/9223372036854775807", "85070591730234615847396907784232501250/9223372036854775807",
     "85070591730234615847396907784232501248/9223372036854775807", "1", "85070591730234615847396907784232501249",
     0x1p+63},
    {"18446744073709551616", "18446744073709551615", "36893488147419103231", "1",
     "340282366920938463444927863358058659840", "18446744073709551616/18446744073709551615", 0x1p+64},
    {"1000000000000000000000000000001/12157665459056928801", "36472996377170786403/10000000000",
     "10443426488243037769948249630629149892803/121576654590569288010000000000",
     "9556573511756962230051750369390850107197/121576654590569288010000000000",
     "3000000000000000000000000000003/10000000000",
     "10000000000000000000000000000010000000000/443426488243037769948249630619149892803", 0x1.326a39537b318p+36},
    {"1606938044258990275541962092341162602522202993782792835301377/7",
     "1606938044258990275541962092341162602522202993782792835301375/49",
     "12855504354071922204335696738729300820177623950262342682411014/49",
     "9641628265553941653251772554046975615133217962696757011808264/49",
     "25822498780869085896559191720030118743297057928292235128306593565406476220168411946296453532801378314359031719727"
     "47493375/343",
     "11248566309812931928793734646388138217655420956479549847109639/"
     "1606938044258990275541962092341162602522202993782792835301375",
     0x1.2492492492492p+197},
    {"12345678901234567890123", "98765432109876543210", "12444444333344444433333", "12246913469124691346913",
     "1219326311370217952249611949260778341714830", "4115226300411522630041/32921810703292181070",
     0x1.4ea15b273b38ap+73},
    {"10000000000000000000000000/205891132094649", "10000000000000000000000000/617673396283947",
     "40000000000000000000000000/617673396283947", "20000000000000000000000000/617673396283947",
     "100000000000000000000000000000000000000000000000000/127173474825648610542883299603", "3", 0x1.69deb29706092p+35},
    {"16428520040413041995477810282649/226842229495523295141264448799413",
     "17449402268886407318558803753801/82142600202065209977389051413245",
     "5307742667629699989469381814171937135417009477645650738437604818/"
     "18633410566395894558222819816134086979114081575065188571176425185",
     "-2608779960447170599466299865195311005197989314088499565733032808/"
     "18633410566395894558222819816134086979114081575065188571176425185",
     "1/65",
     "1349481353591264695001540974488313065109510081778575586352286005/"
     "3958261314038435294467840839683624070307499395867075152085318813",
     0x1.28a4ac9407c77p-4},
};

class RationalCalculation : public testing::TestWithParam<Calculation> {};

TEST_P(RationalCalculation, IsExact) {
    const Rational left = number(GetParam().left);
    const Rational right = number(GetParam().right);
    EXPECT_EQ((left + right).text(), GetParam().sum);
    EXPECT_EQ((right + left).text(), GetParam().sum);
    EXPECT_EQ((left - right).text(), GetParam().difference);
    EXPECT_EQ((left * right).text(), GetParam().product);
    EXPECT_EQ((left / right).text(), GetParam().quotient);
    EXPECT_EQ(left.nearest(), GetParam().nearest);
    EXPECT_EQ((Rational() - left).nearest(), -GetParam().nearest);
    EXPECT_EQ(left + right - right, left);
    EXPECT_EQ(left * right / right, left);
}

INSTANTIATE_TEST_SUITE_P(Rational, RationalCalculation, testing::ValuesIn(s_calculations));

TEST(Rational, SubtractsBelowZero) {
    EXPECT_EQ((Rational(1, 3) - Rational(1, 2)).text(), "-1/6");
    EXPECT_EQ((number("1/18446744073709551616") - number("18446744073709551616")).text(),
              "-340282366920938463463374607431768211455/18446744073709551616");
    EXPECT_EQ(Rational(-1, 3) * Rational(-3), Rational(1));
    EXPECT_EQ((Rational(1) / Rational(-4)).text(), "-1/4");
    EXPECT_TRUE((number("18446744073709551616") - number("18446744073709551616")).isZero());
}

TEST(Rational, Compares) {
    const Rational ascending[] = {number("0") - number("99999999999999999999"),
                                  Rational(-2),
                                  Rational(-1, 2),
                                  0,
                                  number("1/99999999999999999999"),
                                  Rational(1, 3),
                                  number("0.3333333333333333333334"),
                                  Rational(1, 2),
                                  number("99999999999999999999")};
    for (std::size_t i = 0; i < std::size(ascending); ++i)
        for (std::size_t j = 0; j < std::size(ascending); ++j) {
            EXPECT_EQ(ascending[i] <=> ascending[j], i <=> j) << i << ' ' << j;
            EXPECT_EQ(ascending[i] == ascending[j], i == j) << i << ' ' << j;
        }
}

TEST(Rational, HoldsEveryFiniteDouble) {
    for (const double value : {0.0, 1.0, 0.1, 1.0 / 3, 12345.678, 1e-5, 1e22, 1e23, s_least, s_least * 3, 0x1p-1022,
                               0x1.fffffffffffffp-1023, s_most, 0x1p63, 0x1p64, 0x1.fffffffffffffp62}) {
        EXPECT_EQ(Rational::of(value).nearest(), value);
        EXPECT_EQ(Rational::of(-value).nearest(), -value);
    }
    EXPECT_EQ(Rational::of(0.1).text(), "3602879701896397/36028797018963968");
    EXPECT_EQ(Rational::of(-2.5).text(), "-5/2");
    EXPECT_EQ(Rational::of(-0.0).text(), "0");
    EXPECT_EQ(Rational::of(0x1p100).text(), "1267650600228229401496703205376");
    EXPECT_EQ(Rational::of(s_least) * power(1074), Rational(1));
    EXPECT_EQ(Rational::of(s_most), power(1024) - power(971));
}

TEST(Rational, RoundsTiesToEven) {
    EXPECT_EQ(number("9007199254740993").nearest(), 9007199254740992.0); // 2^53 + 1
    EXPECT_EQ(number("9007199254740995").nearest(), 9007199254740996.0);
    EXPECT_EQ(number("9007199254740993.00000000000000000000000000000000000000001").nearest(), 9007199254740994.0);
    EXPECT_EQ(number("9007199254740992.99999999999999999999999999999999999999999").nearest(), 9007199254740992.0);
    EXPECT_EQ(number("18014398509481985/18014398509481984").nearest(), 1.0); // half a place after 1
    EXPECT_EQ(number("18014398509481986/18014398509481984").nearest(), 1.0);
    EXPECT_EQ(number("18014398509481987/18014398509481984").nearest(), std::nextafter(1.0, 2.0));
    EXPECT_EQ(number("0.1").nearest(), 0.1);
}

TEST(Rational, RoundsToSubnormalsAndToZero) {
    const Rational least = Rational::of(s_least);
    EXPECT_EQ((least / 2).nearest(), 0.0);
    EXPECT_EQ((least * Rational(501, 1000)).nearest(), s_least);
    EXPECT_EQ((least * Rational(3, 2)).nearest(), 2 * s_least);
    EXPECT_EQ((least * Rational(5, 2)).nearest(), 2 * s_least);
    EXPECT_EQ((least * Rational(7, 2)).nearest(), 4 * s_least);
    EXPECT_EQ((Rational(1) / power(5000)).nearest(), 0.0);
    const Rational largestSubnormal = Rational::of(0x1p-1022) - least;
    EXPECT_EQ((largestSubnormal + least / 2).nearest(), 0x1p-1022);
    EXPECT_EQ((largestSubnormal + least / 3).nearest(), largestSubnormal.nearest());
}

TEST(Rational, IsInfiniteOnlyPastTheLargestDouble) {
    const Rational half = power(970);
    EXPECT_EQ(Rational::of(s_most).nearest(), s_most);
    EXPECT_EQ((Rational::of(s_most) + half - Rational(1, 3)).nearest(), s_most);
    EXPECT_EQ((Rational::of(s_most) + half).nearest(), s_infinity);
    EXPECT_EQ((Rational() - Rational::of(s_most) - half).nearest(), -s_infinity);
    EXPECT_EQ(power(20000).nearest(), s_infinity);
    EXPECT_EQ((power(20000) / (power(20000) + 1)).nearest(), 1.0);
}

TEST(Rational, AgreesWithRealDivision) {
    std::mt19937_64 random(1);
    for (int i = 0; i < 5000; ++i) {
        const auto numerator = static_cast<std::int64_t>(random() >> (11 + random() % 53));
        const auto denominator = static_cast<std::int64_t>((random() >> (11 + random() % 53)) | 1);
        const double quotient = static_cast<double>(numerator) / static_cast<double>(denominator);
        ASSERT_EQ(Rational(numerator, denominator).nearest(), quotient) << numerator << '/' << denominator;
        // The same fraction through numbers that 64 bits do not hold.
        const Rational large = number("340282366920938463463374607431768211507");
        ASSERT_EQ((Rational(numerator) / large / (Rational(denominator) / large)).nearest(), quotient);
    }
}

TEST(Rational, CountsItsBits) {
    EXPECT_EQ(Rational().bits(), 1u);
    EXPECT_EQ(Rational(1, 8).bits(), 4u);
    EXPECT_EQ(Rational(255, 2).bits(), 8u);
    EXPECT_EQ(power(1000).bits(), 1001u);
    EXPECT_EQ((Rational(1) / power(2000)).bits(), 2001u);
}

TEST(Rational, IsNotMadeOfADoubleByAccident) {
    static_assert(std::constructible_from<Rational, int>);
    static_assert(!std::constructible_from<Rational, double>);
    static_assert(!std::constructible_from<Rational, float>);
}

} // namespace
} // namespace ZULMetaData
