#pragma once

#include "Tools/render/YuvPicture.h"

namespace Render {

/// How a picture must be turned before it is shown: first mirrored from left to right, then turned clockwise.
struct Turn {
    int quarters = 0; ///< 0 to 3
    bool isMirrored = false;

    bool swapsSides() const { return quarters % 2 == 1; }
};

/// Returns how the pictures of a stream are turned. Angles between are rounded to quarters.
Turn turnOf(const AVStream& stream);

/// Returns a picture that is turned.
YuvPicture turned(const YuvPicture& picture, const Turn& turn);

} // namespace Render
