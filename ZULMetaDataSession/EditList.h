#pragma once

// Which pieces of a recording make an edited movie.
//
//     EditList edits;
//     edits.keep({10}, {61, 3}, {3, 2}); // from 10 s to 61/3 s, one and a half times as fast
//     edits.hold({25, 2}, {2});          // the frame at 12.5 s for 2 s
//     std::cout << edits.json();

#include "../SharedDependencies/Export.h"
#include "Error.h"
#include "Rational.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// A piece of the source at a speed, or one frame of it that is held.
struct EditPiece {
    Rational start;    ///< in seconds of the source; for a held frame, the time of the frame
    Rational end;      ///< in seconds of the source; for a held frame the same as `start`
    Rational speed{1}; ///< source seconds for each edited second, above 0
    Rational duration; ///< in seconds of the edited movie, above 0

    bool isHeld() const { return start == end; } ///< returns whether this is a held frame
};

/// Pieces that follow one another on the edited time line. In the source they may repeat, overlap, and come in any
/// order.
class ZULMETADATA_API EditList {
public:
    /// Adds [start, end) at a speed. Throws `Error` if an argument is negative, `end` is not after `start`, or the
    /// speed is not above 0.
    void keep(const Rational& start, const Rational& end, const Rational& speed = {1});

    /// Adds the frame at `at` for `duration`. Throws `Error` if `at` is negative or `duration` is not above 0.
    void hold(const Rational& at, const Rational& duration);

    const std::vector<EditPiece>& pieces() const { return pieces_; } ///< returns the pieces in the edited order
    Rational duration() const;                                       ///< returns the length of the edited movie

private:
    std::vector<EditPiece> pieces_;
};

} // namespace ZULMetaData
