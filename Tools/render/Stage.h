#pragma once

// Where everything is in a film: the movie lies in a frame, through which a camera looks at the recorded display.

#include "Tools/render/FilmSize.h"
#include "Tools/render/Resampler.h"
#include "Tools/render/Style.h"
#include "ZULMetaDataSession/Insights/Camera.h"
#include "ZULMetaDataSession/Picture.h"

namespace Render {

/// The parts of a film that stay where they are.
class Stage {
public:
    /// `movie` is the size of the movie as it is shown.
    Stage(const FilmSize& film, const ZULMetaData::PictureSize& movie, const Style& style);

    const FilmSize& film() const { return film_; }
    const PixelRect& frame() const { return frame_; }             ///< where the movie is; everything is even
    double point() const { return film_.height / 1080.0; }        ///< pixels to a point of a style
    double points(double count) const { return count * point(); } ///< returns so many points in pixels

private:
    FilmSize film_;
    PixelRect frame_;
};

/// What the camera shows at one time.
class View {
public:
    /// `area` is the visible part of the recorded display, and `region` all of it.
    View(const Stage& stage, const ZULMetaData::ScreenRect& region, const ZULMetaData::ScreenRect& area);

    /// Returns where a point of the display is in the film, in pixels.
    ZULMetaData::ScreenPoint toFilm(const ZULMetaData::ScreenPoint& point) const;

    /// Returns how many pixels of the film a unit of the display is.
    ZULMetaData::ScreenPoint scale() const { return scale_; }

    /// Returns what of a picture of this size is visible.
    PicturePart partOf(int width, int height) const;

private:
    ZULMetaData::ScreenRect region_;
    ZULMetaData::ScreenRect area_;
    ZULMetaData::ScreenPoint origin_;
    ZULMetaData::ScreenPoint scale_;
};

} // namespace Render
