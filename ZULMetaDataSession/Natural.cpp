#include "ZULMetaDataSession/Natural.h"

#include <algorithm>
#include <bit>
#include <cstdlib>
#include <numeric>
#include <span>
#include <tuple>
#include <utility>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_digitBits = 32;
constexpr std::uint32_t s_billion = 1'000'000'000;
constexpr std::size_t s_digitsOfBillion = 9;

constexpr std::uint32_t lowDigit(std::uint64_t number) {
    return static_cast<std::uint32_t>(number);
}

/// Two numbers that shrink together as Euclid's do, and how they follow from the numbers that they began as:
/// x = a * larger + b * smaller, y = c * larger + d * smaller.
struct LeadingBits {
    std::int64_t x;
    std::int64_t y;
    std::int64_t a = 1;
    std::int64_t b = 0;
    std::int64_t c = 0;
    std::int64_t d = 1;

    /// Makes one step if every number that begins with these bits would make the same. Otherwise returns false.
    bool step() {
        constexpr std::int64_t mostOfFactor = 1 << 30;
        if (y + c <= 0 || y + d <= 0)
            return false;
        const std::int64_t quotient = (x + a) / (y + c);
        if (quotient != (x + b) / (y + d) || quotient >= mostOfFactor)
            return false;
        const std::int64_t nextC = a - quotient * c;
        const std::int64_t nextD = b - quotient * d;
        if (std::abs(nextC) >= mostOfFactor || std::abs(nextD) >= mostOfFactor)
            return false;
        a = std::exchange(c, nextC);
        b = std::exchange(d, nextD);
        x = std::exchange(y, x - quotient * y);
        return true;
    }
};

/// Returns a digit of a quotient, which is right or one too large. The first bit of `under` is set.
std::uint64_t estimatedDigit(std::span<const std::uint32_t> over, std::span<const std::uint32_t> under) {
    const std::size_t size = under.size();
    const std::uint64_t leading = std::uint64_t{over[size]} << s_digitBits | over[size - 1];
    std::uint64_t digit = leading / under[size - 1];
    std::uint64_t rest = leading % under[size - 1];
    while (rest >> s_digitBits == 0 &&
           (digit >> s_digitBits != 0 || digit * under[size - 2] > (rest << s_digitBits | over[size - 2]))) {
        --digit;
        rest += under[size - 1];
    }
    return digit;
}

/// Divides `over`, which has one digit more than `under`, leaves the remainder in it and returns the quotient, which is
/// a single digit.
std::uint32_t divideAt(std::span<std::uint32_t> over, std::span<const std::uint32_t> under) {
    const std::uint64_t digit = estimatedDigit(over, under);
    std::int64_t difference = 0;
    std::uint64_t product = 0;
    for (std::size_t i = 0; i < over.size(); ++i) {
        product += i < under.size() ? digit * under[i] : 0;
        difference += std::int64_t{over[i]} - std::int64_t{lowDigit(product)};
        over[i] = lowDigit(static_cast<std::uint64_t>(difference));
        difference >>= s_digitBits;
        product >>= s_digitBits;
    }
    if (difference == 0)
        return lowDigit(digit);
    std::uint64_t sum = 0; // the estimate was one too large
    for (std::size_t i = 0; i < over.size(); ++i) {
        sum += std::uint64_t{over[i]} + (i < under.size() ? under[i] : 0);
        over[i] = lowDigit(sum);
        sum >>= s_digitBits;
    }
    return lowDigit(digit - 1);
}

} // namespace

Natural::Natural(std::uint64_t number) : digits_{lowDigit(number), lowDigit(number >> s_digitBits)} {
    trim();
}

Natural Natural::decimal(std::string_view digits) {
    Natural number;
    while (!digits.empty()) {
        const std::size_t count = std::min(digits.size(), s_digitsOfBillion);
        std::uint32_t factor = 1;
        std::uint32_t part = 0;
        for (const char digit : digits.substr(0, count)) {
            factor *= 10;
            part = part * 10 + static_cast<std::uint32_t>(digit - '0');
        }
        number.multiplyAndAdd(factor, part);
        digits.remove_prefix(count);
    }
    return number;
}

