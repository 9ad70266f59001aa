#pragma once

// How fast the cursor was.
//
//     for (const CursorSpeed& speed : cursorSpeedsOf(positions))
//         std::cout << speed.speed << " units/s from " << speed.start << " s on\n";

#include "../../SharedDependencies/Export.h"
#include "../Track.h"

#include <vector>

namespace ZULMetaData {

/// A speed that holds until the next one starts.
struct CursorSpeed {
    double start = 0; ///< in seconds
    double speed = 0; ///< in units of the display in a second

    friend bool operator==(const CursorSpeed&, const CursorSpeed&) = default; ///< compares both numbers
};

/// Returns the speeds of the cursor in the order of their times: one from each of its times to the next, and 0 from the
/// last one on. The result is empty if there are no positions.
///
/// Positions that stay the same are not recorded. After more than twice the usual distance the cursor has therefore
/// rested, and has moved within the last usual distance, as in `cursorPositionAt`. A jump at one time has no speed, and
/// neither has a way in a time so short that its speed is not finite. Takes O(n) time and memory.
ZULMETADATA_API std::vector<CursorSpeed> cursorSpeedsOf(const Track<CursorLocationKind>& positions);

} // namespace ZULMetaData
