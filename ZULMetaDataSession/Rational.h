#pragma once

// Exact fractions, for the edges of cuts. They have no largest number: ten thousand pieces of odd lengths follow one
// another without a rounding error.

#include "../SharedDependencies/Export.h"

#include <compare>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// An exact fraction. Its denominator is positive.
class ZULMETADATA_API Rational {
public:
    Rational() = default;                                           ///< creates 0
    Rational(std::int64_t numerator, std::int64_t denominator = 1); ///< the denominator is not 0

    /// Returns exactly this number, which is finite.
    static Rational of(double number);

    /// Reads digits with an optional fraction ("12.5"), or two integers ("61/3"). Returns nothing for any other text: a
    /// sign, a blank, an exponent, a denominator of 0, or more than 1,000 digits.
    static std::optional<Rational> parse(std::string_view text);

    /// Returns the nearest double, ties to even; infinity if it is too large.
    double nearest() const;

    /// Returns "61/3", or "10" for an integer. `parse` reads it back if it is not negative.
    std::string text() const;

    bool isZero() const;     ///< returns whether it is 0
    bool isNegative() const; ///< returns whether it is below 0

    friend ZULMETADATA_API Rational operator+(const Rational& left, const Rational& right);
    friend ZULMETADATA_API Rational operator-(const Rational& left, const Rational& right);
    friend ZULMETADATA_API Rational operator*(const Rational& left, const Rational& right);
    friend ZULMETADATA_API Rational operator/(const Rational& left, const Rational& right); ///< `right` is not 0
    friend ZULMETADATA_API std::strong_ordering operator<=>(const Rational& left, const Rational& right);
    friend ZULMETADATA_API bool operator==(const Rational& left, const Rational& right);

private:
    using Magnitude =
        std::vector<std::uint32_t>; ///< digits to the base of 2^32, the lowest first, without leading zeros

    Magnitude numerator_;
    Magnitude denominator_{1};
    bool isNegative_ = false;
};

} // namespace ZULMetaData
