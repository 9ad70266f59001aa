#pragma once

// The clicks and drags of a recording.
//
//     for (const Click& click : clicksOf(actions, positions, duration))
//         if (click.count == 2 && click.position)
//             std::cout << "double click at " << click.start << " s\n";

#include "../../SharedDependencies/Export.h"
#include "../Track.h"

#include <optional>
#include <vector>

namespace ZULMetaData {

/// When presses make a double click, a drag, or a click without an end.
struct ClickOptions {
    double multipleTime = 0.5;   ///< seconds from press to press, at most, within a double or triple click
    double multipleDistance = 5; ///< units from press to press, at most, within a double or triple click
    double dragDistance = 8;     ///< units; a cursor that moves farther from the press before the release drags
    double unreleased = 1;       ///< seconds that a press lasts, at most, if its release was not recorded
};

/// A button that went down, until it came up.
struct Click {
    double start = 0;                       ///< when the button was pressed, in seconds
    double end = 0;                         ///< when it was released, in seconds; not before `start`
    MouseButton button = MouseButton::Left; ///< which button
    Modifiers modifiers;                    ///< held at the press
    std::optional<Point> position;          ///< where the cursor was at the press; empty if that is not known
    std::optional<Point> endPosition;       ///< where the cursor was at the release; empty if that is not known
    int count = 1;                          ///< 2 for the second click of a double click, 3 for the third, and so on
    bool isDrag = false;                    ///< whether the cursor was dragged while the button was down
    bool isReleased = true;                 ///< false if the release was not recorded

    friend bool operator==(const Click&, const Click&) = default; ///< compares all fields
};

/// Returns the clicks in the order of their presses. Positions are those of the last entry at or before a time. A
/// release without a press is no click. A press without a release ends after `ClickOptions::unreleased`, or earlier if
/// the same button is pressed again or the recording of `duration` seconds ends. Takes O((n + m) log m) time for n
/// actions and m positions.
ZULMETADATA_API std::vector<Click> clicksOf(const Track<CursorActionKind>& actions,
                                            const Track<CursorLocationKind>& positions, double duration,
                                            const ClickOptions& options = {});

} // namespace ZULMetaData
