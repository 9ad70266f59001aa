#pragma once

// A calm path of the cursor, for editors that draw the cursor themselves.
//
//     const CursorPath path(positions, clicks);
//     for (int frame = 0; frame < frames; ++frame)
//         drawCursor(path.at(frame / 60.0));

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "../Track.h"
#include "Clicks.h"

#include <cstddef>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

/// How much a path is smoothed: a one-euro filter that runs forward and backward.
struct CursorPathOptions {
    double minCutoff = 1;   ///< Hz: the cutoff frequency for a cursor that hardly moves; a lower one smooths more
    double beta = 0.007;    ///< Hz for each unit in a second, which a moving cursor adds to the cutoff frequency
    double speedCutoff = 1; ///< Hz: the cutoff frequency of the speed itself
    double rest = 0.2;      ///< seconds; a cursor that stays at one position this long rests there
};

/// A path that neither lags nor leads, because the filter has zero phase. It passes exactly through the position of
/// every click at the time of its press, through the end of every drag, and stays where the cursor rests. Equal input
/// makes an equal path on every machine, to the last bit.
///
/// Before it is smoothed, the cursor moves as in `cursorPositionAt`: straight from entry to entry, but if nothing is
/// recorded for more than twice the usual distance (at most 1 s), it stays, and then moves within that distance.
class ZULMETADATA_API CursorPath {
public:
    CursorPath() = default; ///< creates an empty path

    /// Smooths the positions. Clicks without a position, or at a time that is not finite, are left out; of several at
    /// one time the last counts. Takes O(n log n) time and O(n) memory.
    CursorPath(const Track<CursorLocationKind>& positions, const std::vector<Click>& clicks,
               const CursorPathOptions& options = {});

    bool empty() const { return times_.empty(); } ///< returns true if no position is known

    /// Returns where the cursor is, in units of the display. Before the first entry that is the first
    /// position, and after the last entry the last one. Empty if no position is known. Takes O(log n) time.
    std::optional<ScreenPoint> at(double time) const;

    /// Returns the positions at `count` times, of which the first is `start` and the others follow `rate` times in a
    /// second. Empty if no position is known.
    std::vector<ScreenPoint> resampled(double start, double rate, std::size_t count) const;

    /// Return the corners of the path, between which the cursor moves in straight lines. Times are in seconds and
    /// ascend; two are equal where the cursor jumps.
    ///@{
    std::span<const double> times() const { return times_; }
    std::span<const ScreenPoint> points() const { return points_; }
    ///@}

private:
    std::vector<double> times_;
    std::vector<ScreenPoint> points_;
};

} // namespace ZULMetaData
