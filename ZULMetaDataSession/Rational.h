#pragma once

// Exact fractions, for the edges of cuts. They have no largest number: ten thousand pieces of odd lengths follow one
// another without a rounding error.

#include "../SharedDependencies/Export.h"

#include <compare>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace ZULMetaData {

/// An exact fraction in lowest terms. Its denominator is positive.
class ZULMETADATA_API Rational {
public:
    Rational() = default;                                           ///< creates 0
    Rational(std::int64_t numerator, std::int64_t denominator = 1); ///< the denominator is not 0

    template <std::floating_point Number>
    Rational(Number) = delete; ///< `of` makes a fraction of a double

    /// Returns exactly this number, which is finite.
    static Rational of(double number);

    /// Reads digits with an optional fraction ("12.5"), or two integers ("61/3"). Returns nothing for any other text: a
    /// sign, a blank, an exponent, a denominator of 0, or more than 1,000 digits.
    static std::optional<Rational> parse(std::string_view text);

    /// Returns the nearest double, ties to even; infinity if it is too large.
    double nearest() const;

    /// Returns "61/3", or "10" for an integer. `parse` reads it back if it is not negative and not too long.
    std::string text() const;

    bool isZero() const { return !large_ && numerator_ == 0; } ///< returns whether it is 0
    bool isNegative() const { return numerator_ < 0; }         ///< returns whether it is below 0

    /// Returns the number of binary digits of the numerator or of the denominator, of that which has more.
    std::size_t bits() const;

    friend ZULMETADATA_API Rational operator+(const Rational& left, const Rational& right); ///< returns the sum
    friend ZULMETADATA_API Rational operator-(const Rational& left, const Rational& right); ///< returns the difference
    friend ZULMETADATA_API Rational operator*(const Rational& left, const Rational& right); ///< returns the product
    friend ZULMETADATA_API Rational operator/(const Rational& left, const Rational& right); ///< `right` is not 0
    friend ZULMETADATA_API std::strong_ordering operator<=>(const Rational& left,
                                                            const Rational& right);      ///< compares their values
    friend ZULMETADATA_API bool operator==(const Rational& left, const Rational& right); ///< compares their values

private:
    struct Large;
    struct Arithmetic;

    /// The sign alone if the number is large. Both magnitudes have at most 63 bits.
    ///@{
    std::int64_t numerator_ = 0;
    std::int64_t denominator_ = 1;
    ///@}
    std::shared_ptr<const Large> large_; ///< the magnitudes if one of them has more than 63 bits
};

} // namespace ZULMetaData
