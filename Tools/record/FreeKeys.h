#pragma once

#include "Tools/record/XConnection.h"

#include <cstdint>
#include <deque>
#include <string>

namespace Recorder {

/// Knows which presses went to the window with the focus. The others went to a program that has grabbed the keyboard,
/// as screen lockers, prompts for passwords and menus do.
///
/// A client of XInput 2.1 sees every press, and a client of XInput 2.0 only those that no grab takes. This is the
/// second one, on a connection of its own.
class FreeKeys {
public:
    /// An empty `display` stands for $DISPLAY.
    explicit FreeKeys(const std::string& display);

    /// Returns whether a press that another client has seen went to the window with the focus. Presses are asked for in
    /// their order.
    bool has(std::uint32_t key, std::uint32_t serverTime);

private:
    struct Press {
        std::uint32_t key;
        std::uint32_t serverTime;

        friend bool operator==(const Press&, const Press&) = default;
    };

    void takeEvents();

    XConnection connection_;
    std::uint8_t opcode_ = 0;
    std::deque<Press> presses_;
};

} // namespace Recorder
