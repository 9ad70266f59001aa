#pragma once

namespace Render {

/// The size of a film in pixels; both are even.
struct FilmSize {
    int width = 0;
    int height = 0;
};

} // namespace Render
