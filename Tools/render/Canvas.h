#pragma once

// Drawing with Cairo on tiles, in the pixels of the film.

#include "Tools/render/YuvPicture.h"

#include <cairo.h>

#include <memory>

namespace Render {

template <auto release>
struct CairoReleaser {
    template <class T>
    void operator()(T* object) const {
        release(object);
    }
};
using SurfacePointer = std::unique_ptr<cairo_surface_t, CairoReleaser<cairo_surface_destroy>>;
using ContextPointer = std::unique_ptr<cairo_t, CairoReleaser<cairo_destroy>>;

/// Draws on the pixels of a tile as long as it lives. The tile must stay where it is.
class Canvas {
public:
    explicit Canvas(Tile& tile);

    cairo_t* context() const { return context_.get(); }

    void setColour(const Colour& colour, double opacity = 1) const;
    void addRoundedRect(double x, double y, double width, double height, double radius) const;

private:
    SurfacePointer surface_;
    ContextPointer context_;
};

/// Returns a surface that draws these pixels, which must outlive it.
SurfacePointer surfaceOf(std::vector<std::uint32_t>& pixels, int width, int height);

} // namespace Render
