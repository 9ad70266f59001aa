#include "ZULMetaDataSession/Timeline.h"

#include "ZULMetaDataSession/RecordingStates.h"

#include <algorithm>
#include <limits>
#include <span>
#include <tuple>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr double s_infinity = std::numeric_limits<double>::infinity();

/// How many entries a timeline passes one by one before it searches.
constexpr std::size_t s_steps = 8;

std::shared_ptr<const detail::RecordingStates> statesOf(const Recording& recording,
                                                        const Callback<void(const Error&)>& leaveOut) {
    return std::make_shared<const detail::RecordingStates>([&]<class Kind>() {
        try {
            return recording.track<Kind>();
        } catch (const Error& error) {
            leaveOut(error);
            return Track<Kind>();
        }
    });
}

} // namespace

static_assert(std::tuple_size_v<detail::EntryCounts> == detail::TimelinePlaces::count);

Timeline::Timeline(const Recording& recording, Interpolation interpolation)
    : Timeline(recording.states(), interpolation) {}

Timeline::Timeline(const Recording& recording, const Callback<void(const Error&)>& leaveOut,
                   Interpolation interpolation)
    : Timeline(statesOf(recording, leaveOut), interpolation) {}

Timeline::Timeline(std::shared_ptr<const detail::RecordingStates> states, Interpolation interpolation)
    : states_(std::move(states)), interpolation_(interpolation) {
    jumpTo(-s_infinity);
}

const Snapshot& Timeline::at(double time) {
    snapshot_.time = time;
    for (std::size_t place = 0; place < detail::TimelinePlaces::count; ++place) {
        if (places_.from[place] <= time && time < places_.until[place])
            continue;
        if (!stepTo(place, time)) {
            jumpTo(time);
            break;
        }
        states_->show(place, places_.entries, snapshot_);
    }
    states_->showCursor(places_.entries, interpolation_, snapshot_);
    return snapshot_;
}

/// Returns false if the entry that holds is not among the next few.
bool Timeline::stepTo(std::size_t place, double time) {
    const std::span<const double> times = states_->times(place);
    std::size_t& count = places_.entries[place];
    for (std::size_t step = 0; step < s_steps && count < times.size() && times[count] <= time; ++step)
        ++count;
    for (std::size_t step = 0; step < s_steps && count > 0 && times[count - 1] > time; ++step)
        --count;
    setRange(place);
    return places_.from[place] <= time && time < places_.until[place];
}

void Timeline::jumpTo(double time) {
    places_.entries = states_->countsUntil(time);
    for (std::size_t place = 0; place < detail::TimelinePlaces::count; ++place)
        setRange(place);
    states_->show(places_.entries, snapshot_);
}

void Timeline::setRange(std::size_t place) {
    const std::span<const double> times = states_->times(place);
    const std::size_t count = places_.entries[place];
    places_.from[place] = count == 0 ? -s_infinity : times[count - 1];
    places_.until[place] = count == times.size() ? s_infinity : times[count];
}

} // namespace ZULMetaData
