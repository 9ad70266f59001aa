#include "Tools/record/WindowObserver.h"

#include <algorithm>
#include <utility>

namespace Recorder {

using namespace ZULMetaData;

namespace {

Rect rectOf(const Area& area) {
    return {area.x, area.y, area.width, area.height};
}

std::string upToZero(const std::string& text) {
    return text.substr(0, text.find('\0'));
}

/// Returns the second of the two texts of WM_CLASS.
std::string classOf(const std::string& property) {
    const std::size_t end = property.find('\0');
    return end == std::string::npos ? std::string() : upToZero(property.substr(end + 1));
}

} // namespace

WindowObserver::WindowObserver(XConnection& connection, const ServerClock& clock, Journal& journal,
                               PrivacyFilter& privacy, std::function<void(Instant, std::uint32_t)> changed)
    : connection_(connection), clock_(clock), journal_(journal), privacy_(privacy), changed_(std::move(changed)),
      activeWindowAtom_(connection.atom("_NET_ACTIVE_WINDOW")), supportedAtom_(connection.atom("_NET_SUPPORTED")),
      managerAtom_(connection.atom("_NET_SUPPORTING_WM_CHECK")), nameAtom_(connection.atom("_NET_WM_NAME")),
      processAtom_(connection.atom("_NET_WM_PID")) {
    const std::uint32_t events =
        XCB_EVENT_MASK_PROPERTY_CHANGE | XCB_EVENT_MASK_SUBSTRUCTURE_NOTIFY | XCB_EVENT_MASK_STRUCTURE_NOTIFY;
    xcb_change_window_attributes(connection_.get(), connection_.root(), XCB_CW_EVENT_MASK, &events);
    follow(now());
}

/// Returns the window by which a window manager shows that it runs. Its other properties stay when it has gone.
xcb_window_t WindowObserver::managerWindow() const {
    const auto named = connection_.numbers(connection_.root(), managerAtom_);
    if (named.empty() || named.front() == connection_.root())
        return XCB_NONE;
    const std::uint32_t itsEnd = XCB_EVENT_MASK_STRUCTURE_NOTIFY; // the windows that are followed have it already
    if (named.front() != client_ && named.front() != frame_)
        xcb_change_window_attributes(connection_.get(), named.front(), XCB_CW_EVENT_MASK, &itsEnd);
    return connection_.numbers(named.front(), managerAtom_) == named ? named.front() : xcb_window_t{XCB_NONE};
}

/// Whether a window manager says which window is active.
bool WindowObserver::isManaged() {
    if (!isManaged_) {
        manager_ = managerWindow();
        const auto supported = connection_.numbers(connection_.root(), supportedAtom_);
        isManaged_ =
            manager_ != XCB_NONE && std::find(supported.begin(), supported.end(), activeWindowAtom_) != supported.end();
    }
    return *isManaged_;
}

xcb_window_t WindowObserver::inputFocus() const {
    const auto cookie = xcb_get_input_focus(connection_.get());
    const Reply<xcb_get_input_focus_reply_t> reply(xcb_get_input_focus_reply(connection_.get(), cookie, nullptr));
    return reply ? reply->focus : xcb_window_t{XCB_INPUT_FOCUS_NONE};
}

/// Keys go to the window below the pointer if the focus is on the root window.
xcb_window_t WindowObserver::focusedWindow() const {
    const xcb_window_t focus = inputFocus();
    if (focus == XCB_INPUT_FOCUS_NONE)
        return XCB_NONE;
    if (focus != XCB_INPUT_FOCUS_POINTER_ROOT && focus != connection_.root())
        return focus;
    const auto pointer = connection_.pointer();
    return pointer ? pointer->child : xcb_window_t{XCB_NONE};
}

xcb_window_t WindowObserver::activeWindow() {
    if (!isManaged())
        return focusedWindow();
    const auto windows = connection_.numbers(connection_.root(), activeWindowAtom_);
    return windows.empty() ? xcb_window_t{XCB_NONE} : windows.front();
}

void WindowObserver::follow(Instant instant) {
    const xcb_window_t active = activeWindow();
    if (active == active_ && !isFirst_)
        return;
    isFirst_ = false;
    active_ = active;
    readWindow(instant);
}

/// Keys go to one window in the application's, or to the frame around it.
bool WindowObserver::isInside(xcb_window_t window) const {
    while (window != XCB_NONE && window != connection_.root()) {
        if (window == client_ || window == frame_ || window == active_)
            return true;
        const auto tree = connection_.treeOf(window);
        window = tree ? tree->parent : xcb_window_t{XCB_NONE};
    }
    return false;
}

/// A key may have closed its window, or opened another one, before the focus is asked for. Its event comes
/// before the one of the focus, which is why the events are asked first.
bool WindowObserver::getsKeys() {
    return client_ == XCB_NONE || isFocused_ || isInside(focusedWindow()) || activeWindow() != active_;
}

/// A grab sends such events, too, though the focus does not change. If the focus follows the pointer, no event tells
/// when it enters a window.
void WindowObserver::focusChanged(const xcb_focus_in_event_t& event) {
    const bool isOfGrab = event.mode == XCB_NOTIFY_MODE_GRAB || event.mode == XCB_NOTIFY_MODE_UNGRAB;
    const bool isOfPointer = event.detail >= XCB_NOTIFY_DETAIL_POINTER;
    if (event.event != frame_ || isOfGrab || isOfPointer)
        return;
    const bool hasCome = (event.response_type & s_eventTypeBits) == XCB_FOCUS_IN;
    isFocused_ = hasCome || event.detail == XCB_NOTIFY_DETAIL_INFERIOR;
}

/// Returns the window with the application's class: `window`, one around it, or one in it.
xcb_window_t WindowObserver::clientIn(xcb_window_t window) const {
    const auto hasClass = [this](xcb_window_t candidate) {
        return connection_.text(candidate, XCB_ATOM_WM_CLASS).has_value();
    };
    for (xcb_window_t outer = window; outer != XCB_NONE && outer != connection_.root();) {
        if (hasClass(outer))
            return outer;
        const auto tree = connection_.treeOf(outer);
        outer = tree ? tree->parent : xcb_window_t{XCB_NONE};
    }
    const auto tree = connection_.treeOf(window);
    if (!tree)
        return window;
    const xcb_window_t* children = xcb_query_tree_children(tree.get());
    const xcb_window_t* end = children + xcb_query_tree_children_length(tree.get());
    const xcb_window_t* child = std::find_if(children, end, hasClass);
    return child == end ? window : *child;
}

/// Finds the frame, which a window manager may put around the window later, and follows the focus into and out of it.
void WindowObserver::watchFrame() {
    const xcb_window_t frame = connection_.topLevelOf(client_);
    if (frame == frame_)
        return;
    frame_ = frame;
    if (frame_ != XCB_NONE && frame_ != client_) {
        const std::uint32_t events = XCB_EVENT_MASK_STRUCTURE_NOTIFY | XCB_EVENT_MASK_FOCUS_CHANGE;
        xcb_change_window_attributes(connection_.get(), frame_, XCB_CW_EVENT_MASK, &events);
    }
    isFocused_ = isInside(inputFocus());
}

void WindowObserver::readWindow(Instant instant) {
    const std::uint32_t itsEnd = XCB_EVENT_MASK_STRUCTURE_NOTIFY; // which may be that of the recording
    for (const xcb_window_t window : {client_, frame_})
        if (window != XCB_NONE)
            xcb_change_window_attributes(connection_.get(), window, XCB_CW_EVENT_MASK, &itsEnd);
    client_ = active_ == XCB_NONE ? xcb_window_t{XCB_NONE} : clientIn(active_);
    frame_ = XCB_NONE;
    isFocused_ = false;
    process_ = 0;
    if (client_ != XCB_NONE) {
        const std::uint32_t events =
            XCB_EVENT_MASK_PROPERTY_CHANGE | XCB_EVENT_MASK_STRUCTURE_NOTIFY | XCB_EVENT_MASK_FOCUS_CHANGE;
        xcb_change_window_attributes(connection_.get(), client_, XCB_CW_EVENT_MASK, &events);
        watchFrame();
        const auto process = connection_.numbers(client_, processAtom_);
        process_ = process.empty() ? 0 : process.front();
    }
    readTexts(instant);
    readArea(instant);
    changed_(instant, process_);
}

void WindowObserver::readTexts(Instant instant) {
    std::string title;
    std::string app;
    if (client_ != XCB_NONE) {
        if (const auto name = connection_.text(client_, nameAtom_))
            title = upToZero(*name);
        else if (const auto oldName = connection_.text(client_, XCB_ATOM_WM_NAME))
            title = upToZero(*oldName);
        app = classOf(connection_.text(client_, XCB_ATOM_WM_CLASS).value_or(""));
    }
    const bool isDenied = privacy_.denies(app, title);
    privacy_.setWindow(instant, isDenied);
    journal_.note<TopmostAppNameKind>(instant, app);
    journal_.note<TopmostWindowTitleKind>(instant, isDenied ? std::string() : title);
}

void WindowObserver::readArea(Instant instant) {
    const xcb_window_t outer = frame_ != XCB_NONE ? frame_ : client_;
    const Area area = outer == XCB_NONE ? Area() : connection_.areaOf(outer).value_or(Area());
    journal_.note<TopmostWindowKind>(instant, rectOf(area));
}

void WindowObserver::propertyChanged(const xcb_property_notify_event_t& event) {
    const Instant instant = clock_.instantOf(event.time);
    if (event.window == connection_.root()) {
        const bool isOfManager = event.atom == supportedAtom_ || event.atom == managerAtom_;
        if (isOfManager || (event.atom == activeWindowAtom_ && !isManaged()))
            isManaged_.reset();
        if (isOfManager || event.atom == activeWindowAtom_)
            follow(instant);
    } else if (event.window == client_) {
        if (event.atom == nameAtom_ || event.atom == XCB_ATOM_WM_NAME || event.atom == XCB_ATOM_WM_CLASS)
            readTexts(instant);
    }
}

void WindowObserver::configured(const xcb_configure_notify_event_t& event) {
    if (event.window != frame_ && event.window != client_)
        return;
    if (event.window == client_) // a window manager may have put it into a frame
        watchFrame();
    readArea(now());
}

void WindowObserver::destroyed(xcb_window_t window) {
    if (window == manager_) {
        isManaged_.reset();
        follow(now());
    }
    if (window != client_ && window != frame_ && window != active_)
        return;
    client_ = frame_ = XCB_NONE;
    isFocused_ = false;
    isFirst_ = true; // the next active window may have the same number
    follow(now());
}

void WindowObserver::poll() {
    if (!isManaged())
        follow(now());
}

std::optional<Area> WindowObserver::innermostAt(Position pointer) const {
    xcb_window_t window = connection_.root();
    for (;;) {
        const auto cookie =
            xcb_translate_coordinates(connection_.get(), connection_.root(), window,
                                      static_cast<std::int16_t>(pointer.x), static_cast<std::int16_t>(pointer.y));
        const Reply<xcb_translate_coordinates_reply_t> reply(
            xcb_translate_coordinates_reply(connection_.get(), cookie, nullptr));
        if (!reply)
            return std::nullopt;
        if (reply->child == XCB_WINDOW_NONE)
            return window == connection_.root() ? std::nullopt : connection_.areaOf(window);
        window = reply->child;
    }
}

void WindowObserver::hover(Instant instant, Position pointer) {
    noteHover(instant, innermostAt(pointer).value_or(Area()));
}

void WindowObserver::noteHover(Instant instant, const Area& area) {
    if (!privacy_.isDenied())
        journal_.note<HoverRectKind>(instant, rectOf(area));
}

} // namespace Recorder
