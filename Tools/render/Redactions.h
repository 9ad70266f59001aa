#pragma once

// What nobody may see: rectangles of the recorded display, and the times in which they are covered.

#include "Tools/render/YuvPicture.h"
#include "ZULMetaDataSession/Recording.h"

#include <string>
#include <string_view>
#include <vector>

namespace Render {

struct CoveredPlace {
    double from = 0; ///< in seconds of the recording
    double to = 0;   ///< both ends belong to it
    ZULMetaData::ScreenRect area;
};

/// The streams of a recording without what lies in the places.
struct RedactedStreams {
    std::vector<std::string> streams; ///< their bytes, headers included
    std::vector<std::string> losses;  ///< sentences about streams that were left out, or parts of them
};

class Redactions {
public:
    /// Covers nothing.
    Redactions() = default;

    /// Reads {"schema": "zulm.redactions", "schema_version": 1, "places": [{"from": 1, "to": 5, "x": 10, "y": 20,
    /// "width": 300, "height": 40}]}. A place without a rectangle is all of the picture. Throws `Zulm::Failure` that
    /// names the file, the line and the member.
    static Redactions read(std::string_view document, const std::string& file);

    bool empty() const { return places_.empty(); }

    /// Fills what is covered at a time of the recording with black. The picture shows `region`. Returns false if
    /// nothing is covered, and leaves the picture as it is. A picture that is covered gets bytes of its own.
    bool cover(YuvPicture& picture, double time, const ZULMetaData::ScreenRect& region) const;

    /// Returns whether a cursor at this point would touch what is covered at a time. Its positions there are removed,
    /// so that it must not be drawn on its way between the positions before and after them.
    bool hidesCursor(const ZULMetaData::ScreenPoint& position, double time) const;

    /// Returns the streams without what lies in the places at their times: positions, images, clicks and scrolling of a
    /// cursor that is there; keys while the window on top touches a place or is not known; the title and application of
    /// a window whose upper edge is there; rectangles of controls; all texts of slides. Rectangles of windows stay.
    /// Streams that cannot be decoded are left out.
    RedactedStreams redacted(const ZULMetaData::Recording& recording) const;

private:
    std::vector<CoveredPlace> places_;
};

} // namespace Render
