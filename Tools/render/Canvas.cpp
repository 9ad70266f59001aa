#include "Tools/render/Canvas.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace Render {

SurfacePointer surfaceOf(std::vector<std::uint32_t>& pixels, int width, int height) {
    void* bytes = pixels.data();
    return SurfacePointer(cairo_image_surface_create_for_data(static_cast<unsigned char*>(bytes), CAIRO_FORMAT_ARGB32,
                                                              width, height, width * 4));
}

Canvas::Canvas(Tile& tile)
    : surface_(surfaceOf(tile.pixels, tile.place.width, tile.place.height)), context_(cairo_create(surface_.get())) {
    cairo_translate(context_.get(), -tile.place.x, -tile.place.y);
}

void Canvas::setColour(const Colour& colour, double opacity) const {
    cairo_set_source_rgba(context_.get(), colour.red, colour.green, colour.blue, colour.alpha * opacity);
}

void Canvas::addRoundedRect(double x, double y, double width, double height, double radius) const {
    constexpr double quarter = std::numbers::pi / 2;
    const double r = std::clamp(radius, 0.0, std::min(width, height) / 2);
    cairo_t* context = context_.get();
    cairo_new_sub_path(context);
    cairo_arc(context, x + width - r, y + r, r, -quarter, 0);
    cairo_arc(context, x + width - r, y + height - r, r, 0, quarter);
    cairo_arc(context, x + r, y + height - r, r, quarter, 2 * quarter);
    cairo_arc(context, x + r, y + r, r, 2 * quarter, 3 * quarter);
    cairo_close_path(context);
}

} // namespace Render
