#pragma once

// When and where an editor should zoom in.
//
//     for (const Zoom& zoom : zoomsOf(clicks, keys, positions, windows, screen, duration))
//         std::cout << zoom.start << " s to " << zoom.end << " s, " << zoom.factor << " times\n";

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "../Track.h"
#include "Clicks.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace ZULMetaData {

/// What makes a zoom, and how long it lasts.
struct ZoomOptions {
    double groupTime = 2.5;      ///< seconds from press to press, at most, in a group of clicks
    double groupDistance = 0.15; ///< part of the screen's size from a click to the middle of its group, at most
    double typingGap = 1.5;      ///< seconds from key to key, at most, while somebody types
    std::size_t typingKeys = 3;  ///< keys, at least, that make a zoom
    double lead = 0.4;           ///< seconds from the start of a zoom to its first click or key
    double hold = 1.8;           ///< seconds from the last release or key to the end of a zoom
    double mergeGap = 0.8;       ///< seconds; zooms with a shorter gap between them are one
    double least = 1;            ///< seconds of a zoom, at least
    double factor = 1.5;         ///< how many times larger the picture appears; at least 1
    double stopTime = 1;         ///< seconds; the last click starts no zoom if it is this close to the end
};

/// Why a zoom goes somewhere.
enum class ZoomReason : std::uint8_t { Clicks, Typing };

/// A part of the screen that is worth a look.
struct ZoomPlace {
    double start = 0;                       ///< when to go there, in seconds
    double first = 0;                       ///< when the first click or key happens there, in seconds
    ScreenPoint centre;                     ///< the middle of `area`
    ScreenRect area;                        ///< what is visible, in units of the display; within the screen
    ZoomReason reason = ZoomReason::Clicks; ///< what happens there
};

/// A time during which the picture is enlarged.
struct ZULMETADATA_API Zoom {
    double start = 0;              ///< when to begin to zoom in, in seconds
    double end = 0;                ///< when to begin to zoom out, in seconds
    double factor = 1;             ///< how many times larger the picture appears
    std::vector<ZoomPlace> places; ///< at least one, in the order of their times; the first begins with the zoom

    const ZoomPlace&
    placeAt(double time) const; ///< returns the last place that begins at or before `time`, or the first
};

/// Returns the zooms in their order. They do not overlap, and lie between 0 and `duration` seconds. `screen` is the
/// recorded part of the display.
///
/// Clicks that are close to each other in time and place make one zoom, and so do keys that type characters. A zoom for
/// typing goes to the cursor, or to the window on top if the cursor is outside it or not known. Clicks outside the
/// screen or without a position make no zoom, nor does a last click that stops the recording. Zooms that almost touch
/// are one zoom with several places. Takes O(n log n) time and O(n) memory.
ZULMETADATA_API std::vector<Zoom> zoomsOf(const std::vector<Click>& clicks, const Track<KeyboardActionKind>& keys,
                                          const Track<CursorLocationKind>& positions,
                                          const Track<TopmostWindowKind>& windows, const ScreenRect& screen,
                                          double duration, const ZoomOptions& options = {});

/// Returns the part of `screen` that is visible if it appears `factor` times larger around `centre`: as near to that as
/// the edge of the screen allows.
ZULMETADATA_API ScreenRect zoomedArea(const ScreenRect& screen, const ScreenPoint& centre, double factor);

} // namespace ZULMetaData
