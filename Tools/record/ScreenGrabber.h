#pragma once

// Takes pictures of a part of the screen, without the cursor.

#include "Tools/record/Geometry.h"
#include "Tools/record/Instant.h"
#include "Tools/record/XConnection.h"

#include <xcb/shm.h>

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace Recorder {

/// Pixels as the server hands them out, valid until the next picture.
struct GrabbedPicture {
    const std::uint8_t* pixels = nullptr; ///< null if they cannot be read now
    int bytesPerLine = 0;
    Instant instant = 0; ///< the middle between the request and the arrival
    bool hasPointer = false;
    Position pointer;           ///< where the pointer was
    Instant pointerInstant = 0; ///< when that was asked, before the pixels
};

/// How the server stores a pixel.
enum class PixelLayout { BGRX32, RGBX32, BGR24, RGB565 };

class ScreenGrabber {
public:
    /// `window` is the whole window to record instead of the part `area` of the root window. Throws `Refusal` if the
    /// pixels of the server are of no known layout.
    ScreenGrabber(const std::string& display, Area area, xcb_window_t window);
    ~ScreenGrabber();
    ScreenGrabber(const ScreenGrabber&) = delete;
    ScreenGrabber& operator=(const ScreenGrabber&) = delete;

    PixelLayout layout() const { return layout_; }

    /// Takes a picture. A window that is hidden shows its last picture. A window or screen that became smaller has
    /// black at its right and below it. The picture has no pixels if the area cannot be read now, such as a window that
    /// was never shown. Returns nothing if the server knows nothing of the pointer either.
    std::optional<GrabbedPicture> grab();

    /// Asks for the pointer alone.
    std::optional<GrabbedPicture> askPointer();

    bool isAlive() const { return connection_.isAlive(); }

private:
    void findLayout();
    void shareMemory();
    xcb_drawable_t drawable();
    int bytesPerLineOf(int width) const;
    Area partOf(const Area& source) const;
    const std::uint8_t* fetch(xcb_drawable_t source, const Area& part);
    const std::uint8_t* padded(const std::uint8_t* pixels, const Area& part);
    std::optional<GrabbedPicture> repeatLast();
    bool notePointer(xcb_query_pointer_cookie_t cookie, GrabbedPicture& picture);

    XConnection connection_;
    Area area_;
    xcb_window_t window_;
    Area screen_;                    ///< its size, as far as pictures have shown
    xcb_pixmap_t pixmap_ = 0;        ///< what the window shows, even where others cover it
    std::optional<Area> pixmapArea_; ///< nothing while the window has no pixmap
    PixelLayout layout_ = PixelLayout::BGRX32;
    int bitsPerPixel_ = 0;
    int padOfLines_ = 0; ///< bits
    int bytesPerLine_ = 0;
    xcb_shm_seg_t segment_ = 0;
    void* memory_ = nullptr;
    Reply<xcb_get_image_reply_t> image_;       ///< without shared memory
    std::vector<std::uint8_t> padded_;         ///< a window that became smaller, and black around it
    const std::uint8_t* lastPixels_ = nullptr; ///< those of the last picture, in one of the three places above
};

} // namespace Recorder
