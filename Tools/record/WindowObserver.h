#pragma once

#include "Tools/record/Journal.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/XConnection.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

namespace Recorder {

/// The window on top, its title and application, and the innermost window below the pointer.
class WindowObserver {
public:
    /// `changed` is called when another window comes to the top, with the process that it belongs to, 0 if that is not
    /// known.
    WindowObserver(XConnection& connection, const ServerClock& clock, Journal& journal, PrivacyFilter& privacy,
                   std::function<void(Instant, std::uint32_t process)> changed);

    void propertyChanged(const xcb_property_notify_event_t& event);
    void configured(const xcb_configure_notify_event_t& event);
    void destroyed(xcb_window_t window);

    /// Asks for the focus where no window manager names the active window, and for what moved without a notice.
    void poll();

    /// Notes what the pointer hovers over.
    void hover(Instant instant, Position pointer);

    /// Notes a rectangle that the accessibility bus knows.
    void noteHover(Instant instant, const Area& area);

    std::uint32_t process() const { return process_; }

    /// Takes a change of the input focus.
    void focusChanged(const xcb_focus_in_event_t& event);

    /// Returns whether a key whose event comes next goes to the window on top, if there is one, or to one that the
    /// window manager is about to name.
    bool getsKeys();

private:
    xcb_window_t managerWindow() const;
    bool isManaged();
    xcb_window_t inputFocus() const;
    xcb_window_t focusedWindow() const;
    xcb_window_t activeWindow();
    bool isInside(xcb_window_t window) const;
    void watchFrame();
    void follow(Instant instant);
    void readWindow(Instant instant);
    void readTexts(Instant instant);
    void readArea(Instant instant);
    xcb_window_t clientIn(xcb_window_t window) const;
    std::optional<Area> innermostAt(Position pointer) const;

    XConnection& connection_;
    const ServerClock& clock_;
    Journal& journal_;
    PrivacyFilter& privacy_;
    std::function<void(Instant, std::uint32_t)> changed_;
    xcb_atom_t activeWindowAtom_;
    xcb_atom_t supportedAtom_;
    xcb_atom_t managerAtom_;
    xcb_atom_t nameAtom_;
    xcb_atom_t processAtom_;
    std::optional<bool> isManaged_; ///< a window manager names the active window
    xcb_window_t manager_ = XCB_NONE;
    xcb_window_t active_ = XCB_NONE; ///< as the window manager or the focus says
    xcb_window_t client_ = XCB_NONE; ///< the window of the application
    xcb_window_t frame_ = XCB_NONE;  ///< the child of the root window around it
    bool isFocused_ = false;         ///< the focus is in `frame_`, as far as the events have told by now
    std::uint32_t process_ = 0;
    bool isFirst_ = true;
};

} // namespace Recorder
