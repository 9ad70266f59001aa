#pragma once

// Everything that holds at a time of a recording.
//
//     const Snapshot state = recording.at(12.5);
//     if (state.cursor && state.buttons && state.buttons->contains(MouseButton::Left))
//         std::cout << "the left button is down at " << state.cursor->x << ", " << state.cursor->y << '\n';

#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "Picture.h"
#include "Track.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace ZULMetaData {

/// Where the cursor is between two entries.
enum class Interpolation {
    Held,   ///< where the last entry at or before the time says
    Linear, ///< on a straight line to the next entry, unless it rests
};

/// Returns the usual distance of a track: the median of the distances between entries that follow one another at
/// different times. The median of an even number of distances is the mean of the two in the middle. Returns 0 if there
/// are no two different times. The times ascend and are finite.
ZULMETADATA_API double usualDistance(std::span<const double> times);

/// Returns where the cursor is at a time, or nothing before the first entry.
///
/// `usual` is the usual distance of the track. Nothing was recorded while the cursor rested: if two entries are more
/// than two usual distances apart, the cursor stays at the first one, and moves to the second one within the last usual
/// distance before it.
ZULMETADATA_API std::optional<ScreenPoint> cursorPositionAt(const Track<CursorLocationKind>& track, double time,
                                                            Interpolation interpolation, double usual);

/// What is known about the slide that is shown. The texts are as they are stored and may be invalid UTF-8.
struct Slide {
    std::optional<std::string_view> title;   ///< its title
    std::optional<std::string_view> text;    ///< what it says
    std::optional<std::string_view> comment; ///< the speaker's notes

    bool isKnown() const { return title || text || comment; } ///< returns whether one of them is known
};

/// What holds at a time. What is not known then is empty. Texts and the appearance of the cursor are those of the
/// recording, which must outlive them.
struct ZULMETADATA_API Snapshot {
    double time = 0;                              ///< in seconds
    std::optional<ScreenPoint> cursor;            ///< where the cursor is, in the units of the screen
    const CursorAppearance* appearance = nullptr; ///< its picture with the hot spot; may lack the picture
    std::optional<double> opacity;                ///< how opaque the cursor is drawn, as stored
    std::optional<MouseButtons> buttons;          ///< which are down; not known before the first cursor action
    std::optional<Modifiers> modifiers;           ///< of the last key, or the last click that tells them
    Track<KeyboardActionKind>::Part keys;         ///< the keys up to now; the last one is the latest
    std::optional<Rect> window;                   ///< where the window on top is
    std::optional<std::string_view> title;        ///< of the window on top; may be invalid UTF-8
    std::optional<std::string_view> application;  ///< of that window; may be invalid UTF-8
    Slide slide;                                  ///< what is presented
    std::optional<Rect> hover;                    ///< what the cursor hovers over
    std::optional<Rect> region;                   ///< the last recorded region until now
    std::optional<std::int32_t> scale;            ///< the last scale factor until now
    std::optional<float> cpu;                     ///< how busy the machine is, as stored
    RecordedArea area;                            ///< what the whole recording says about region and scale factor

    /// Returns how the coordinates lie in a movie of this size.
    Picture toPicture(const PictureSize& movie = {}) const { return area.toPicture(movie); }
};

} // namespace ZULMetaData
