#include "Tools/record/ServerClock.h"

#include <algorithm>
#include <limits>

namespace Recorder {

namespace {

constexpr int s_attempts = 5;
constexpr Instant s_interval = 10 * s_second;      ///< in which no clock drifts far
constexpr Instant s_sameClock = 5 * s_millisecond; ///< a distance that is none, but the ticks of the server

} // namespace

ServerClock::ServerClock(const std::string& display)
    : connection_(display), window_(xcb_generate_id(connection_.get())), property_(connection_.atom("ZULM_TIME")) {
    const std::uint32_t events = XCB_EVENT_MASK_PROPERTY_CHANGE;
    xcb_create_window(connection_.get(), 0, window_, connection_.root(), 0, 0, 1, 1, 0, XCB_WINDOW_CLASS_INPUT_ONLY,
                      XCB_COPY_FROM_PARENT, XCB_CW_EVENT_MASK, &events);
    synchronize();
}

/// The event of a changed property has the time of the change.
std::uint32_t ServerClock::askTime() {
    xcb_change_property(connection_.get(), XCB_PROP_MODE_REPLACE, window_, property_, XCB_ATOM_STRING, 8, 0, nullptr);
    connection_.flush();
    while (const Reply<xcb_generic_event_t> event{xcb_wait_for_event(connection_.get())}) {
        if ((event->response_type & s_eventTypeBits) == XCB_PROPERTY_NOTIFY)
            return reinterpret_cast<const xcb_property_notify_event_t*>(event.get())->time;
    }
    return 0;
}

void ServerClock::keepUp() {
    if (distance_ != 0 && now() >= next_)
        synchronize();
}

void ServerClock::synchronize() {
    next_ = now() + s_interval;
    Instant best = 0;
    Instant shortest = std::numeric_limits<Instant>::max();
    for (int attempt = 0; attempt < s_attempts; ++attempt) {
        const Instant asked = now();
        const std::uint32_t time = askTime();
        const Instant answered = now();
        if (answered - asked >= shortest)
            continue;
        shortest = answered - asked;
        const Instant middle = middleOf(asked, answered);
        best = middle - unwrapped(time, middle);
    }
    distance_ = best > -s_sameClock && best < s_sameClock ? 0 : best;
}

Instant ServerClock::instantOf(std::uint32_t serverTime) const {
    const Instant present = now();
    return std::min(present, unwrapped(serverTime, present - distance_) + distance_);
}

} // namespace Recorder
