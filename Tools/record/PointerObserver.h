#pragma once

#include "Tools/record/HeldInput.h"
#include "Tools/record/Journal.h"
#include "Tools/record/ScrollAxis.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/XConnection.h"

#include <xcb/xinput.h>

#include <array>
#include <cstdint>
#include <map>
#include <optional>
#include <vector>

namespace Recorder {

/// Where the pointer is, its buttons and its wheel.
class PointerObserver {
public:
    PointerObserver(XConnection& connection, const ServerClock& clock, Journal& journal, HeldInput& input);

    void moved(const xcb_input_raw_motion_event_t& event);
    void button(const xcb_input_raw_button_press_event_t& event, bool isPress, ZULMetaData::Modifiers modifiers);

    /// Devices came, went or changed.
    void devicesChanged() { axes_.clear(); }
    void buttonsRemapped();

    /// Asks where the pointer is if there was a motion since the last call.
    void followMotions();

    /// Notes where the pointer was when that was asked.
    void saw(Instant asked, Position position);

    std::optional<Position> position() const { return position_; }

private:
    std::vector<ScrollAxis>& axesOf(std::uint16_t device);
    void note(Instant instant, Instant asked, Position position);
    void scrollBy(const xcb_input_raw_motion_event_t& event);
    void noteScroll(Instant instant, std::int32_t x, std::int32_t y);

    XConnection& connection_;
    const ServerClock& clock_;
    Journal& journal_;
    HeldInput& input_;
    std::optional<Position> position_;
    Instant positionInstant_ = 0;
    Instant asked_ = 0;             ///< when the position was asked for
    std::optional<Instant> motion_; ///< of the last one whose position is not known
    std::vector<std::uint8_t> buttonMap_;
    std::map<std::uint16_t, std::vector<ScrollAxis>> axes_;
};

} // namespace Recorder
