#pragma once

#include "Tools/record/Journal.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/XConnection.h"

#include <xcb/xfixes.h>

#include <cstdint>
#include <map>
#include <memory>
#include <vector>

namespace Recorder {

/// What the cursor looks like, and whether it can be seen.
class CursorObserver {
public:
    CursorObserver(XConnection& connection, const ServerClock& clock, Journal& journal);

    void changed(const xcb_xfixes_cursor_notify_event_t& event);

    /// A client hides the cursor, or shows it again.
    void hidden(std::uint32_t serverTime, bool isHidden);

    /// Returns the number of the extension's first event.
    std::uint8_t firstEvent() const { return firstEvent_; }

private:
    /// Two cursors with the same look are one.
    struct Look {
        std::uint16_t width;
        std::uint16_t height;
        std::uint16_t hotSpotX;
        std::uint16_t hotSpotY;
        std::vector<std::uint32_t> pixels; ///< as the server has them: alpha, red, green, blue, premultiplied

        auto operator<=>(const Look&) const = default;
    };
    struct Known {
        std::uint64_t id;
        std::shared_ptr<const ZULMetaData::CursorPicture> picture;
    };

    void ask(Instant instant);
    const Known& knownAs(Look look);

    XConnection& connection_;
    const ServerClock& clock_;
    Journal& journal_;
    std::uint8_t firstEvent_ = 0;
    void noteOpacity(Instant instant);

    std::map<Look, Known> known_;
    bool isVisible_ = false; ///< its image has a pixel that can be seen
    bool isHidden_ = false;
};

} // namespace Recorder
