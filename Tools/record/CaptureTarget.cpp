#include "Tools/record/CaptureTarget.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>
#include <xcb/composite.h>
#include <xcb/randr.h>

#include <algorithm>
#include <charconv>
#include <string>
#include <vector>

namespace Recorder {

namespace {

std::string titleOf(const XConnection& connection, xcb_window_t window) {
    const auto name = connection.text(window, connection.atom("_NET_WM_NAME"));
    return name ? *name : connection.text(window, XCB_ATOM_WM_NAME).value_or("");
}

std::vector<xcb_window_t> childrenOf(const XConnection& connection, xcb_window_t window) {
    const auto tree = connection.treeOf(window);
    if (!tree)
        return {};
    const xcb_window_t* children = xcb_query_tree_children(tree.get());
    return {children, children + xcb_query_tree_children_length(tree.get())};
}

bool isViewable(const XConnection& connection, xcb_window_t window) {
    const auto cookie = xcb_get_window_attributes(connection.get(), window);
    const Reply<xcb_get_window_attributes_reply_t> reply(
        xcb_get_window_attributes_reply(connection.get(), cookie, nullptr));
    return reply && reply->map_state == XCB_MAP_STATE_VIEWABLE && reply->_class == XCB_WINDOW_CLASS_INPUT_OUTPUT;
}

/// Returns the windows of applications, those on top last.
std::vector<xcb_window_t> applicationWindows(const XConnection& connection) {
    std::vector<xcb_window_t> windows =
        connection.numbers(connection.root(), connection.atom("_NET_CLIENT_LIST_STACKING"));
    if (!windows.empty())
        return windows;
    for (const xcb_window_t child : childrenOf(connection, connection.root())) {
        windows.push_back(child);
        for (const xcb_window_t inner : childrenOf(connection, child))
            windows.push_back(inner);
    }
    return windows;
}

xcb_window_t windowOfTitle(const XConnection& connection, const std::string& title) {
    xcb_window_t found = XCB_NONE;
    for (const xcb_window_t window : applicationWindows(connection)) {
        const std::string own = titleOf(connection, window);
        if (own == title && isViewable(connection, window))
            return window;
        if (!own.empty() && own.find(title) != std::string::npos && isViewable(connection, window))
            found = window;
    }
    return found;
}

xcb_window_t windowOfNumber(const std::string& text) {
    const bool isHexadecimal = text.starts_with("0x");
    const char* begin = text.data() + (isHexadecimal ? 2 : 0);
    const char* end = text.data() + text.size();
    xcb_window_t window = XCB_NONE;
    const auto result = std::from_chars(begin, end, window, isHexadecimal ? 16 : 10);
    return result.ptr == end && begin != end ? window : xcb_window_t{XCB_NONE};
}

/// Waits for a click, which goes to no application.
xcb_window_t clickedWindow(XConnection& connection) {
    const auto cookie =
        xcb_grab_pointer(connection.get(), 0, connection.root(), XCB_EVENT_MASK_BUTTON_RELEASE, XCB_GRAB_MODE_ASYNC,
                         XCB_GRAB_MODE_ASYNC, XCB_NONE, XCB_NONE, XCB_CURRENT_TIME);
    const Reply<xcb_grab_pointer_reply_t> grab(xcb_grab_pointer_reply(connection.get(), cookie, nullptr));
    if (!grab || grab->status != XCB_GRAB_STATUS_SUCCESS)
        throw Refusal("--window click: another program holds the pointer; name the window instead");
    xcb_window_t window = XCB_NONE;
    while (const Reply<xcb_generic_event_t> event{xcb_wait_for_event(connection.get())})
        if ((event->response_type & s_eventTypeBits) == XCB_BUTTON_RELEASE) {
            window = reinterpret_cast<const xcb_button_release_event_t*>(event.get())->child;
            break;
        }
    xcb_ungrab_pointer(connection.get(), XCB_CURRENT_TIME);
    connection.flush();
    return window;
}

Area evenSides(Area area) {
    area.width -= area.width % 2;
    area.height -= area.height % 2;
    return area;
}

void requireInside(const Area& area, const Area& root, const std::string& what) {
    const bool isInside =
        area.x >= 0 && area.y >= 0 && area.width <= root.width - area.x && area.height <= root.height - area.y;
    if (!isInside || area.width < 2 || area.height < 2)
        throw Refusal(
            fmt::format("{}: not inside of the screen, which has {}x{} pixels", what, root.width, root.height));
}

Area monitorArea(const XConnection& connection, const std::string& name) {
    std::string names;
    if (connection.has(xcb_randr_id)) {
        const auto cookie = xcb_randr_get_monitors(connection.get(), connection.root(), 1);
        const Reply<xcb_randr_get_monitors_reply_t> reply(
            xcb_randr_get_monitors_reply(connection.get(), cookie, nullptr));
        if (reply)
            for (auto monitors = xcb_randr_get_monitors_monitors_iterator(reply.get()); monitors.rem > 0;
                 xcb_randr_monitor_info_next(&monitors)) {
                const xcb_randr_monitor_info_t& monitor = *monitors.data;
                const auto nameCookie = xcb_get_atom_name(connection.get(), monitor.name);
                const Reply<xcb_get_atom_name_reply_t> atom(
                    xcb_get_atom_name_reply(connection.get(), nameCookie, nullptr));
                if (!atom)
                    continue;
                const std::string own(xcb_get_atom_name_name(atom.get()),
                                      static_cast<std::size_t>(xcb_get_atom_name_name_length(atom.get())));
                if (own == name)
                    return {monitor.x, monitor.y, monitor.width, monitor.height};
                names += (names.empty() ? "" : ", ") + own;
            }
    }
    throw Refusal(fmt::format("--monitor {}: no such monitor; there is {}", name, names.empty() ? "none" : names));
}

CaptureTarget windowTarget(XConnection& connection, const std::string& name) {
    xcb_window_t window = name == "click" ? clickedWindow(connection) : windowOfNumber(name);
    if (window == XCB_NONE && name != "click")
        window = windowOfTitle(connection, name);
    if (window == XCB_NONE || !isViewable(connection, window))
        throw Refusal(fmt::format("--window {}: there is no such window on the screen", name));
    CaptureTarget target;
    target.watched = window;
    const Area root = connection.rootArea();
    target.area = connection.areaOf(window).value_or(Area());
    const bool hasComposite = connection.has(xcb_composite_id);
    target.area = evenSides(target.area);
    if (hasComposite && target.area.width >= 2 && target.area.height >= 2) {
        const auto cookie = xcb_composite_query_version(connection.get(), 0, 4);
        const Reply<xcb_composite_query_version_reply_t> version(
            xcb_composite_query_version_reply(connection.get(), cookie, nullptr));
        target.window = connection.topLevelOf(window);
        if (target.window != window) { // in a frame, of which the recording then shows all
            target.area = evenSides(connection.areaOf(target.window).value_or(target.area));
        }
        return target;
    }
    requireInside(target.area, root, "--window " + name);
    return target;
}

} // namespace

CaptureTarget captureTargetOf(XConnection& connection, const Options& options) {
    if (!options.window.empty())
        return windowTarget(connection, options.window);
    CaptureTarget target;
    const Area root = connection.rootArea();
    target.area = options.region             ? *options.region
                  : !options.monitor.empty() ? monitorArea(connection, options.monitor)
                                             : Area{0, 0, root.width, root.height};
    target.area = evenSides(target.area);
    requireInside(target.area, root, "the part to record");
    return target;
}

} // namespace Recorder
