#pragma once

// What was observed, on its way into the streams: nothing before the first frame or inside of a pause is in them, and
// what holds is.

#include "Tools/record/Instant.h"
#include "ZULMetaDataSession/RecordingClock.h"
#include "ZULMetaDataSession/SessionWriter.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <deque>
#include <functional>
#include <optional>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

namespace Recorder {

/// The value in which an observation of a kind is noted.
template <class Kind>
using Noted = std::conditional_t<std::is_same_v<Kind, ZULMetaData::CursorImageKind>, ZULMetaData::CursorAppearance,
                                 typename Kind::Value>;

/// Writes observations, which have instants, as entries, which have times. One thread uses it.
class Journal {
public:
    /// `onLoss` is called once, if an entry cannot be written.
    Journal(const std::filesystem::path& folder, const std::function<void(const ZULMetaData::Error&)>& onLoss);

    /// Notes an observation. A state that holds already is not written again.
    template <class Kind>
    void note(Instant instant, const Noted<Kind>& value);

    /// Writes the state that holds once more, at an instant up to which it held.
    template <class Kind>
    void noteStill(Instant instant);

    /// Begins the streams: what was noted last of each state is written at 0, and events before `zero` are left out.
    void start(Instant zero);

    /// From `instant` on nothing is recorded.
    void pause(Instant instant);

    /// Goes on, and writes the states that changed meanwhile.
    void resume(Instant instant);

    /// Nothing from `instant` on is recorded, which may lie ahead. Without one, the recording has no end yet.
    void endAt(std::optional<Instant> instant) { end_ = instant; }

    /// Returns the time in the recording, less pauses. An instant in a pause has that of the pause.
    double timeOf(Instant instant) const {
        return clock_.timeOf(timeIn(instant), ZULMetaData::RecordingClock::Outside::MoveToEdge).value_or(0);
    }

    void flushIfDue() { session_.flushIfDue(); }
    ZULMetaData::SessionWriter& session() { return session_; }
    std::uint64_t entries() const;
    std::vector<std::pair<std::string, std::uint64_t>> entriesByKind() const;
    std::uint64_t bytes() const { return bytes_; } ///< about as many as the streams have

private:
    static ZULMetaData::MonotonicTime timeIn(Instant instant) { return std::chrono::nanoseconds(instant); }
    template <class Kind>
    struct Slot {
        using KindType = Kind;
        std::optional<Noted<Kind>> held;                   ///< the last one that was noted
        std::optional<Noted<Kind>> written;                ///< the last one in the stream
        double time = 0;                                   ///< of the last entry
        std::deque<std::pair<Instant, Noted<Kind>>> early; ///< before it is known when the recording began
    };
    template <class... Kinds>
    static std::tuple<Slot<Kinds>...> slotsOf(ZULMetaData::KindList<Kinds...>);

    template <class Kind>
    Slot<Kind>& slot() {
        return std::get<Slot<Kind>>(slots_);
    }
    template <class Kind>
    void write(Slot<Kind>& slot, double time, const Noted<Kind>& value);
    template <class Kind>
    void begin(Slot<Kind>& slot, Instant zero);
    /// Returns nothing for what is not in the recording. A state that was observed a little before it began or goes on
    /// still holds then.
    template <class Kind>
    std::optional<double> timeInside(Instant instant) const;

    ZULMetaData::SessionWriter session_;
    decltype(slotsOf(ZULMetaData::RecordedKinds())) slots_;
    ZULMetaData::RecordingClock clock_;
    std::optional<Instant> end_;
    std::uint64_t bytes_ = 0;
};

// ---------------------------------------------------------------------------------------------------------------

/// Whether a kind is measured again and again, so that an equal value says something.
template <class Kind>
inline constexpr bool isMeasured = std::is_same_v<Kind, ZULMetaData::CPUUsageKind>;

/// Whether two states of a kind are the same.
template <class Value>
bool isSameState(const Value& left, const Value& right) {
    if constexpr (std::is_same_v<Value, ZULMetaData::CursorAppearance>)
        return left.id == right.id;
    else
        return left == right;
}

template <class Kind>
std::optional<double> Journal::timeInside(Instant instant) const {
    if (end_ && instant >= *end_)
        return std::nullopt;
    return clock_.isPaused() ? clock_.timeOf(timeIn(instant)) : clock_.timeOf<Kind>(timeIn(instant));
}

template <class Kind>
void Journal::note(Instant instant, const Noted<Kind>& value) {
    constexpr bool isState = Kind::role == ZULMetaData::StreamRole::State;
    constexpr bool isRepeated = !isState || isMeasured<Kind>;
    Slot<Kind>& own = slot<Kind>();
    if (!clock_.hasStarted()) {
        constexpr Instant longestStart = 10 * s_second; // of the first frame, after its instant
        own.early.emplace_back(instant, value);
        while (own.early.size() > 1 && own.early[1].first < instant - longestStart)
            own.early.pop_front();
        return;
    }
    if constexpr (isState)
        own.held = value;
    const std::optional<double> time = timeInside<Kind>(instant);
    if (time && (isRepeated || !own.written || !isSameState(*own.written, value)))
        write<Kind>(own, *time, value);
}

template <class Kind>
void Journal::noteStill(Instant instant) {
    Slot<Kind>& own = slot<Kind>();
    const std::optional<double> time = timeInside<Kind>(instant);
    if (own.written && time && *time > own.time)
        write<Kind>(own, *time, Noted<Kind>(*own.written));
}

template <class Kind>
void Journal::write(Slot<Kind>& slot, double time, const Noted<Kind>& value) {
    slot.time = std::max(slot.time, time);
    slot.written = value;
    session_.write<Kind>(slot.time, value);
    constexpr std::uint64_t roughSize = 32;
    bytes_ += roughSize;
    if constexpr (std::is_same_v<Kind, ZULMetaData::CursorImageKind>)
        bytes_ += value.picture ? value.picture->bytes.size() : 0;
    else if constexpr (std::is_same_v<Noted<Kind>, std::string>)
        bytes_ += value.size();
}

} // namespace Recorder
