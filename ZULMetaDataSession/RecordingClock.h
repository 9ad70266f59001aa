#pragma once

// Turns times of a monotonic clock into times of the recording: seconds since the first frame, without the pauses.
//
//     RecordingClock clock;
//     clock.start(timeOfFirstFrame);
//     if (const auto time = clock.timeOf<CursorActionKind>(timeOfClick))
//         session.write<CursorActionKind>(*time, storedButtonAction(MouseButton::Left, true));

#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/MetaDataKinds.h"
#include "Track.h"

#include <chrono>
#include <compare>
#include <concepts>
#include <cstdint>
#include <optional>
#include <vector>

namespace ZULMetaData {

/// A time of a monotonic clock in nanoseconds, counted from any time. `std::chrono::steady_clock::time_point` and whole
/// durations convert to it; a duration is what the clock shows.
struct MonotonicTime {
    std::int64_t nanoseconds = 0; ///< may be negative

    constexpr MonotonicTime() = default; ///< creates the time 0

    /// Takes a duration since the time 0 of the clock.
    template <std::integral Count, class Period>
    constexpr MonotonicTime(std::chrono::duration<Count, Period> sinceZero)
        : nanoseconds(std::chrono::nanoseconds(sinceZero).count()) {}

    /// Takes a time of the standard library's monotonic clock.
    constexpr MonotonicTime(std::chrono::steady_clock::time_point time) : MonotonicTime(time.time_since_epoch()) {}

    friend constexpr auto operator<=>(MonotonicTime, MonotonicTime) = default; ///< compares the nanoseconds
};

/// Knows when the recording began and when it paused. Observations may be asked for in any order, long after they were
/// made: the clock remembers every pause. A later time of the monotonic clock never has an earlier time in the
/// recording. One thread at a time may use a clock.
class ZULMETADATA_API RecordingClock {
public:
    /// What becomes of an observation that was made before the first frame or while the recording was paused.
    enum class Outside : std::uint8_t {
        Drop,       ///< it is not in the recording
        MoveToEdge, ///< it gets the time of the first frame, or that at which the recording paused and goes on
    };

    /// Sets the time of the first frame, which is 0 in the recording. Later calls have no effect.
    void start(MonotonicTime firstFrame);

    /// Pauses the recording from `time` on; what was observed at `time` itself is in the pause. Has no effect during a
    /// pause. A time before the end of the last pause counts as that end. It may be in the future, but not in the past:
    /// times that were returned already would then be wrong.
    void pause(MonotonicTime time);

    /// Ends the pause; what was observed at `time` itself is in the recording. Has no effect without a pause. A time
    /// before the beginning of the pause counts as that beginning: there was no pause then.
    void resume(MonotonicTime time);

    bool hasStarted() const { return firstFrame_.has_value(); }                  ///< returns whether `start` was called
    bool isPaused() const { return !pauses_.empty() && !pauses_.back().isOver; } ///< returns whether a pause has no end

    /// Returns the time of the recording in seconds, or nothing if the observation is not in it. Before `start` that is
    /// so for all observations; those that are moved have the time 0, which they will keep if they were made before the
    /// first frame.
    std::optional<double> timeOf(MonotonicTime time, Outside outside = Outside::Drop) const;

    /// Does the same for an entry of a kind. What is outside is dropped if the kind has events. A state is moved to the
    /// edge, since it still holds there: of several states that are moved to one edge, write only the last.
    template <RecordedKind Kind>
    std::optional<double> timeOf(MonotonicTime time) const {
        return timeOf(time, Kind::role == StreamRole::Event ? Outside::Drop : Outside::MoveToEdge);
    }

    /// Returns the time of the recording without rounding, for the frames of the movie.
    std::optional<std::chrono::nanoseconds> elapsedAt(MonotonicTime time, Outside outside = Outside::Drop) const;

private:
    struct Pause {
        MonotonicTime begin;
        MonotonicTime end; ///< after `begin`, once it is over
        bool isOver = false;
        std::uint64_t pausedBefore = 0; ///< nanoseconds of the earlier pauses
    };

    std::uint64_t pausedUntilNow() const;
    std::uint64_t elapsedUntil(MonotonicTime time, std::uint64_t paused) const;

    std::optional<MonotonicTime> firstFrame_;
    std::vector<Pause> pauses_; ///< in their order; they do not overlap, and none begins before the first frame
};

} // namespace ZULMetaData