void Natural::trim() {
    while (!digits_.empty() && digits_.back() == 0)
        digits_.pop_back();
}

void Natural::multiplyAndAdd(std::uint32_t factor, std::uint32_t summand) {
    std::uint64_t carry = summand;
    for (std::uint32_t& digit : digits_) {
        carry += std::uint64_t{digit} * factor;
        digit = lowDigit(carry);
        carry >>= s_digitBits;
    }
    if (carry != 0)
        digits_.push_back(lowDigit(carry));
}

/// Leaves the quotient and returns the remainder.
std::uint32_t Natural::divideBy(std::uint32_t divisor) {
    std::uint64_t remainder = 0;
    for (auto digit = digits_.rbegin(); digit != digits_.rend(); ++digit) {
        remainder = remainder << s_digitBits | *digit;
        *digit = lowDigit(remainder / divisor);
        remainder %= divisor;
    }
    trim();
    return lowDigit(remainder);
}

std::size_t Natural::bits() const {
    return isZero() ? 0 : digits_.size() * s_digitBits - static_cast<std::size_t>(std::countl_zero(digits_.back()));
}

std::optional<std::uint64_t> Natural::in64Bits() const {
    if (digits_.size() > 2)
        return std::nullopt;
    const std::uint64_t high = digits_.size() > 1 ? digits_[1] : 0;
    return high << s_digitBits | (isZero() ? 0 : digits_[0]);
}

Natural Natural::shiftedLeft(std::size_t places) const {
    if (isZero())
        return {};
    Natural result;
    result.digits_.assign(places / s_digitBits, 0);
    std::uint64_t carry = 0;
    for (const std::uint32_t digit : digits_) {
        carry |= std::uint64_t{digit} << places % s_digitBits;
        result.digits_.push_back(lowDigit(carry));
        carry >>= s_digitBits;
    }
    result.digits_.push_back(lowDigit(carry));
    result.trim();
    return result;
}

Natural Natural::shiftedRight(std::size_t places) const {
    Natural result;
    for (std::size_t i = places / s_digitBits; i < digits_.size(); ++i) {
        const std::uint64_t next = i + 1 < digits_.size() ? digits_[i + 1] : 0;
        result.digits_.push_back(lowDigit((next << s_digitBits | digits_[i]) >> places % s_digitBits));
    }
    result.trim();
    return result;
}

std::string Natural::text() const {
    if (isZero())
        return "0";
    std::string reversed;
    for (Natural rest = *this; !rest.isZero();) {
        std::uint32_t part = rest.divideBy(s_billion);
        for (std::size_t i = 0; i < s_digitsOfBillion; ++i, part /= 10)
            reversed.push_back(static_cast<char>('0' + part % 10));
    }
    reversed.erase(reversed.find_last_not_of('0') + 1);
    return {reversed.rbegin(), reversed.rend()};
}

Natural operator+(const Natural& left, const Natural& right) {
    const auto& [shorter, longer] =
        left.digits_.size() < right.digits_.size() ? std::tie(left, right) : std::tie(right, left);
    Natural sum;
    sum.digits_.reserve(longer.digits_.size() + 1);
    std::uint64_t carry = 0;
    for (std::size_t i = 0; i < longer.digits_.size(); ++i) {
        carry += std::uint64_t{longer.digits_[i]} + (i < shorter.digits_.size() ? shorter.digits_[i] : 0);
        sum.digits_.push_back(lowDigit(carry));
        carry >>= s_digitBits;
    }
    sum.digits_.push_back(lowDigit(carry));
    sum.trim();
    return sum;
}

Natural operator-(const Natural& left, const Natural& right) {
    return Natural::difference(1, left, 1, right);
}

