#pragma once

// Draws the frames of a film.
//
//     Composer composer(session, pictures, stage, style);
//     writer.write(composer.frameAt(session.times().at(1.5)));

#include "Tools/render/Backdrop.h"
#include "Tools/render/FilmSession.h"
#include "Tools/render/Layers.h"
#include "Tools/render/PictureReader.h"

#include <functional>

namespace Render {

/// What is covered in a film. Both functions may be empty.
struct Cover {
    /// Changes a picture of the movie before it is drawn. Returns false if it leaves the picture as it is.
    std::function<bool(YuvPicture& picture, double time)> picture;

    /// Returns whether neither the cursor nor a click is drawn at a point of the display.
    std::function<bool(const ZULMetaData::ScreenPoint& position, double time)> hides;
};

class Composer {
public:
    /// Everything that is passed must outlive this.
    Composer(FilmSession& session, PictureReader& pictures, const Stage& stage, const Style& style, Cover cover = {});

    /// Returns what the film shows at a time. Its bytes are its own.
    const YuvPicture& frameAt(const FilmTime& time);

    /// The same for a picture that stands still: the rings of clicks are half grown.
    YuvPicture stillAt(const FilmTime& time);

    /// Returns how many seconds of a processor drawing has taken so far, without decoding.
    double drawingTime() const { return drawing_; }

private:
    void drawMovie(const FilmTime& time, const View& view);
    void drawFrame(const FilmTime& time, bool isStill);
    bool isHidden(const ZULMetaData::ScreenPoint& position, const FilmTime& time) const;

    FilmSession& session_;
    PictureReader& pictures_;
    Stage stage_;
    Style style_;
    Cover cover_;
    Backdrop backdrop_;
    CursorLayer cursor_;
    CaptionLayer captions_;
    YuvPicture base_; ///< the movie on its background, which serves as long as neither the picture nor the view changes
    YuvPicture frame_;
    PicturePart shownPart_;
    std::uint64_t shownPicture_ = 0;
    double drawing_ = 0;
};

} // namespace Render
