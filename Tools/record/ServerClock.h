#pragma once

#include "Tools/record/Instant.h"
#include "Tools/record/XConnection.h"

#include <cstdint>
#include <string>

namespace Recorder {

/// Turns times of the X server, which are milliseconds of 32 bits, into instants of this machine's clock.
///
/// A server on this machine counts CLOCK_MONOTONIC, so its times are exact to the millisecond. Another server's clock
/// has a distance to ours, which is asked for again and again.
class ServerClock {
public:
    /// Asks the server for its time, on a connection of its own: the answers are events.
    explicit ServerClock(const std::string& display);

    /// Asks again if the server counts another clock and some time has passed.
    void keepUp();

    /// Returns the instant of a time of an event that has just arrived; never later than the present.
    Instant instantOf(std::uint32_t serverTime) const;

private:
    void synchronize();
    std::uint32_t askTime();

    XConnection connection_;
    xcb_window_t window_;
    xcb_atom_t property_;
    Instant next_ = 0;     ///< when to ask again
    Instant distance_ = 0; ///< of the server's time, as an unwrapped number, to ours
};

} // namespace Recorder