/// Returns leftFactor * left - rightFactor * right, which is not negative. The factors have at most 30 bits and the
/// same sign.
Natural Natural::difference(std::int64_t leftFactor, const Natural& left, std::int64_t rightFactor,
                            const Natural& right) {
    Natural result;
    const std::size_t size = std::max(left.digits_.size(), right.digits_.size());
    result.digits_.reserve(size + 1);
    std::int64_t carry = 0;
    for (std::size_t i = 0; i < size; ++i) {
        carry += leftFactor * (i < left.digits_.size() ? std::int64_t{left.digits_[i]} : 0);
        carry -= rightFactor * (i < right.digits_.size() ? std::int64_t{right.digits_[i]} : 0);
        result.digits_.push_back(lowDigit(static_cast<std::uint64_t>(carry)));
        carry >>= s_digitBits;
    }
    result.digits_.push_back(lowDigit(static_cast<std::uint64_t>(carry)));
    result.trim();
    return result;
}

Natural operator*(const Natural& left, const Natural& right) {
    if (left.isOne() || right.isOne())
        return left.isOne() ? right : left;
    Natural product;
    product.digits_.assign(left.digits_.size() + right.digits_.size(), 0);
    for (std::size_t i = 0; i < left.digits_.size(); ++i) {
        std::uint64_t carry = 0;
        for (std::size_t j = 0; j < right.digits_.size(); ++j) {
            carry += std::uint64_t{left.digits_[i]} * right.digits_[j] + product.digits_[i + j];
            product.digits_[i + j] = lowDigit(carry);
            carry >>= s_digitBits;
        }
        product.digits_[i + right.digits_.size()] = lowDigit(carry);
    }
    product.trim();
    return product;
}

std::strong_ordering operator<=>(const Natural& left, const Natural& right) {
    if (left.digits_.size() != right.digits_.size())
        return left.digits_.size() <=> right.digits_.size();
    const auto [first, second] = std::mismatch(left.digits_.rbegin(), left.digits_.rend(), right.digits_.rbegin());
    return first == left.digits_.rend() ? std::strong_ordering::equal : *first <=> *second;
}

Natural::Division Natural::dividedBy(const Natural& divisor) const {
    if (*this < divisor)
        return {{}, *this};
    if (divisor.isOne())
        return {*this, {}};
    if (divisor.digits_.size() == 1) {
        Natural quotient = *this;
        const std::uint32_t remainder = quotient.divideBy(divisor.digits_[0]);
        return {std::move(quotient), Natural(remainder)};
    }
    const auto places = static_cast<std::size_t>(std::countl_zero(divisor.digits_.back()));
    const std::vector<std::uint32_t> under = divisor.shiftedLeft(places).digits_;
    std::vector<std::uint32_t> over = shiftedLeft(places).digits_;
    over.resize(digits_.size() + 1);
    Natural quotient;
    quotient.digits_.resize(over.size() - under.size());
    for (std::size_t place = quotient.digits_.size(); place > 0; --place)
        quotient.digits_[place - 1] = divideAt({over.data() + place - 1, under.size() + 1}, under);
    Natural remainder;
    remainder.digits_ = std::move(over);
    remainder.trim();
    quotient.trim();
    return {std::move(quotient), remainder.shiftedRight(places)};
}

/// Makes many of Euclid's steps at once, as far as the leading bits of both numbers tell them.
void Natural::reduceTogether(Natural& larger, Natural& smaller) {
    constexpr std::size_t leadingBits = 62;
    const std::size_t places = larger.bits() - leadingBits;
    LeadingBits leading{static_cast<std::int64_t>(larger.shiftedRight(places).in64Bits().value_or(0)),
                        static_cast<std::int64_t>(smaller.shiftedRight(places).in64Bits().value_or(0))};
    while (leading.step()) {
    }
    if (leading.b == 0) {
        larger = std::exchange(smaller, larger.dividedBy(smaller).remainder);
        return;
    }
    Natural next = difference(leading.a, larger, -leading.b, smaller);
    smaller = difference(leading.c, larger, -leading.d, smaller);
    larger = std::move(next);
}

Natural greatestCommonDivisor(Natural left, Natural right) {
    if (left < right)
        std::swap(left, right);
    while (right.digits_.size() > 2)
        Natural::reduceTogether(left, right);
    if (right.isZero() || right.isOne())
        return right.isZero() ? left : right;
    const std::uint64_t remainder = left.dividedBy(right).remainder.in64Bits().value_or(0);
    return Natural(std::gcd(remainder, right.in64Bits().value_or(0)));
}

} // namespace ZULMetaData::detail
