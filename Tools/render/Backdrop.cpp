#include "Tools/render/Backdrop.h"

#include "Tools/render/Canvas.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace Render {

namespace {

/// Blurs lines of `count` values that lie `step` apart: the mean of 2 * radius + 1 of them.
void blurLine(const float* from, float* to, std::size_t count, std::size_t step, std::size_t radius) {
    const auto at = [&](std::ptrdiff_t place) {
        return from[static_cast<std::size_t>(
                        std::clamp<std::ptrdiff_t>(place, 0, static_cast<std::ptrdiff_t>(count) - 1)) *
                    step];
    };
    const auto reach = static_cast<std::ptrdiff_t>(radius);
    float sum = 0;
    for (std::ptrdiff_t i = -reach; i <= reach; ++i)
        sum += at(i);
    for (std::size_t i = 0; i < count; ++i) {
        to[i * step] = sum / static_cast<float>(2 * radius + 1);
        sum += at(static_cast<std::ptrdiff_t>(i) + reach + 1) - at(static_cast<std::ptrdiff_t>(i) - reach);
    }
}

/// Three times a mean is close to a bell.
void blur(std::vector<float>& values, std::size_t width, std::size_t height, double radius) {
    const auto reach = static_cast<std::size_t>(std::lround(radius / 2));
    if (reach == 0)
        return;
    std::vector<float> other(values.size());
    for (int pass = 0; pass < 3; ++pass) {
        for (std::size_t y = 0; y < height; ++y)
            blurLine(values.data() + y * width, other.data() + y * width, width, 1, reach);
        for (std::size_t x = 0; x < width; ++x)
            blurLine(other.data() + x, values.data() + x, height, width, reach);
    }
}

void paintBackground(const Canvas& canvas, const Stage& stage, const Style::Background& background) {
    cairo_t* context = canvas.context();
    const double width = stage.film().width;
    const double height = stage.film().height;
    if (!background.to) {
        canvas.setColour(background.from);
        cairo_paint(context);
        return;
    }
    const double angle = background.angle * std::numbers::pi / 180;
    const double reach = (std::abs(width * std::cos(angle)) + std::abs(height * std::sin(angle))) / 2;
    cairo_pattern_t* gradient =
        cairo_pattern_create_linear(width / 2 - std::cos(angle) * reach, height / 2 - std::sin(angle) * reach,
                                    width / 2 + std::cos(angle) * reach, height / 2 + std::sin(angle) * reach);
    const Colour& from = background.from;
    const Colour& to = *background.to;
    cairo_pattern_add_color_stop_rgb(gradient, 0, from.red, from.green, from.blue);
    cairo_pattern_add_color_stop_rgb(gradient, 1, to.red, to.green, to.blue);
    cairo_set_source(context, gradient);
    cairo_paint(context);
    cairo_pattern_destroy(gradient);
}

void paintShadow(Tile& film, const Stage& stage, const Style::Frame& style) {
    if (style.shadowOpacity <= 0 || style.padding <= 0)
        return;
    Tile shape(film.place);
    {
        const Canvas canvas(shape);
        const PixelRect& frame = stage.frame();
        canvas.setColour({0, 0, 0, 1});
        canvas.addRoundedRect(frame.x, frame.y + stage.points(style.shadowOffset), frame.width, frame.height,
                              stage.points(style.cornerRadius));
        cairo_fill(canvas.context());
    }
    std::vector<float> alpha(shape.pixels.size());
    std::transform(shape.pixels.begin(), shape.pixels.end(), alpha.begin(),
                   [](std::uint32_t pixel) { return static_cast<float>(pixel >> 24U); });
    blur(alpha, static_cast<std::size_t>(film.place.width), static_cast<std::size_t>(film.place.height),
         stage.points(style.shadowBlur));
    for (std::size_t i = 0; i < alpha.size(); ++i) {
        const double kept = 1 - std::clamp(static_cast<double>(alpha[i]) / 255, 0.0, 1.0) * style.shadowOpacity;
        const auto part = [&](unsigned shift) {
            return static_cast<std::uint32_t>(std::lround(((film.pixels[i] >> shift) & 0xffU) * kept)) << shift;
        };
        film.pixels[i] = 0xff000000U | part(16) | part(8) | part(0);
    }
}

} // namespace

Backdrop::Backdrop(const Stage& stage, const Style& style, ColourMatrix matrix) {
    Tile film(PixelRect{0, 0, stage.film().width, stage.film().height});
    paintBackground(Canvas(film), stage, style.background);
    paintShadow(film, stage, style.frame);
    picture_ = yuvOf(film.pixels, film.place.width, film.place.height, matrix);

    const PixelRect& frame = stage.frame();
    const int half = std::min(frame.width, frame.height) / 2;
    const double radius = std::min<double>(half, stage.points(style.frame.cornerRadius));
    const int size = std::min((static_cast<int>(std::ceil(radius)) + 1) & ~1, half & ~1);
    if (size == 0)
        return;
    const SurfacePointer whole = surfaceOf(film.pixels, film.place.width, film.place.height);
    for (const int x : {frame.x, frame.right() - size})
        for (const int y : {frame.y, frame.bottom() - size}) {
            Tile corner(PixelRect{x, y, size, size});
            {
                const Canvas canvas(corner);
                cairo_set_source_surface(canvas.context(), whole.get(), 0, 0);
                cairo_paint(canvas.context());
                cairo_set_operator(canvas.context(), CAIRO_OPERATOR_DEST_OUT);
                canvas.setColour({0, 0, 0, 1});
                canvas.addRoundedRect(frame.x, frame.y, frame.width, frame.height, radius);
                cairo_fill(canvas.context());
            }
            corners_.push_back(std::move(corner));
        }
}

void Backdrop::cutCorners(const YuvPicture& picture) const {
    for (const Tile& corner : corners_)
        blend(corner, 1, corner.place, picture);
}

} // namespace Render
