#include "ZULMetaDataSession/EditLists/Decimal.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <string>

namespace ZULMetaData::detail {

namespace {

constexpr std::int64_t s_mostPlaces = 400;

/// Returns ten to the power of an exponent from 0 to 1,998.
Rational powerOfTen(std::int64_t exponent) {
    const auto power = [](std::int64_t zeros) {
        return *Rational::parse('1' + std::string(static_cast<std::size_t>(zeros), '0'));
    };
    return power(exponent / 2) * power(exponent - exponent / 2);
}

/// Digits without leading and trailing zeros, times ten to the power of `exponent`.
struct Decimal {
    bool isNegative = false;
    std::string digits;
    std::int64_t exponent = 0;

    /// Returns the number of digits before the point; negative if zeros follow the point.
    std::int64_t places() const { return static_cast<std::int64_t>(digits.size()) + exponent; }

    /// Returns whether a double holds the digits exactly, and the power of ten as well.
    bool isShort() const { return digits.size() <= 15 && exponent >= -22 && exponent <= 0; }

    /// One division rounds once.
    double quickNearest() const {
        double integer = 0;
        for (const char digit : digits)
            integer = integer * 10 + (digit - '0');
        double power = 1;
        for (std::int64_t i = exponent; i < 0; ++i)
            power *= 10;
        return (isNegative ? -integer : integer) / power;
    }

    Rational exact() const {
        if (digits.empty())
            return {};
        const Rational integer = *Rational::parse(digits);
        const Rational magnitude = exponent < 0 ? integer / powerOfTen(-exponent) : integer * powerOfTen(exponent);
        return isNegative ? Rational() - magnitude : magnitude;
    }
};

std::int64_t exponentOf(std::string_view text) {
    constexpr std::int64_t most = 1'000'000'000;
    const bool isNegative = text.starts_with('-');
    std::int64_t exponent = 0;
    for (const char c : text)
        if (c >= '0' && c <= '9')
            exponent = std::min(exponent * 10 + (c - '0'), most);
    return isNegative ? -exponent : exponent;
}

Decimal decimalOf(std::string_view number) {
    Decimal decimal;
    decimal.isNegative = number.starts_with('-');
    const std::size_t end = std::min(number.find_first_of("eE"), number.size());
    if (end < number.size())
        decimal.exponent = exponentOf(number.substr(end + 1));
    const std::string_view mantissa = number.substr(0, end);
    const std::size_t point = mantissa.find('.');
    if (point != std::string_view::npos)
        decimal.exponent -= static_cast<std::int64_t>(mantissa.size() - point - 1);
    for (const char c : mantissa)
        if (c >= '0' && c <= '9' && (c != '0' || !decimal.digits.empty()))
            decimal.digits += c;
    const std::size_t length = decimal.digits.empty() ? 0 : decimal.digits.find_last_not_of('0') + 1;
    decimal.exponent += static_cast<std::int64_t>(decimal.digits.size() - length);
    decimal.digits.resize(length);
    return decimal;
}

} // namespace

std::optional<Rational> exactDecimal(std::string_view number) {
    const Decimal decimal = decimalOf(number);
    if (!decimal.digits.empty() && (decimal.places() > s_mostPlaces || decimal.exponent < -s_mostPlaces))
        return std::nullopt;
    return decimal.exact();
}

std::optional<Rational> nearestDouble(std::string_view number) {
    constexpr std::size_t mostTelling = 800; // two doubles, and what lies half-way between them, differ earlier
    Decimal decimal = decimalOf(number);
    if (decimal.digits.empty() || decimal.places() < -s_mostPlaces)
        return Rational();
    if (decimal.places() > s_mostPlaces)
        return std::nullopt;
    if (decimal.digits.size() > mostTelling) {
        decimal.exponent += static_cast<std::int64_t>(decimal.digits.size() - mostTelling - 1);
        decimal.digits.resize(mostTelling);
        decimal.digits += '1'; // the rest is not 0
    }
    const double nearest = decimal.isShort() ? decimal.quickNearest() : decimal.exact().nearest();
    return std::isfinite(nearest) ? std::optional(Rational::of(nearest)) : std::nullopt;
}

} // namespace ZULMetaData::detail
