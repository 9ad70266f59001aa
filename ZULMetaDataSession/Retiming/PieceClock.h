#pragma once

// Where the times of a piece are on the edited time line.

#include "ZULMetaDataSession/EditList.h"

namespace ZULMetaData::detail {

/// A number as the sum of two doubles, the second one much smaller than the first.
struct DoubleSum {
    double high = 0;
    double low = 0;
    bool isExact = false; ///< whether `high` alone is the number
};

/// Maps times of the source to the edited time line. The result is what exact fractions make of a time, rounded once to
/// the nearest double, though fractions are used only if two doubles leave a doubt about the rounding.
class PieceClock {
public:
    /// `base` is where the piece begins on the edited time line.
    PieceClock(const EditPiece& piece, const Rational& base);

    bool isHeld() const { return piece_.isHeld(); }
    double start() const { return start_; } ///< in the source, as the nearest double
    double end() const { return end_; }     ///< in the source, as the nearest double
    double first() const { return first_; } ///< on the edited time line, as the nearest double
    double last() const { return last_; }   ///< on the edited time line, as the nearest double

    /// Returns base + (time - start) / speed for a finite time. An edge that is no double may be rounded past an entry
    /// that it is compared with; that entry stays inside the piece.
    double timeOf(double time) const;

    /// Returns the same, computed with fractions alone.
    double exactTimeOf(double time) const;

private:
    double nearestTimeOf(double time) const;
    double nearestExactly(double time) const;

    EditPiece piece_;
    Rational base_;
    double start_;
    double end_;
    double first_;
    double last_;
    DoubleSum slope_;  ///< 1 / speed
    DoubleSum offset_; ///< base - start / speed
    bool isInRange_;   ///< whether both can be computed with without an overflow
};

} // namespace ZULMetaData::detail
