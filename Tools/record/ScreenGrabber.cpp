#include "Tools/record/ScreenGrabber.h"

#include "Tools/record/Failure.h"

#include <fmt/core.h>
#include <xcb/composite.h>

#include <sys/ipc.h>
#include <sys/shm.h>

#include <algorithm>
#include <cstring>
#include <utility>

namespace Recorder {

namespace {

constexpr std::uint32_t s_allPlanes = 0xffffffff;
constexpr std::uint8_t s_noPixel = 0;

const xcb_format_t* formatOfDepth(const xcb_setup_t& setup, std::uint8_t depth) {
    for (auto formats = xcb_setup_pixmap_formats_iterator(&setup); formats.rem > 0; xcb_format_next(&formats))
        if (formats.data->depth == depth)
            return formats.data;
    return nullptr;
}

const xcb_visualtype_t* visualOf(const xcb_screen_t& screen, xcb_visualid_t id) {
    for (auto depths = xcb_screen_allowed_depths_iterator(&screen); depths.rem > 0; xcb_depth_next(&depths))
        for (auto visuals = xcb_depth_visuals_iterator(depths.data); visuals.rem > 0; xcb_visualtype_next(&visuals))
            if (visuals.data->visual_id == id)
                return visuals.data;
    return nullptr;
}

std::optional<PixelLayout> layoutOf(int bitsPerPixel, const xcb_visualtype_t& visual) {
    if (bitsPerPixel == 32 && visual.red_mask == 0xff0000 && visual.blue_mask == 0xff)
        return PixelLayout::BGRX32;
    if (bitsPerPixel == 32 && visual.red_mask == 0xff && visual.blue_mask == 0xff0000)
        return PixelLayout::RGBX32;
    if (bitsPerPixel == 24 && visual.red_mask == 0xff0000 && visual.blue_mask == 0xff)
        return PixelLayout::BGR24;
    if (bitsPerPixel == 16 && visual.red_mask == 0xf800 && visual.blue_mask == 0x1f)
        return PixelLayout::RGB565;
    return std::nullopt;
}

} // namespace

ScreenGrabber::ScreenGrabber(const std::string& display, Area area, xcb_window_t window)
    : connection_(display), area_(area), window_(window), screen_(connection_.rootArea()) {
    findLayout();
    if (window_ != XCB_WINDOW_NONE) {
        xcb_composite_redirect_window(connection_.get(), window_, XCB_COMPOSITE_REDIRECT_AUTOMATIC);
        pixmap_ = xcb_generate_id(connection_.get());
    }
    shareMemory();
}

ScreenGrabber::~ScreenGrabber() {
    if (memory_)
        shmdt(memory_);
}

void ScreenGrabber::findLayout() {
    const xcb_setup_t* setup = xcb_get_setup(connection_.get());
    const xcb_screen_t& screen = connection_.screen();
    const xcb_format_t* format = formatOfDepth(*setup, screen.root_depth);
    const xcb_visualtype_t* visual = visualOf(screen, screen.root_visual);
    const bool isLittleEndian = setup->image_byte_order == XCB_IMAGE_ORDER_LSB_FIRST;
    const auto layout =
        format && visual && isLittleEndian ? layoutOf(format->bits_per_pixel, *visual) : std::optional<PixelLayout>();
    if (!layout)
        throw Refusal(fmt::format("the X display has pixels of depth {}, which cannot be recorded; use one of depth 24",
                                  screen.root_depth));
    layout_ = *layout;
    bitsPerPixel_ = format->bits_per_pixel;
    padOfLines_ = format->scanline_pad;
    bytesPerLine_ = bytesPerLineOf(area_.width);
}

int ScreenGrabber::bytesPerLineOf(int width) const {
    return (width * bitsPerPixel_ + padOfLines_ - 1) / padOfLines_ * padOfLines_ / 8;
}

/// A server on another machine, or in another container, cannot share memory: pictures then come as replies.
void ScreenGrabber::shareMemory() {
    if (!connection_.has(xcb_shm_id))
        return;
    const auto size = static_cast<std::size_t>(bytesPerLine_) * static_cast<std::size_t>(area_.height);
    const int identifier = shmget(IPC_PRIVATE, size, IPC_CREAT | 0600);
    if (identifier < 0)
        return;
    void* memory = shmat(identifier, nullptr, 0);
    const xcb_shm_seg_t segment = xcb_generate_id(connection_.get());
    Reply<xcb_generic_error_t> error;
    const bool isMapped = reinterpret_cast<std::intptr_t>(memory) != -1;
    if (isMapped)
        error.reset(
            xcb_request_check(connection_.get(), xcb_shm_attach_checked(connection_.get(), segment,
                                                                        static_cast<std::uint32_t>(identifier), 0)));
    shmctl(identifier, IPC_RMID, nullptr); // it goes with the last process that uses it
    if (!isMapped)
        return;
    if (error) {
        shmdt(memory);
        return;
    }
    memory_ = memory;
    segment_ = segment;
}

/// A window has another pixmap after each change of its size, and whenever it is shown again. The old one keeps its
/// last picture and tells nobody, so the pixmap is named anew for each picture.
xcb_drawable_t ScreenGrabber::drawable() {
    if (window_ == XCB_WINDOW_NONE)
        return connection_.root();
    xcb_connection_t* connection = connection_.get();
    if (pixmapArea_)
        xcb_free_pixmap(connection, pixmap_);
    pixmapArea_.reset();
    const auto nameCookie = xcb_composite_name_window_pixmap_checked(connection, window_, pixmap_);
    const auto sizeCookie = xcb_get_geometry(connection, pixmap_);
    const Reply<xcb_generic_error_t> error(xcb_request_check(connection, nameCookie));
    const Reply<xcb_get_geometry_reply_t> size(xcb_get_geometry_reply(connection, sizeCookie, nullptr));
    if (error || !size) // it is hidden, or gone
        return XCB_NONE;
    pixmapArea_ = Area{0, 0, size->width, size->height};
    return pixmap_;
}

bool ScreenGrabber::notePointer(xcb_query_pointer_cookie_t cookie, GrabbedPicture& picture) {
    const Reply<xcb_query_pointer_reply_t> reply(xcb_query_pointer_reply(connection_.get(), cookie, nullptr));
    picture.hasPointer = reply && reply->same_screen;
    if (picture.hasPointer)
        picture.pointer = {reply->root_x, reply->root_y};
    return picture.hasPointer;
}

/// Returns null if the server does not know the pixels.
const std::uint8_t* ScreenGrabber::fetch(xcb_drawable_t source, const Area& part) {
    if (part.width == 0 || part.height == 0)
        return &s_noPixel;
    xcb_connection_t* connection = connection_.get();
    const auto x = static_cast<std::int16_t>(part.x);
    const auto y = static_cast<std::int16_t>(part.y);
    const auto width = static_cast<std::uint16_t>(part.width);
    const auto height = static_cast<std::uint16_t>(part.height);
    if (segment_ != 0) {
        const auto cookie = xcb_shm_get_image(connection, source, x, y, width, height, s_allPlanes,
                                              XCB_IMAGE_FORMAT_Z_PIXMAP, segment_, 0);
        const Reply<xcb_shm_get_image_reply_t> reply(xcb_shm_get_image_reply(connection, cookie, nullptr));
        return reply ? static_cast<const std::uint8_t*>(memory_) : nullptr;
    }
    const auto cookie = xcb_get_image(connection, XCB_IMAGE_FORMAT_Z_PIXMAP, source, x, y, width, height, s_allPlanes);
    Reply<xcb_get_image_reply_t> image(xcb_get_image_reply(connection, cookie, nullptr));
    const auto needed = static_cast<std::int64_t>(bytesPerLineOf(part.width)) * part.height;
    if (!image || xcb_get_image_data_length(image.get()) < needed)
        return nullptr;
    image_ = std::move(image);
    return xcb_get_image_data(image_.get());
}

const std::uint8_t* ScreenGrabber::padded(const std::uint8_t* pixels, const Area& part) {
    const auto line = static_cast<std::size_t>(bytesPerLine_);
    const auto shorter = static_cast<std::size_t>(bytesPerLineOf(part.width));
    padded_.assign(line * static_cast<std::size_t>(area_.height), 0);
    for (std::size_t row = 0; row < static_cast<std::size_t>(part.height); ++row)
        std::memcpy(&padded_[row * line], pixels + row * shorter, shorter);
    return padded_.data();
}

std::optional<GrabbedPicture> ScreenGrabber::grab() {
    // Some events come to every client.
    while (const Reply<xcb_generic_event_t> event{xcb_poll_for_queued_event(connection_.get())}) {
    }
    const xcb_drawable_t source = drawable();
    if (source == XCB_NONE)
        return repeatLast();
    const Area part = partOf(pixmapArea_ ? *pixmapArea_ : screen_);
    GrabbedPicture picture;
    picture.bytesPerLine = bytesPerLine_;
    const Instant asked = now();
    picture.pointerInstant = asked;
    const auto pointerCookie = xcb_query_pointer(connection_.get(), connection_.root());
    picture.pixels = fetch(source, part);
    picture.instant = middleOf(asked, now());
    notePointer(pointerCookie, picture);
    const bool isWhole = part.width == area_.width && part.height == area_.height;
    if (!pixmapArea_ && (!picture.pixels || !isWhole))
        screen_ = connection_.rootArea(); // it may have changed
    if (!picture.pixels)
        return picture;
    if (!isWhole)
        picture.pixels = padded(picture.pixels, part);
    lastPixels_ = picture.pixels;
    return picture;
}

/// Returns which part of the area there is in a picture of the screen or of the window.
Area ScreenGrabber::partOf(const Area& source) const {
    const int x = window_ == XCB_WINDOW_NONE ? area_.x : 0;
    const int y = window_ == XCB_WINDOW_NONE ? area_.y : 0;
    return {x, y, std::clamp(source.width - x, 0, area_.width), std::clamp(source.height - y, 0, area_.height)};
}

std::optional<GrabbedPicture> ScreenGrabber::repeatLast() {
    std::optional<GrabbedPicture> picture = askPointer();
    if (picture) {
        picture->pixels = lastPixels_;
        picture->bytesPerLine = bytesPerLine_;
    }
    return picture;
}

std::optional<GrabbedPicture> ScreenGrabber::askPointer() {
    GrabbedPicture picture;
    const Instant asked = now();
    picture.pointerInstant = asked;
    if (!notePointer(xcb_query_pointer(connection_.get(), connection_.root()), picture))
        return std::nullopt;
    picture.instant = middleOf(asked, now());
    return picture;
}

} // namespace Recorder
