#include "ZULMetaDataSession/Rational.h"

#include "ZULMetaDataSession/Natural.h"

#include <algorithm>
#include <bit>
#include <cassert>
#include <cmath>
#include <limits>
#include <numeric>
#include <utility>

namespace ZULMetaData {

namespace {

using detail::Natural;

__extension__ using Wide = __int128;
__extension__ using UnsignedWide = unsigned __int128;

constexpr int s_precision = std::numeric_limits<double>::digits;                         // 53
constexpr int s_leastExponent = std::numeric_limits<double>::min_exponent - s_precision; // -1074
constexpr std::size_t s_mostDigits = 1000;
constexpr std::uint64_t s_mostOfSmall = std::numeric_limits<std::int64_t>::max();

std::uint64_t magnitudeOf(std::int64_t number) {
    return number < 0 ? static_cast<std::uint64_t>(-(number + 1)) + 1 : static_cast<std::uint64_t>(number);
}

Natural naturalOf(UnsignedWide number) {
    return Natural(static_cast<std::uint64_t>(number >> 64)).shiftedLeft(64) +
           Natural(static_cast<std::uint64_t>(number));
}

bool isDigits(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

/// Returns the double that is nearest to `quotient` * 2^exponent, where the quotient was rounded down if not `isExact`.
/// The quotient has more bits than are kept, at least by two.
double rounded(std::uint64_t quotient, bool isExact, int exponent) {
    const int bits = static_cast<int>(std::bit_width(quotient));
    const int dropped = std::max(bits - s_precision, s_leastExponent - exponent);
    const std::uint64_t rest = quotient & ((std::uint64_t{1} << dropped) - 1);
    const std::uint64_t half = std::uint64_t{1} << (dropped - 1);
    std::uint64_t kept = quotient >> dropped;
    if (rest > half || (rest == half && (!isExact || kept % 2 != 0)))
        ++kept;
    return std::ldexp(static_cast<double>(kept), exponent + dropped);
}

/// Returns by how many bits to shift a numerator so that its quotient has as many bits as `rounded` needs, and no more
/// than 57.
int shiftFor(std::size_t numeratorBits, std::size_t denominatorBits) {
    constexpr int quotientBits = s_precision + 3;
    constexpr int mostUseful = 2 - s_leastExponent;
    const auto more = static_cast<std::int64_t>(denominatorBits) - static_cast<std::int64_t>(numeratorBits);
    return static_cast<int>(std::clamp<std::int64_t>(quotientBits + more, -1'000'000'000, mostUseful));
}

} // namespace

/// The magnitudes of a fraction in lowest terms.
struct Rational::Large {
    Natural numerator;
    Natural denominator;
};

struct Rational::Arithmetic {
    /// The magnitudes of a number, which outlives them. Those of a large number are not copied.
    class Magnitudes {
    public:
        explicit Magnitudes(const Rational& number) : large_(number.large_.get()) {
            if (!large_)
                small_ = {Natural(magnitudeOf(number.numerator_)), Natural(magnitudeOf(number.denominator_))};
        }

        const Large* operator->() const { return large_ ? large_ : &small_; }

    private:
        const Large* large_;
        Large small_;
    };

    static Rational made(bool isNegative, std::uint64_t numerator, std::uint64_t denominator) {
        Rational result;
        result.numerator_ = static_cast<std::int64_t>(numerator);
        result.denominator_ = static_cast<std::int64_t>(denominator);
        if (isNegative)
            result.numerator_ = -result.numerator_;
        return result;
    }

    /// Makes a fraction of magnitudes in lowest terms.
    static Rational made(bool isNegative, Natural numerator, Natural denominator) {
        const auto smallNumerator = numerator.in64Bits();
        const auto smallDenominator = denominator.in64Bits();
        if (smallNumerator && smallDenominator && std::max(*smallNumerator, *smallDenominator) <= s_mostOfSmall)
            return made(isNegative, *smallNumerator, *smallDenominator);
        Rational result;
        result.numerator_ = isNegative ? -1 : 1;
        result.large_ = std::make_shared<const Large>(Large{std::move(numerator), std::move(denominator)});
        return result;
    }

    static Rational made(Wide numerator, UnsignedWide denominator) {
        const bool isNegative = numerator < 0;
        const auto magnitude = static_cast<UnsignedWide>(isNegative ? -numerator : numerator);
        if (std::max(magnitude, denominator) <= s_mostOfSmall)
            return made(isNegative, static_cast<std::uint64_t>(magnitude), static_cast<std::uint64_t>(denominator));
        return made(isNegative, naturalOf(magnitude), naturalOf(denominator));
    }

    static Rational reduced(bool isNegative, const Natural& numerator, const Natural& denominator) {
        const Natural common = greatestCommonDivisor(numerator, denominator);
        return made(isNegative, numerator.dividedBy(common).quotient, denominator.dividedBy(common).quotient);
    }

    static Rational negated(Rational number) {
        number.numerator_ = -number.numerator_;
        return number;
    }

    static Rational inverse(const Rational& number) {
        assert(!number.isZero());
        if (!number.large_)
            return made(number.isNegative(), magnitudeOf(number.denominator_), magnitudeOf(number.numerator_));
        return made(number.isNegative(), number.large_->denominator, number.large_->numerator);
    }

    /// a/b + c/d. Only what divides both denominators can divide the sum, so large numbers are divided by small ones.
    static Rational sum(const Rational& left, const Rational& right) {
        if (left.large_ || right.large_)
            return largeSum(left, right);
        const std::int64_t common = std::gcd(left.denominator_, right.denominator_);
        const std::int64_t leftRest = left.denominator_ / common;
        const std::int64_t rightRest = right.denominator_ / common;
        const Wide numerator = Wide{left.numerator_} * rightRest + Wide{right.numerator_} * leftRest;
        const std::int64_t cancelled = std::gcd(static_cast<std::int64_t>(numerator % common), common);
        return made(numerator / cancelled,
                    UnsignedWide{magnitudeOf(leftRest)} * magnitudeOf(right.denominator_ / cancelled));
    }

    static Rational largeSum(const Rational& left, const Rational& right) {
        const Magnitudes first(left);
        const Magnitudes second(right);
        const Natural common = greatestCommonDivisor(first->denominator, second->denominator);
        const Natural firstRest = first->denominator.dividedBy(common).quotient;
        const Natural secondRest = second->denominator.dividedBy(common).quotient;
        const Natural firstPart = first->numerator * secondRest;
        const Natural secondPart = second->numerator * firstRest;
        const bool isNegative = firstPart < secondPart ? right.isNegative() : left.isNegative();
        const Natural numerator = left.isNegative() == right.isNegative() ? firstPart + secondPart
                                  : firstPart < secondPart                ? secondPart - firstPart
                                                                          : firstPart - secondPart;
        const Natural cancelled = greatestCommonDivisor(numerator.dividedBy(common).remainder, common);
        return made(isNegative, numerator.dividedBy(cancelled).quotient,
                    firstRest * second->denominator.dividedBy(cancelled).quotient);
    }

    static Rational product(const Rational& left, const Rational& right) {
        if (left.isZero() || right.isZero())
            return {};
        if (left.large_ || right.large_)
            return largeProduct(left, right);
        const std::int64_t first = std::gcd(left.numerator_, right.denominator_);
        const std::int64_t second = std::gcd(right.numerator_, left.denominator_);
        return made(Wide{left.numerator_ / first} * (right.numerator_ / second),
                    UnsignedWide{magnitudeOf(left.denominator_ / second)} * magnitudeOf(right.denominator_ / first));
    }

    static Rational largeProduct(const Rational& left, const Rational& right) {
        const Magnitudes a(left);
        const Magnitudes b(right);
        const Natural first = greatestCommonDivisor(a->numerator, b->denominator);
        const Natural second = greatestCommonDivisor(b->numerator, a->denominator);
        return made(left.isNegative() != right.isNegative(),
                    a->numerator.dividedBy(first).quotient * b->numerator.dividedBy(second).quotient,
                    a->denominator.dividedBy(second).quotient * b->denominator.dividedBy(first).quotient);
    }

    static std::strong_ordering compare(const Rational& left, const Rational& right) {
        if (!left.large_ && !right.large_) {
            const Wide first = Wide{left.numerator_} * right.denominator_;
            const Wide second = Wide{right.numerator_} * left.denominator_;
            return first < second   ? std::strong_ordering::less
                   : first > second ? std::strong_ordering::greater
                                    : std::strong_ordering::equal;
        }
        if (left.isNegative() != right.isNegative())
            return left.isNegative() ? std::strong_ordering::less : std::strong_ordering::greater;
        const Magnitudes a(left);
        const Magnitudes b(right);
        const Natural first = a->numerator * b->denominator;
        const Natural second = b->numerator * a->denominator;
        return left.isNegative() ? second <=> first : first <=> second;
    }

    static double magnitude(std::uint64_t numerator, std::uint64_t denominator) {
        constexpr std::uint64_t mostExact = std::uint64_t{1} << s_precision;
        if (std::max(numerator, denominator) <= mostExact)
            return static_cast<double>(numerator) / static_cast<double>(denominator);
        const int shift = shiftFor(static_cast<std::size_t>(std::bit_width(numerator)),
                                   static_cast<std::size_t>(std::bit_width(denominator)));
        const UnsignedWide over = UnsignedWide{numerator} << std::max(shift, 0);
        const UnsignedWide under = UnsignedWide{denominator} << std::max(-shift, 0);
        assert(under != 0);
        return rounded(static_cast<std::uint64_t>(over / under), over % under == 0, -shift);
    }

    static double magnitude(const Large& number) {
        constexpr int tooLarge = std::numeric_limits<double>::max_exponent + 64;
        const int shift = shiftFor(number.numerator.bits(), number.denominator.bits());
        if (-shift > tooLarge)
            return std::numeric_limits<double>::infinity();
        const auto [quotient, remainder] =
            number.numerator.shiftedLeft(static_cast<std::size_t>(std::max(shift, 0)))
                .dividedBy(number.denominator.shiftedLeft(static_cast<std::size_t>(std::max(-shift, 0))));
        return rounded(*quotient.in64Bits(), remainder.isZero(), -shift);
    }
};

Rational::Rational(std::int64_t numerator, std::int64_t denominator) {
    assert(denominator != 0);
    const std::uint64_t common = std::gcd(magnitudeOf(numerator), magnitudeOf(denominator));
    *this = Arithmetic::made((numerator < 0) != (denominator < 0), Natural(magnitudeOf(numerator) / common),
                             Natural(magnitudeOf(denominator) / common));
}

Rational Rational::of(double number) {
    assert(std::isfinite(number));
    int exponent = 0;
    const auto mantissa = static_cast<std::int64_t>(std::ldexp(std::frexp(number, &exponent), s_precision));
    exponent -= s_precision;
    if (mantissa == 0)
        return {};
    const int zeros = std::countr_zero(magnitudeOf(mantissa));
    const Natural odd(magnitudeOf(mantissa) >> zeros);
    exponent += zeros;
    return Arithmetic::made(number < 0, odd.shiftedLeft(static_cast<std::size_t>(std::max(exponent, 0))),
                            Natural::powerOfTwo(static_cast<std::size_t>(std::max(-exponent, 0))));
}

std::optional<Rational> Rational::parse(std::string_view text) {
    const std::size_t mark = std::min(text.find_first_of("./"), text.size());
    const std::string_view before = text.substr(0, mark);
    if (!isDigits(before) || before.size() > s_mostDigits)
        return std::nullopt;
    if (mark == text.size())
        return Arithmetic::made(false, Natural::decimal(before), Natural(1));
    const std::string_view after = text.substr(mark + 1);
    if (!isDigits(after) || after.size() > s_mostDigits)
        return std::nullopt;
    if (text[mark] == '/') {
        const Natural denominator = Natural::decimal(after);
        if (denominator.isZero())
            return std::nullopt;
        return Arithmetic::reduced(false, Natural::decimal(before), denominator);
    }
    if (before.size() + after.size() > s_mostDigits)
        return std::nullopt;
    return Arithmetic::reduced(false, Natural::decimal(std::string(before) + std::string(after)),
                               Natural::decimal('1' + std::string(after.size(), '0')));
}

double Rational::nearest() const {
    const double magnitude = large_ ? Arithmetic::magnitude(*large_)
                                    : Arithmetic::magnitude(magnitudeOf(numerator_), magnitudeOf(denominator_));
    return isNegative() ? -magnitude : magnitude;
}

std::string Rational::text() const {
    const Arithmetic::Magnitudes magnitudes(*this);
    const std::string integer = (isNegative() ? "-" : "") + magnitudes->numerator.text();
    return magnitudes->denominator.isOne() ? integer : integer + '/' + magnitudes->denominator.text();
}

std::size_t Rational::bits() const {
    if (large_)
        return std::max(large_->numerator.bits(), large_->denominator.bits());
    return static_cast<std::size_t>(std::bit_width(std::max(magnitudeOf(numerator_), magnitudeOf(denominator_))));
}

Rational operator+(const Rational& left, const Rational& right) {
    return Rational::Arithmetic::sum(left, right);
}

Rational operator-(const Rational& left, const Rational& right) {
    return Rational::Arithmetic::sum(left, Rational::Arithmetic::negated(right));
}

Rational operator*(const Rational& left, const Rational& right) {
    return Rational::Arithmetic::product(left, right);
}

Rational operator/(const Rational& left, const Rational& right) {
    return Rational::Arithmetic::product(left, Rational::Arithmetic::inverse(right));
}

std::strong_ordering operator<=>(const Rational& left, const Rational& right) {
    return Rational::Arithmetic::compare(left, right);
}

bool operator==(const Rational& left, const Rational& right) {
    return (left <=> right) == 0;
}

} // namespace ZULMetaData
