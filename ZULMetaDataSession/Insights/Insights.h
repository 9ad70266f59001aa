#pragma once

// Everything that the insights tell about a recording.
//
//     const Recording recording("Recording.mp4");
//     const Insights insights = insightsOf(recording);
//     std::cout << insights.clicks.size() << " clicks, " << insights.zooms.size() << " zooms\n";

#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaDataBridge/Source/ApplicationValues.h"
#include "../Error.h"
#include "../Recording.h"
#include "../Track.h"
#include "Activity.h"
#include "Camera.h"
#include "Chapters.h"
#include "Clicks.h"
#include "CursorPath.h"
#include "Idle.h"
#include "KeyCaptions.h"
#include "Zooms.h"

#include <vector>

namespace ZULMetaData {

/// The parameters of all insights.
struct InsightOptions {
    ClickOptions clicks;        ///< what makes a click, for the path and the zooms as well
    KeyCaptionOptions captions; ///< how keys are joined
    IdleOptions idle;           ///< what counts as idle
    ChapterOptions chapters;    ///< which changes make a chapter
    CursorPathOptions path;     ///< how much the path is smoothed, for the camera as well
    ZoomOptions zooms;          ///< what makes a zoom
    CameraOptions camera;       ///< how the camera moves
    ActivitySpan activity;      ///< what `activityOf` tells about
};

/// What insights are made of. Copies share the entries.
struct InsightSources {
    Track<CursorLocationKind> positions;    ///< where the cursor was
    Track<CursorActionKind> actions;        ///< the buttons of the mouse
    Track<KeyboardActionKind> keys;         ///< the keys
    Track<ScrollActionKind> scrolling;      ///< the wheel
    Track<TopmostWindowKind> windows;       ///< where the window on top was
    Track<TopmostWindowTitleKind> titles;   ///< its titles
    Track<TopmostAppNameKind> applications; ///< its applications
    Track<SlideInfoTitleKind> slides;       ///< the titles of slides
    ScreenRect screen;                      ///< the recorded part of the display; without area if it is not known
    double duration = 0;                    ///< the length of the recording, in seconds
};

/// What is known about a recording. Without a screen there are no zooms.
struct Insights {
    double duration = 0;              ///< the length of the recording, in seconds
    ScreenRect screen;                ///< the recorded part of the display; without area if it is not known
    std::vector<Click> clicks;        ///< see `clicksOf`
    std::vector<KeyCaption> captions; ///< see `keyCaptions`
    std::vector<IdleSpan> idle;       ///< see `idleSpansOf`
    std::vector<Chapter> chapters;    ///< see `chaptersOf`
    CursorPath path;                  ///< the smoothed path of the cursor
    std::vector<Zoom> zooms;          ///< see `zoomsOf`
    Camera camera;                    ///< shows the zooms
};

/// Returns what the insights are made of. The screen is the last recorded region that has an area. The duration is that
/// of the movie. If the movie tells none, it is the time of the last entry of any kind, at most 366 days; a time later
/// than a day, and ten times as late as all others, is damaged and does not count. Calls `leaveOut` for every track
/// that cannot be read, which is empty then.
ZULMETADATA_API InsightSources insightSourcesOf(const Recording& recording,
                                                const Callback<void(const Error& error)>& leaveOut);

/// Returns all insights.
ZULMETADATA_API Insights insightsOf(const InsightSources& sources, const InsightOptions& options = {});

/// Returns all insights of a recording. Throws `Error` if one of the tracks cannot be read.
ZULMETADATA_API Insights insightsOf(const Recording& recording, const InsightOptions& options = {});

} // namespace ZULMetaData
