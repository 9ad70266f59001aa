#include "Tools/record/FreeKeys.h"

#include <xcb/xinput.h>

#include <algorithm>

namespace Recorder {

FreeKeys::FreeKeys(const std::string& display) : connection_(display) {
    if (!connection_.has(xcb_input_id))
        return; // all keys count as taken
    opcode_ = xcb_get_extension_data(connection_.get(), &xcb_input_id)->major_opcode;
    const auto cookie = xcb_input_xi_query_version(connection_.get(), 2, 0);
    const Reply<xcb_input_xi_query_version_reply_t> version(
        xcb_input_xi_query_version_reply(connection_.get(), cookie, nullptr));
    const struct {
        xcb_input_event_mask_t head;
        std::uint32_t events;
    } mask{{XCB_INPUT_DEVICE_ALL_MASTER, 1}, XCB_INPUT_XI_EVENT_MASK_RAW_KEY_PRESS};
    xcb_input_xi_select_events(connection_.get(), connection_.root(), 1, &mask.head);
    takeEvents();
}

/// Whatever the server has sent to other clients before is here when it has answered.
void FreeKeys::takeEvents() {
    const auto cookie = xcb_get_input_focus(connection_.get());
    const Reply<xcb_get_input_focus_reply_t> answer(xcb_get_input_focus_reply(connection_.get(), cookie, nullptr));
    while (const Reply<xcb_generic_event_t> event{xcb_poll_for_event(connection_.get())}) {
        const auto& any = reinterpret_cast<const xcb_ge_generic_event_t&>(*event);
        if ((any.response_type & s_eventTypeBits) != XCB_GE_GENERIC || any.extension != opcode_ ||
            any.event_type != XCB_INPUT_RAW_KEY_PRESS)
            continue;
        const auto& press = reinterpret_cast<const xcb_input_raw_key_press_event_t&>(any);
        presses_.push_back({press.detail, press.time});
    }
}

bool FreeKeys::has(std::uint32_t key, std::uint32_t serverTime) {
    takeEvents();
    const auto found = std::find(presses_.begin(), presses_.end(), Press{key, serverTime});
    if (found == presses_.end())
        return false;
    presses_.erase(presses_.begin(), found + 1);
    return true;
}

} // namespace Recorder
