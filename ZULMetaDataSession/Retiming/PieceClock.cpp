#include "ZULMetaDataSession/Retiming/PieceClock.h"

#include <algorithm>
#include <cmath>

namespace ZULMetaData::detail {

namespace {

/// Beyond these magnitudes, products might leave the range of doubles or lose digits, and what is in doubt could be 0.
constexpr double s_mostMagnitude = 0x1p+500;
constexpr double s_leastMagnitude = 0x1p-400;

/// More than what the computation with two doubles can be wrong by, as a part of its largest number. Its error is a few
/// units of 2^-106.
constexpr double s_doubt = 0x1p-98;

DoubleSum sumOf(const Rational& number) {
    DoubleSum sum{number.nearest(), 0, false};
    if (!std::isfinite(sum.high))
        return sum;
    const Rational rest = number - Rational::of(sum.high);
    sum.isExact = rest.isZero();
    sum.low = rest.nearest();
    return sum;
}

bool isInRange(double number) {
    const double magnitude = std::abs(number);
    return magnitude < s_mostMagnitude && (magnitude == 0 || magnitude > s_leastMagnitude);
}

} // namespace

PieceClock::PieceClock(const EditPiece& piece, const Rational& base)
    : piece_(piece), base_(base), start_(piece.start.nearest()), end_(piece.end.nearest()), first_(base.nearest()),
      last_((base + piece.duration).nearest()), slope_(sumOf(Rational(1) / piece.speed)),
      offset_(sumOf(base - piece.start / piece.speed)),
      isInRange_(detail::isInRange(slope_.high) && detail::isInRange(offset_.high)) {}

double PieceClock::timeOf(double time) const {
    return std::clamp(nearestTimeOf(time), first_, last_);
}

double PieceClock::exactTimeOf(double time) const {
    return std::clamp(nearestExactly(time), first_, last_);
}

/// Each product and each sum is rounded by itself: the library is compiled without fused operations.
double PieceClock::nearestTimeOf(double time) const {
    if (!isInRange_ || !detail::isInRange(time))
        return nearestExactly(time);
    if (slope_.isExact && offset_.isExact)
        return slope_.high == 1 ? time + offset_.high : std::fma(time, slope_.high, offset_.high);
    const double product = time * slope_.high;
    const double productRest = std::fma(time, slope_.high, -product);
    const double sum = product + offset_.high;
    const double addend = sum - product;
    const double sumRest = (product - (sum - addend)) + (offset_.high - addend);
    const double low = sumRest + (productRest + (time * slope_.low + offset_.low));
    const double doubt = s_doubt * (std::abs(product) + std::abs(offset_.high));
    const double least = sum + (low - doubt);
    return least == sum + (low + doubt) ? least : nearestExactly(time);
}

double PieceClock::nearestExactly(double time) const {
    return (base_ + (Rational::of(time) - piece_.start) / piece_.speed).nearest();
}

} // namespace ZULMetaData::detail
