#pragma once

// When the person at the machine did nothing.
//
//     for (const IdleSpan& span : idleSpansOf(positions, actions, keys, scrolling, duration))
//         std::cout << "idle from " << span.start << " s to " << span.end << " s\n";

#include "../../SharedDependencies/Export.h"
#include "../Track.h"

#include <vector>

namespace ZULMetaData {

/// What counts as idle.
struct IdleOptions {
    double least = 5; ///< seconds without activity, at least
};

/// A time without activity.
struct IdleSpan {
    double start = 0; ///< the time of the last activity before it, or 0, in seconds
    double end = 0;   ///< the time of the first activity after it, or the end of the recording, in seconds

    friend bool operator==(const IdleSpan&, const IdleSpan&) = default; ///< compares both times
};

/// Returns the spans between 0 and `duration` seconds without activity, in their order. Activity is a new position of
/// the cursor, a button that goes down or up, a key, and scrolling; an entry that repeats a position is none. The
/// result is empty if all tracks are empty, because nothing is known then. Takes O(n) time and memory.
ZULMETADATA_API std::vector<IdleSpan> idleSpansOf(const Track<CursorLocationKind>& positions,
                                                  const Track<CursorActionKind>& actions,
                                                  const Track<KeyboardActionKind>& keys,
                                                  const Track<ScrollActionKind>& scrolling, double duration,
                                                  const IdleOptions& options = {});

} // namespace ZULMetaData
