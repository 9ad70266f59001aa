#include "Tools/record/DisplayObservers.h"

#include "Tools/record/Failure.h"

namespace Recorder {

using namespace ZULMetaData;

DisplayObservers::DisplayObservers(const Tools& tools, const std::string& display, xcb_window_t watched)
    : connection_(tools.connection), watched_(watched), cursor_(tools.connection, tools.clock, tools.journal),
      pointer_(tools.connection, tools.clock, tools.journal, tools.input),
      keys_(tools.connection, tools.clock, tools.input, tools.privacy), machine_(tools.connection, tools.journal),
      windows_(tools.connection, tools.clock, tools.journal, tools.privacy,
               [this, &focus = tools.focus](Instant instant, std::uint32_t process) {
                   focus.windowChanged(instant, process);
                   keys_.windowChanged();
               }),
      traffic_(display, trafficEvents()) {
    if (tools.privacy.judgesWindows())
        freeKeys_.emplace(display);
    selectInput();
    tools.focus.follow(windows_, pointer_);
}

TrafficObserver::Events DisplayObservers::trafficEvents() {
    return {[this](std::uint32_t time, std::uint8_t key) { keys_.repeated(key, time); },
            [this](std::uint32_t time, bool isHidden) { cursor_.hidden(time, isHidden); }};
}

void DisplayObservers::poll() {
    windows_.poll();
    machine_.poll();
}

/// Raw events also come while another program takes the keys and clicks.
void DisplayObservers::selectInput() {
    if (!connection_.has(xcb_input_id))
        throw Refusal("the X display has no XInput extension, without which clicks and keys cannot be recorded");
    const auto cookie = xcb_input_xi_query_version(connection_.get(), 2, 1);
    const Reply<xcb_input_xi_query_version_reply_t> version(
        xcb_input_xi_query_version_reply(connection_.get(), cookie, nullptr));
    struct {
        xcb_input_event_mask_t head;
        std::uint32_t events;
    } mask{{XCB_INPUT_DEVICE_ALL_MASTER, 1},
           XCB_INPUT_XI_EVENT_MASK_RAW_KEY_PRESS | XCB_INPUT_XI_EVENT_MASK_RAW_BUTTON_PRESS |
               XCB_INPUT_XI_EVENT_MASK_RAW_BUTTON_RELEASE | XCB_INPUT_XI_EVENT_MASK_RAW_MOTION |
               XCB_INPUT_XI_EVENT_MASK_DEVICE_CHANGED};
    xcb_input_xi_select_events(connection_.get(), connection_.root(), 1, &mask.head);
    inputOpcode_ = xcb_get_extension_data(connection_.get(), &xcb_input_id)->major_opcode;
    if (watched_ != XCB_NONE) {
        const std::uint32_t events = XCB_EVENT_MASK_STRUCTURE_NOTIFY | XCB_EVENT_MASK_PROPERTY_CHANGE;
        xcb_change_window_attributes(connection_.get(), watched_, XCB_CW_EVENT_MASK, &events);
    }
    connection_.flush();
}

void DisplayObservers::takeEvents() {
    while (const Reply<xcb_generic_event_t> event{xcb_poll_for_event(connection_.get())})
        takeEvent(*event);
    keys_.refresh();
    pointer_.followMotions();
}

void DisplayObservers::takeEvent(const xcb_generic_event_t& event) {
    const std::uint8_t type = event.response_type & s_eventTypeBits;
    if (type == keys_.firstEvent()) {
        keys_.keyboardChanged(event);
    } else if (type == cursor_.firstEvent() + XCB_XFIXES_CURSOR_NOTIFY) {
        cursor_.changed(reinterpret_cast<const xcb_xfixes_cursor_notify_event_t&>(event));
    } else if (type == XCB_GE_GENERIC) {
        const auto& input = reinterpret_cast<const xcb_ge_generic_event_t&>(event);
        if (input.extension == inputOpcode_)
            takeInput(input);
    } else if (type == XCB_PROPERTY_NOTIFY) {
        windows_.propertyChanged(reinterpret_cast<const xcb_property_notify_event_t&>(event));
    } else if (type == XCB_CONFIGURE_NOTIFY) {
        windows_.configured(reinterpret_cast<const xcb_configure_notify_event_t&>(event));
    } else if (type == XCB_FOCUS_IN || type == XCB_FOCUS_OUT) {
        windows_.focusChanged(reinterpret_cast<const xcb_focus_in_event_t&>(event));
    } else if (type == XCB_MAPPING_NOTIFY) {
        if (reinterpret_cast<const xcb_mapping_notify_event_t&>(event).request == XCB_MAPPING_POINTER)
            pointer_.buttonsRemapped();
    } else if (type == XCB_DESTROY_NOTIFY) {
        const xcb_window_t window = reinterpret_cast<const xcb_destroy_notify_event_t&>(event).window;
        windows_.destroyed(window);
        isWatchedGone_ = isWatchedGone_ || (watched_ != XCB_NONE && window == watched_);
    }
}

void DisplayObservers::takeInput(const xcb_ge_generic_event_t& event) {
    switch (event.event_type) {
    case XCB_INPUT_RAW_MOTION: pointer_.moved(reinterpret_cast<const xcb_input_raw_motion_event_t&>(event)); break;
    case XCB_INPUT_RAW_BUTTON_PRESS:
    case XCB_INPUT_RAW_BUTTON_RELEASE:
        pointer_.followMotions(); // the last of them has the position of the click
        pointer_.button(reinterpret_cast<const xcb_input_raw_button_press_event_t&>(event),
                        event.event_type == XCB_INPUT_RAW_BUTTON_PRESS, buttonModifiers());
        break;
    case XCB_INPUT_RAW_KEY_PRESS: takeKey(reinterpret_cast<const xcb_input_raw_key_press_event_t&>(event)); break;
    case XCB_INPUT_DEVICE_CHANGED:
        pointer_.devicesChanged();
        pointer_.buttonsRemapped();
        break;
    default: break;
    }
}

void DisplayObservers::takeKey(const xcb_input_raw_key_press_event_t& event) {
    constexpr std::uint32_t highestCode = 255;
    if (event.detail > highestCode)
        return;
    const auto key = static_cast<std::uint8_t>(event.detail);
    keys_.pressed(key, event.time, isHidden(key, event.time));
}

/// A window manager that has grabbed one key has all of them until that one is released, such as those after Super.
bool DisplayObservers::isHidden(std::uint8_t key, std::uint32_t serverTime) {
    if (!freeKeys_)
        return false;
    const bool isGrabbed = !freeKeys_->has(key, serverTime); // has to be asked for every key, in their order
    return (isGrabbed && !keys_.isForManager(key)) || !windows_.getsKeys();
}

/// Clicks call the key Command that keys call Windows.
Modifiers DisplayObservers::buttonModifiers() const {
    Modifiers modifiers = keys_.modifiers();
    if (modifiers.contains(Modifier::Windows))
        modifiers.insert(Modifier::Command);
    return modifiers;
}

} // namespace Recorder
