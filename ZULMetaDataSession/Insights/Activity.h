#pragma once

// How much happened in a span of a recording.
//
//     InsightOptions options;
//     options.activity = {60, 120};
//     std::cout << activityOf(sources, options).clicks << " clicks in the second minute\n";

#include "../../SharedDependencies/Export.h"

#include <cstddef>
#include <limits>
#include <string>
#include <vector>

namespace ZULMetaData {

struct InsightOptions; // both are in Insights.h
struct InsightSources;

/// A span of a recording, up to its end if nothing else is said.
struct ActivitySpan {
    double start = 0;                                     ///< seconds
    double end = std::numeric_limits<double>::infinity(); ///< seconds; not part of the span
};

/// How long an application was on top.
struct ApplicationTime {
    std::string name;    ///< as stored; may be invalid UTF-8
    double first = 0;    ///< seconds; when it was on top first, within the span
    double duration = 0; ///< seconds, in all

    friend bool operator==(const ApplicationTime&, const ApplicationTime&) = default; ///< compares all members
};

/// What happened in a span.
struct Activity {
    double start = 0;                          ///< seconds, of the span within the recording
    double end = 0;                            ///< seconds, of the span within the recording
    std::size_t clicks = 0;                    ///< how many buttons of the mouse were pressed
    std::size_t keys = 0;                      ///< how many keys were pressed
    std::size_t scrolls = 0;                   ///< how many entries the stream of the wheel has
    double idle = 0;                           ///< seconds without activity
    double distance = 0;                       ///< the way of the cursor, in units of the display
    std::vector<ApplicationTime> applications; ///< the one that was on top longest is the first
};

/// Returns what happened in the span `options.activity`. A span that reaches the end of the recording contains that
/// end. The cursor moves as in `cursorPositionAt`, so that the distances of two spans that follow one another add up.
/// Takes O(n log n) time.
ZULMETADATA_API Activity activityOf(const InsightSources& sources, const InsightOptions& options);

} // namespace ZULMetaData
