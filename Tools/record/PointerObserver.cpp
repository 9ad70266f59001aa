#include "Tools/record/PointerObserver.h"

#include <algorithm>

namespace Recorder {

using namespace ZULMetaData;

namespace {

/// A position that held longer is written again before it changes.
constexpr Instant s_rest = 20 * s_millisecond;

double numberOf(const xcb_input_fp3232_t& number) {
    constexpr double unit = 4294967296.0;
    return number.integral + number.frac / unit;
}

bool isEmulated(std::uint32_t flags) {
    return (flags & XCB_INPUT_POINTER_EVENT_FLAGS_POINTER_EMULATED) != 0;
}

} // namespace

PointerObserver::PointerObserver(XConnection& connection, const ServerClock& clock, Journal& journal, HeldInput& input)
    : connection_(connection), clock_(clock), journal_(journal), input_(input) {
    buttonsRemapped();
    motion_ = now();
    followMotions();
}

void PointerObserver::buttonsRemapped() {
    const auto cookie = xcb_get_pointer_mapping(connection_.get());
    const Reply<xcb_get_pointer_mapping_reply_t> reply(
        xcb_get_pointer_mapping_reply(connection_.get(), cookie, nullptr));
    if (!reply)
        return;
    const std::uint8_t* map = xcb_get_pointer_mapping_map(reply.get());
    buttonMap_.assign(map, map + xcb_get_pointer_mapping_map_length(reply.get()));
}

void PointerObserver::moved(const xcb_input_raw_motion_event_t& event) {
    motion_ = clock_.instantOf(event.time);
    if (!isEmulated(event.flags))
        scrollBy(event);
}

void PointerObserver::followMotions() {
    if (!motion_)
        return;
    const Instant instant = *motion_;
    motion_.reset();
    const Instant asked = now();
    const auto reply = connection_.pointer();
    if (reply && reply->same_screen)
        note(instant, asked, {reply->root_x, reply->root_y});
}

void PointerObserver::saw(Instant asked, Position position) {
    if (asked >= asked_) // another answer knows more than one that was asked for earlier
        note(asked, asked, position);
}

void PointerObserver::note(Instant instant, Instant asked, Position position) {
    asked_ = asked;
    if (position_ == position)
        return;
    instant = std::max(instant, positionInstant_);
    if (position_ && instant - positionInstant_ > s_rest)
        journal_.noteStill<CursorLocationKind>(instant - s_millisecond);
    position_ = position;
    positionInstant_ = instant;
    journal_.note<CursorLocationKind>(instant, Point(position.x, position.y));
}

void PointerObserver::button(const xcb_input_raw_button_press_event_t& event, bool isPress, Modifiers modifiers) {
    const Instant instant = clock_.instantOf(event.time);
    if (event.detail == 0)
        return;
    const std::uint32_t number =
        event.detail <= buttonMap_.size() ? buttonMap_[event.detail - 1] : event.detail; // others are not mapped
    switch (number) {
    case 1: input_.addButton(instant, storedButtonAction(MouseButton::Left, isPress, modifiers), isPress); break;
    case 2: input_.addButton(instant, storedButtonAction(MouseButton::Middle, isPress, modifiers), isPress); break;
    case 3: input_.addButton(instant, storedButtonAction(MouseButton::Right, isPress, modifiers), isPress); break;
    default:
        if (!isPress || isEmulated(event.flags))
            break;
        if (number == 4 || number == 5)
            noteScroll(instant, 0, number == 4 ? s_notch : -s_notch);
        else if (number == 6 || number == 7)
            noteScroll(instant, number == 6 ? s_notch : -s_notch, 0);
    }
}

void PointerObserver::noteScroll(Instant instant, std::int32_t x, std::int32_t y) {
    journal_.note<ScrollActionKind>(instant, Point(x, y));
}

std::vector<ScrollAxis>& PointerObserver::axesOf(std::uint16_t device) {
    const auto known = axes_.find(device);
    if (known != axes_.end())
        return known->second;
    std::vector<ScrollAxis>& axes = axes_[device];
    const auto cookie = xcb_input_xi_query_device(connection_.get(), device);
    const Reply<xcb_input_xi_query_device_reply_t> reply(
        xcb_input_xi_query_device_reply(connection_.get(), cookie, nullptr));
    if (!reply)
        return axes;
    for (auto infos = xcb_input_xi_query_device_infos_iterator(reply.get()); infos.rem > 0;
         xcb_input_xi_device_info_next(&infos))
        for (auto classes = xcb_input_xi_device_info_classes_iterator(infos.data); classes.rem > 0;
             xcb_input_device_class_next(&classes)) {
            if (classes.data->type != XCB_INPUT_DEVICE_CLASS_TYPE_SCROLL)
                continue;
            const auto& scroll = *reinterpret_cast<const xcb_input_scroll_class_t*>(classes.data);
            if (const double increment = numberOf(scroll.increment); increment != 0)
                axes.push_back({scroll.number, scroll.scroll_type == XCB_INPUT_SCROLL_TYPE_VERTICAL, increment});
        }
    return axes;
}

void PointerObserver::scrollBy(const xcb_input_raw_motion_event_t& event) {
    std::vector<ScrollAxis>& axes = axesOf(event.sourceid);
    if (axes.empty())
        return;
    const std::uint32_t* mask = xcb_input_raw_button_press_valuator_mask(&event);
    const xcb_input_fp3232_t* values = xcb_input_raw_button_press_axisvalues(&event);
    std::size_t next = 0; // of the values, which are there for the bits of the mask alone
    for (std::uint32_t number = 0; number < event.valuators_len * 32U; ++number) {
        if ((mask[number / 32] >> (number % 32) & 1U) == 0)
            continue;
        const double value = numberOf(values[next++]);
        for (ScrollAxis& axis : axes) {
            if (axis.number != number)
                continue;
            if (const std::int32_t units = axis.turned(value); units != 0)
                noteScroll(clock_.instantOf(event.time), axis.isVertical ? 0 : units, axis.isVertical ? units : 0);
        }
    }
}

} // namespace Recorder
