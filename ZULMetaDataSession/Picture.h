#pragma once

// From the coordinates of the recorded screen to the pixels of the movie.
//
//     const Picture picture = recording.area().toPicture({1920, 1080});
//     const ScreenPoint pixel = picture.toPixels({340, 200});

#include "../SharedDependencies/Export.h"
#include "../ZULMetaDataBridge/Source/ApplicationValues.h"

#include <cstdint>
#include <optional>

namespace ZULMetaData {

/// The size of a movie's picture in pixels.
struct PictureSize {
    double width = 0;  ///< to the right
    double height = 0; ///< downward

    bool hasArea() const { return width > 0 && height > 0; } ///< returns whether both are above 0

    friend bool operator==(const PictureSize&, const PictureSize&) = default; ///< compares both
};

/// How the coordinates of a recording lie in its movie.
class ZULMETADATA_API Picture {
public:
    Picture(const ScreenRect& region, const PictureSize& size) : region_(region), size_(size) {} ///< both have an area

    const ScreenRect& region() const { return region_; } ///< what of the screen the movie shows
    const PictureSize& size() const { return size_; }    ///< returns the size of the movie's picture

    /// Returns how many pixels of the movie a unit of the screen is, in each direction.
    ScreenPoint pixelsPerUnit() const { return {size_.width / region_.width, size_.height / region_.height}; }

    /// Return where a point or a rectangle of the screen is in the movie. The upper left corner of its first pixel is
    /// at 0, 0.
    ///@{
    ScreenPoint toPixels(const ScreenPoint& point) const;
    ScreenRect toPixels(const ScreenRect& rect) const;
    ScreenRect toPixels(const Rect& rect) const;
    ///@}

private:
    ScreenRect region_;
    PictureSize size_;
};

/// What of the screen was recorded.
struct ZULMETADATA_API RecordedArea {
    std::optional<Rect> region; ///< the last region of the recording that has an area
    std::int32_t scale = 1;     ///< the last scale factor of the recording, or 1

    /// Returns how the coordinates lie in a movie of this size. The region fills the movie. Without a region the movie
    /// shows the screen from its corner, with `scale` pixels to a unit; a scale below 1 counts as 1. If the size has no
    /// area, the picture is as large as the region was recorded, or else 1280 x 720.
    Picture toPicture(const PictureSize& movie = {}) const;

    friend bool operator==(const RecordedArea&, const RecordedArea&) = default; ///< compares both fields
};

} // namespace ZULMetaData
