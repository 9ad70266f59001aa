#pragma once

// What is observed on the display while something is recorded, and the events that it is learned from.

#include "Tools/record/CursorObserver.h"
#include "Tools/record/FocusWatch.h"
#include "Tools/record/FreeKeys.h"
#include "Tools/record/HeldInput.h"
#include "Tools/record/Journal.h"
#include "Tools/record/KeyObserver.h"
#include "Tools/record/MachineObserver.h"
#include "Tools/record/Mailbox.h"
#include "Tools/record/PointerObserver.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/TrafficObserver.h"
#include "Tools/record/WindowObserver.h"

#include <xcb/xinput.h>

#include <cstdint>
#include <optional>
#include <string>

namespace Recorder {

class DisplayObservers {
public:
    /// What the observers work with, all of which outlives them.
    struct Tools {
        XConnection& connection;
        const ServerClock& clock;
        PrivacyFilter& privacy;
        FocusWatch& focus;
        Journal& journal;
        HeldInput& input;
    };

    /// An empty `display` stands for $DISPLAY. `watched` is a window whose end is of interest, or XCB_NONE. Throws
    /// `Refusal` if the server does not tell of clicks and keys.
    DisplayObservers(const Tools& tools, const std::string& display, xcb_window_t watched);
    DisplayObservers(const DisplayObservers&) = delete;
    DisplayObservers& operator=(const DisplayObservers&) = delete;

    /// Takes the events that have arrived.
    void takeEvents();

    /// Takes what other programs ask of the server.
    void takeTraffic() { traffic_.serve(); }

    /// Returns a descriptor to wait for beside that of the connection, or a negative number.
    int descriptor() const { return traffic_.descriptor(); }

    /// Takes the position of the pointer at a frame.
    void saw(const Mailbox::Sight& sight) { pointer_.saw(sight.instant, sight.pointer); }

    /// Looks for what changes without an event.
    void poll();

    /// Returns whether `watched` is closed.
    bool isWatchedGone() const { return isWatchedGone_; }

private:
    void selectInput();
    void takeEvent(const xcb_generic_event_t& event);
    void takeInput(const xcb_ge_generic_event_t& event);
    void takeKey(const xcb_input_raw_key_press_event_t& event);
    bool isHidden(std::uint8_t key, std::uint32_t serverTime);
    ZULMetaData::Modifiers buttonModifiers() const;
    TrafficObserver::Events trafficEvents();

    XConnection& connection_;
    xcb_window_t watched_;
    bool isWatchedGone_ = false;
    std::uint8_t inputOpcode_ = 0;
    std::optional<FreeKeys> freeKeys_; ///< if it matters which window a key goes to
    CursorObserver cursor_;
    PointerObserver pointer_;
    KeyObserver keys_;
    MachineObserver machine_;
    WindowObserver windows_;
    TrafficObserver traffic_;
};

} // namespace Recorder
