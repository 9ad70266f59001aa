#include "Tools/record/CursorObserver.h"

#include "Platform/Image.h"
#include "Tools/record/Failure.h"

#include <algorithm>
#include <utility>

namespace Recorder {

using namespace ZULMetaData;

namespace {

/// Turns a premultiplied pixel into red, green, blue and straight alpha.
std::array<std::uint8_t, 4> straight(std::uint32_t pixel) {
    const std::uint32_t alpha = pixel >> 24;
    const auto channel = [&](unsigned shift) {
        const std::uint32_t value = pixel >> shift & 0xff;
        return static_cast<std::uint8_t>(alpha == 0 ? 0 : std::min(255U, (value * 255 + alpha / 2) / alpha));
    };
    return {channel(16), channel(8), channel(0), static_cast<std::uint8_t>(alpha)};
}

std::vector<std::uint8_t> encoded(std::uint32_t width, std::uint32_t height, const std::vector<std::uint32_t>& pixels) {
    std::vector<std::uint8_t> rgba;
    rgba.reserve(pixels.size() * 4);
    for (const std::uint32_t pixel : pixels) {
        const auto channels = straight(pixel);
        rgba.insert(rgba.end(), channels.begin(), channels.end());
    }
    const auto bitmap = BitmapImageRep::fromTIFF(Image(width, height, std::move(rgba)).tiffRepresentation());
    return bitmap ? bitmap->pngRepresentation() : std::vector<std::uint8_t>();
}

} // namespace

CursorObserver::CursorObserver(XConnection& connection, const ServerClock& clock, Journal& journal)
    : connection_(connection), clock_(clock), journal_(journal) {
    if (!connection_.has(xcb_xfixes_id))
        throw Refusal("the X display has no XFixes extension, without which the cursor cannot be recorded");
    firstEvent_ = xcb_get_extension_data(connection_.get(), &xcb_xfixes_id)->first_event;
    const auto cookie = xcb_xfixes_query_version(connection_.get(), 4, 0);
    const Reply<xcb_xfixes_query_version_reply_t> version(
        xcb_xfixes_query_version_reply(connection_.get(), cookie, nullptr));
    xcb_xfixes_select_cursor_input(connection_.get(), connection_.root(), XCB_XFIXES_CURSOR_NOTIFY_MASK_DISPLAY_CURSOR);
    ask(now());
}

void CursorObserver::changed(const xcb_xfixes_cursor_notify_event_t& event) {
    ask(clock_.instantOf(event.timestamp));
}

/// The server returns the present cursor. If it has changed again since the event, the next event has the time.
void CursorObserver::ask(Instant instant) {
    const auto cookie = xcb_xfixes_get_cursor_image(connection_.get());
    const Reply<xcb_xfixes_get_cursor_image_reply_t> reply(
        xcb_xfixes_get_cursor_image_reply(connection_.get(), cookie, nullptr));
    if (!reply) { // there is no cursor
        isVisible_ = false;
        noteOpacity(instant);
        return;
    }
    const std::uint32_t* pixels = xcb_xfixes_get_cursor_image_cursor_image(reply.get());
    const int count = xcb_xfixes_get_cursor_image_cursor_image_length(reply.get());
    Look look{reply->width, reply->height, reply->xhot, reply->yhot, {pixels, pixels + count}};
    isVisible_ =
        std::any_of(look.pixels.begin(), look.pixels.end(), [](std::uint32_t pixel) { return pixel >> 24 != 0; });
    const Known& known = knownAs(std::move(look));
    CursorAppearance appearance;
    appearance.id = known.id;
    appearance.picture = known.picture;
    journal_.note<CursorImageKind>(instant, appearance);
    noteOpacity(instant);
}

void CursorObserver::hidden(std::uint32_t serverTime, bool isHidden) {
    isHidden_ = isHidden;
    noteOpacity(clock_.instantOf(serverTime));
}

void CursorObserver::noteOpacity(Instant instant) {
    journal_.note<CursorOpacityKind>(instant, isVisible_ && !isHidden_ ? 1 : 0);
}

const CursorObserver::Known& CursorObserver::knownAs(Look look) {
    const auto found = known_.find(look);
    if (found != known_.end())
        return found->second;
    CursorPicture picture;
    picture.bytes = encoded(look.width, look.height, look.pixels);
    picture.hotSpot = Point(look.hotSpotX, look.hotSpotY);
    Known known{known_.size() + 1, std::make_shared<const CursorPicture>(std::move(picture))};
    return known_.emplace(std::move(look), std::move(known)).first->second;
}

} // namespace Recorder
