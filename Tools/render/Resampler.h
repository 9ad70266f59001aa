#pragma once

// Scales a part of a picture. The part may begin and end between pixels, so that a camera that moves slowly moves
// smoothly.

#include "Tools/render/YuvPicture.h"

namespace Render {

/// A part of a picture in pixels, with fractions.
struct PicturePart {
    double x = 0;
    double y = 0;
    double width = 0;
    double height = 0;

    friend bool operator==(const PicturePart&, const PicturePart&) = default;
};

/// Draws a part of `source` into a place of `target`, which begins at even numbers and lies within the picture. Text
/// stays sharp if it is enlarged, and does not flicker if it is made smaller. A part that is as large as its place and
/// begins at whole pixels is copied exactly.
void resample(const YuvPicture& source, const PicturePart& part, const YuvPicture& target, const PixelRect& place);

} // namespace Render
