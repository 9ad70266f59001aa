#include "ZULMetaDataSession/RecordingClock.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace ZULMetaData {

namespace {

/// Returns the nanoseconds from one time to a later one, which may be more than a signed number holds.
std::uint64_t nanosecondsBetween(MonotonicTime begin, MonotonicTime end) {
    return static_cast<std::uint64_t>(end.nanoseconds) - static_cast<std::uint64_t>(begin.nanoseconds);
}

std::chrono::nanoseconds saturated(std::uint64_t nanoseconds) {
    constexpr std::uint64_t most = std::numeric_limits<std::int64_t>::max();
    return std::chrono::nanoseconds(static_cast<std::int64_t>(std::min(nanoseconds, most)));
}

} // namespace

void RecordingClock::start(MonotonicTime firstFrame) {
    if (firstFrame_)
        return;
    firstFrame_ = firstFrame;
    for (const Pause& pause : std::exchange(pauses_, {})) {
        this->pause(pause.begin);
        if (pause.isOver)
            resume(pause.end);
    }
}

void RecordingClock::pause(MonotonicTime time) {
    if (isPaused())
        return;
    if (firstFrame_)
        time = std::max(time, *firstFrame_);
    if (!pauses_.empty())
        time = std::max(time, pauses_.back().end);
    pauses_.push_back({time, {}, false, pausedUntilNow()});
}

void RecordingClock::resume(MonotonicTime time) {
    if (!isPaused())
        return;
    Pause& last = pauses_.back();
    last.end = time;
    last.isOver = true;
    if (last.end <= last.begin)
        pauses_.pop_back();
}

std::optional<double> RecordingClock::timeOf(MonotonicTime time, Outside outside) const {
    constexpr double nanosecondsInASecond = 1e9;
    const auto elapsed = elapsedAt(time, outside);
    return elapsed ? std::optional(static_cast<double>(elapsed->count()) / nanosecondsInASecond) : std::nullopt;
}

std::optional<std::chrono::nanoseconds> RecordingClock::elapsedAt(MonotonicTime time, Outside outside) const {
    const bool isMoved = outside == Outside::MoveToEdge;
    if (!firstFrame_ || time < *firstFrame_)
        return isMoved ? std::optional(std::chrono::nanoseconds(0)) : std::nullopt;
    const auto next = std::upper_bound(pauses_.begin(), pauses_.end(), time,
                                       [](MonotonicTime wanted, const Pause& pause) { return wanted < pause.begin; });
    if (next == pauses_.begin())
        return saturated(elapsedUntil(time, 0));
    const Pause& last = *std::prev(next);
    if (last.isOver && time >= last.end)
        return saturated(elapsedUntil(time, last.pausedBefore + nanosecondsBetween(last.begin, last.end)));
    return isMoved ? std::optional(saturated(elapsedUntil(last.begin, last.pausedBefore))) : std::nullopt;
}

/// Returns the length of all pauses, which are over.
std::uint64_t RecordingClock::pausedUntilNow() const {
    if (pauses_.empty())
        return 0;
    const Pause& last = pauses_.back();
    return last.pausedBefore + nanosecondsBetween(last.begin, last.end);
}

std::uint64_t RecordingClock::elapsedUntil(MonotonicTime time, std::uint64_t paused) const {
    return nanosecondsBetween(*firstFrame_, time) - paused;
}

} // namespace ZULMetaData
