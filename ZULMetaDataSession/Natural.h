#pragma once

// Whole numbers of any size, for the fractions that 64 bits do not hold.

#include <compare>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

/// A whole number that is not negative.
class Natural {
public:
    Natural() = default; ///< creates 0
    explicit Natural(std::uint64_t number);

    /// Reads decimal digits and nothing else.
    static Natural decimal(std::string_view digits);

    /// Returns two to the power of `exponent`.
    static Natural powerOfTwo(std::size_t exponent) { return Natural(1).shiftedLeft(exponent); }

    bool isZero() const { return digits_.empty(); }
    bool isOne() const { return digits_.size() == 1 && digits_[0] == 1; }
    std::size_t bits() const;                       ///< returns the position after the highest bit that is set
    std::optional<std::uint64_t> in64Bits() const;  ///< returns nothing for a number of more than 64 bits
    Natural shiftedLeft(std::size_t places) const;  ///< returns it times two to the power of `places`
    Natural shiftedRight(std::size_t places) const; ///< returns it without its lowest bits
    std::string text() const;                       ///< returns its decimal digits

    /// A quotient that is rounded down, and what remains.
    struct Division;
    Division dividedBy(const Natural& divisor) const; ///< `divisor` is not 0

    friend Natural operator+(const Natural& left, const Natural& right);
    friend Natural operator-(const Natural& left, const Natural& right); ///< `right` is not the larger one
    friend Natural operator*(const Natural& left, const Natural& right);
    friend std::strong_ordering operator<=>(const Natural& left, const Natural& right);
    friend bool operator==(const Natural& left, const Natural& right) = default;

    /// Returns the greatest common divisor. It takes a time in proportion to the product of both lengths.
    friend Natural greatestCommonDivisor(Natural left, Natural right);

private:
    void trim();
    std::uint32_t divideBy(std::uint32_t divisor);
    void multiplyAndAdd(std::uint32_t factor, std::uint32_t summand);
    static void reduceTogether(Natural& larger, Natural& smaller);
    static Natural difference(std::int64_t leftFactor, const Natural& left, std::int64_t rightFactor,
                              const Natural& right);

    std::vector<std::uint32_t> digits_; ///< to the base of 2^32, the lowest first, without leading zeros
};

struct Natural::Division {
    Natural quotient;
    Natural remainder;
};

} // namespace ZULMetaData::detail
