#pragma once

#include "Tools/record/Instant.h"
#include "Tools/record/Journal.h"
#include "Tools/record/XConnection.h"

#include <cstdint>

namespace Recorder {

/// How busy the machine is, what it is, and the scale of its display.
class MachineObserver {
public:
    MachineObserver(const XConnection& connection, Journal& journal);

    /// Notes the usage once a second.
    void poll();

private:
    struct Ticks {
        std::uint64_t busy = 0;
        std::uint64_t all = 0;
    };
    static Ticks readTicks();

    Journal& journal_;
    Ticks last_;
    Instant next_ = 0;
};

/// Returns the scale factor of the display: that of its fonts, as a whole number.
std::int32_t scaleOf(const XConnection& connection);

} // namespace Recorder
