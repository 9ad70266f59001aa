#pragma once

// From the time of the film to the time of the recording.

#include "ZULMetaDataSession/EditList.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace Render {

/// A time of the film, and what is shown then.
struct FilmTime {
    double film = 0;       ///< in seconds of the film
    double source = 0;     ///< in seconds of the recording
    std::size_t piece = 0; ///< of the edit list
};

class TimeMap {
public:
    /// The list has at least one piece.
    explicit TimeMap(const ZULMetaData::EditList& edits);

    double duration() const { return duration_; } ///< of the film, in seconds

    /// Returns how many frames the film has at this rate: at least one.
    std::int64_t frames(double fps) const;

    /// Returns what is shown at a time of the film; what is outside of it counts as its edge.
    FilmTime at(double film) const;

    /// Returns how many seconds of the film have passed since the piece that is shown began.
    double sinceCut(const FilmTime& now) const { return now.film - pieces_[now.piece].base; }

    /// Returns how many seconds of the film have passed since a time of the recording. Empty if that time is not in
    /// the same piece, or is later. A frame that is held looks as it looked in the recording.
    std::optional<double> since(double source, const FilmTime& now) const;

private:
    struct Piece {
        double base = 0;
        double start = 0;
        double end = 0;
        double speed = 1;
        bool isHeld = false;
    };

    std::vector<Piece> pieces_;
    double duration_ = 0;
};

} // namespace Render
