#pragma once

#include "Tools/record/Geometry.h"
#include "Tools/record/Options.h"
#include "Tools/record/XConnection.h"

namespace Recorder {

/// What part of the screen is recorded.
struct CaptureTarget {
    Area area;                       ///< with even sides
    xcb_window_t window = XCB_NONE;  ///< recorded even where other windows cover it
    xcb_window_t watched = XCB_NONE; ///< the application's window, which may be closed
};

/// Finds what the options name. Waits for a click if they say so. Throws `Refusal`.
CaptureTarget captureTargetOf(XConnection& connection, const Options& options);

} // namespace Recorder
