#pragma once

// What never changes in a film: the background, the shadow of the movie, and its corners.

#include "Tools/render/Stage.h"

#include <vector>

namespace Render {

class Backdrop {
public:
    Backdrop(const Stage& stage, const Style& style, ColourMatrix matrix);

    /// The background with the shadow, without the movie.
    const YuvPicture& picture() const { return picture_; }

    /// Draws the background over the corners of the movie.
    void cutCorners(const YuvPicture& picture) const;

private:
    YuvPicture picture_;
    std::vector<Tile> corners_;
};

} // namespace Render
