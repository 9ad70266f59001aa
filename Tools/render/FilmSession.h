#pragma once

// What a recording knows about every time of a film.

#include "Tools/render/Style.h"
#include "Tools/render/TimeMap.h"
#include "Tools/zulm/RetimedStreams.h"
#include "ZULMetaDataSession/Insights/Insights.h"
#include "ZULMetaDataSession/Recording.h"
#include "ZULMetaDataSession/Timeline.h"

#include <optional>
#include <string>
#include <vector>

namespace Render {

/// The cursor at one time.
struct CursorState {
    ZULMetaData::ScreenPoint position;                         ///< of its hot spot
    const ZULMetaData::CursorAppearance* appearance = nullptr; ///< null if it is not known
    double opacity = 1;
};

/// A click that is shown at one time.
struct ShownClick {
    ZULMetaData::ScreenPoint position;
    double age = 0; ///< seconds of the film since the press
    bool isHeld = false;
};

/// Positions and clicks are those of the recording, because the cursor must be where the picture shows what it does.
/// Captions and the camera follow the streams of the edited movie, so that they stay calm at every speed.
class FilmSession {
public:
    /// Calls `leaveOut` for streams that cannot be read. The recording must outlive this. `movie` is the size of its
    /// pictures as they are shown.
    FilmSession(const ZULMetaData::Recording& recording, const ZULMetaData::EditList& edits, const Style& style,
                const ZULMetaData::PictureSize& movie,
                const ZULMetaData::Callback<void(const ZULMetaData::Error&)>& leaveOut);

    const TimeMap& times() const { return times_; }
    const ZULMetaData::ScreenRect& region() const { return region_; }           ///< what the movie shows of the display
    const std::vector<ZULMetaData::Click>& clicks() const { return clicks_; }   ///< of the recording
    Zulm::RetimedStreams& streams() { return streams_; }                        ///< of the film
    const ZULMetaData::Insights& filmInsights() const { return filmInsights_; } ///< of the edited movie

    /// Takes these zooms, at times of the film, in place of the automatic ones.
    void setZooms(const std::vector<ZULMetaData::Zoom>& zooms);

    std::optional<CursorState> cursorAt(const FilmTime& now);
    std::vector<ShownClick> clicksAt(const FilmTime& now, double duration) const;
    const ZULMetaData::KeyCaption* captionAt(double film) const;
    ZULMetaData::ScreenRect areaAt(double film) const; ///< what the camera shows

private:
    /// Returns where the path has the cursor, or else where the last entry says, as the page shows it.
    std::optional<ZULMetaData::ScreenPoint> positionAt(double time) const;

    double visibilityAt(double time) const;

    Style style_;
    TimeMap times_;
    ZULMetaData::Timeline timeline_;
    ZULMetaData::ScreenRect region_;
    std::vector<ZULMetaData::Click> clicks_;
    ZULMetaData::Track<ZULMetaData::CursorLocationKind> positions_;
    ZULMetaData::CursorPath path_;
    std::vector<double> moves_; ///< when the cursor moved or a button was pressed
    Zulm::RetimedStreams streams_;
    ZULMetaData::Insights filmInsights_;
};

/// Reads zooms from {"schema": "zulm.zooms", "schema_version": 1, "zooms": [{"start": 1, "end": 4, "factor": 2,
/// "x": 300, "y": 200}]}: times of the film, and points of the recorded display. Throws `Zulm::Failure`.
std::vector<ZULMetaData::Zoom> readZooms(const std::string& file, const ZULMetaData::ScreenRect& region);

} // namespace Render
