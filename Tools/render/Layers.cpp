#include "Tools/render/Layers.h"

#include "Platform/Image.h"

#include <pango/pangocairo.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>

namespace Render {

using namespace ZULMetaData;

namespace {

constexpr std::uint32_t s_largestCursor = 1024;                  ///< pixels a side; a larger picture is no cursor
constexpr std::size_t s_mostBitmapBytes = std::size_t{64} << 20; ///< that are kept
constexpr double s_farAway = 1e6;                                ///< pixels; what is farther is not drawn

/// The tip is the hot spot. Stands for a cursor whose picture is not known.
constexpr std::array<std::pair<double, double>, 7> s_arrow{
    {{0, 0}, {0, 17}, {4, 13.4}, {6.6, 19.4}, {9.2, 18.3}, {6.7, 12.5}, {12, 12.2}}};

std::uint32_t premultiplied(const std::uint8_t* rgba) {
    const std::uint32_t alpha = rgba[3];
    const auto part = [&](int channel) { return (rgba[channel] * alpha + 127) / 255; };
    return alpha << 24U | part(0) << 16U | part(1) << 8U | part(2);
}

bool isNear(const ScreenPoint& point) {
    return std::abs(point.x) < s_farAway && std::abs(point.y) < s_farAway;
}

/// Returns what covers these coordinates, but not more than the film.
PixelRect coverOf(double left, double top, double right, double bottom, const Stage& stage) {
    const PixelRect film{0, 0, stage.film().width, stage.film().height};
    const auto whole = [](double value) { return static_cast<int>(std::clamp(value, -s_farAway, s_farAway)); };
    const int x = whole(std::floor(left)) - 2;
    const int y = whole(std::floor(top)) - 2;
    return commonPart({x, y, whole(std::ceil(right)) + 2 - x, whole(std::ceil(bottom)) + 2 - y}, film);
}

void drawArrow(const Canvas& canvas, const ScreenPoint& tip, const ScreenPoint& scale) {
    cairo_t* context = canvas.context();
    for (const auto& [x, y] : s_arrow)
        cairo_line_to(context, tip.x + x * scale.x, tip.y + y * scale.y);
    cairo_close_path(context);
    canvas.setColour({0, 0, 0, 1});
    cairo_fill_preserve(context);
    canvas.setColour({1, 1, 1, 1});
    cairo_set_line_width(context, 1.2 * scale.x);
    cairo_set_line_join(context, CAIRO_LINE_JOIN_ROUND);
    cairo_stroke(context);
}

using LayoutPointer = std::unique_ptr<PangoLayout, CairoReleaser<g_object_unref>>;
using FontPointer = std::unique_ptr<PangoFontDescription, CairoReleaser<pango_font_description_free>>;

/// A part of a caption, measured.
struct LaidText {
    LayoutPointer layout;
    double width = 0;
    double height = 0;
    bool isTyped = false;
};

/// The parts of a caption for which there is room.
struct LaidCaption {
    std::vector<LaidText> texts;
    double width = 0;
    double height = 0;
};

/// Lengths of captions, in heights of their letters.
///@{
constexpr double s_gap = 0.35;    ///< between two parts
constexpr double s_inset = 0.4;   ///< from the edge of a key to its sign
constexpr double s_border = 0.12; ///< between a sign and the upper edge of its key
///@}

/// Measures a caption whose letters are `size` pixels high. The last keys are shown if all are wider than `most`
/// pixels.
LaidCaption laidOut(const std::vector<CaptionPart>& parts, const Style::Keys& style, double size, double most) {
    const SurfacePointer surface(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, 1, 1));
    const ContextPointer context(cairo_create(surface.get()));
    const FontPointer font(pango_font_description_from_string(style.font.c_str()));
    pango_font_description_set_absolute_size(font.get(), size * PANGO_SCALE);
    pango_font_description_set_weight(font.get(), PANGO_WEIGHT_SEMIBOLD);
    LaidCaption caption;
    for (const CaptionPart& part : parts) {
        LaidText text{LayoutPointer(pango_cairo_create_layout(context.get())), 0, 0, part.isTyped};
        PangoLayout* layout = text.layout.get();
        pango_layout_set_font_description(layout, font.get());
        pango_layout_set_text(layout, part.text.c_str(), static_cast<int>(part.text.size()));
        pango_layout_set_single_paragraph_mode(layout, 1);
        pango_layout_set_width(layout, static_cast<int>(most * 0.9) * PANGO_SCALE);
        pango_layout_set_ellipsize(layout, PANGO_ELLIPSIZE_START);
        PangoRectangle area;
        pango_layout_get_pixel_extents(layout, nullptr, &area);
        text.width = area.width + (part.isTyped ? 0 : 2 * s_inset * size);
        text.height = area.height;
        caption.width += text.width + (caption.texts.empty() ? 0 : s_gap * size);
        caption.height = std::max(caption.height, text.height);
        caption.texts.push_back(std::move(text));
    }
    while (caption.width > most && caption.texts.size() > 1) {
        caption.width -= caption.texts.front().width + s_gap * size;
        caption.texts.erase(caption.texts.begin());
    }
    return caption;
}

/// Draws a part of a caption with its upper left corner at `place`: a key on a tile, and typed text without one.
void drawText(const Canvas& canvas, const LaidText& text, const Style::Keys& style, const ScreenPoint& place,
              double size) {
    cairo_t* context = canvas.context();
    if (!text.isTyped) {
        canvas.setColour(style.colour, 0.16);
        canvas.addRoundedRect(place.x, place.y - size * s_border, text.width, text.height + 2 * size * s_border,
                              size * 0.25);
        cairo_fill(context);
    }
    canvas.setColour(style.colour);
    cairo_move_to(context, place.x + (text.isTyped ? 0 : s_inset * size), place.y);
    pango_cairo_update_layout(context, text.layout.get());
    pango_cairo_show_layout(context, text.layout.get());
}

} // namespace

CursorLayer::Bitmap& CursorLayer::bitmapOf(const CursorPicture& picture) {
    if (const auto found = bitmaps_.find(&picture); found != bitmaps_.end())
        return found->second;
    const auto info = Image::infoOfEncodedBytes(picture.bytes);
    const bool isUsable = info && info->width <= s_largestCursor && info->height <= s_largestCursor;
    const std::size_t bytes = sizeof(Bitmap) + (isUsable ? std::size_t{4} * info->width * info->height : 0);
    if (bitmapBytes_ + bytes > s_mostBitmapBytes) {
        bitmaps_.clear();
        bitmapBytes_ = 0;
    }
    bitmapBytes_ += bytes;
    Bitmap& bitmap = bitmaps_[&picture];
    if (!isUsable)
        return bitmap;
    const auto image = Image::fromEncodedBytes(picture.bytes);
    if (!image || image->width() == 0 || image->height() == 0)
        return bitmap;
    bitmap.width = static_cast<int>(image->width());
    bitmap.height = static_cast<int>(image->height());
    bitmap.pixels.resize(static_cast<std::size_t>(image->width()) * image->height());
    for (std::size_t i = 0; i < bitmap.pixels.size(); ++i)
        bitmap.pixels[i] = premultiplied(image->rgba().data() + i * 4);
    return bitmap;
}

void CursorLayer::draw(const CursorState& cursor, const Stage& stage, const View& view, const YuvPicture& picture) {
    const ScreenPoint place = view.toFilm(cursor.position);
    if (cursor.opacity <= 0 || !isNear(place))
        return;
    const CursorPicture* stored = cursor.appearance ? cursor.appearance->picture.get() : nullptr;
    if (stored && stored->bytes.empty())
        return; // the cursor was hidden
    const ScreenPoint scale(view.scale().x * style_.size, view.scale().y * style_.size);
    Bitmap none;
    Bitmap& bitmap = stored ? bitmapOf(*stored) : none;
    const bool hasPicture = !bitmap.pixels.empty();
    const double width = (hasPicture ? bitmap.width : 14) * scale.x;
    const double height = (hasPicture ? bitmap.height : 22) * scale.y;
    const double left = place.x - (hasPicture ? stored->hotSpot.x * scale.x : 0);
    const double top = place.y - (hasPicture ? stored->hotSpot.y * scale.y : 0);
    Tile tile(commonPart(coverOf(left, top, left + width, top + height, stage), stage.frame()));
    if (tile.place.empty() || tile.pixels.empty())
        return;
    const Canvas canvas(tile);
    if (hasPicture) {
        const SurfacePointer surface = surfaceOf(bitmap.pixels, bitmap.width, bitmap.height);
        cairo_translate(canvas.context(), left, top);
        cairo_scale(canvas.context(), scale.x, scale.y);
        cairo_set_source_surface(canvas.context(), surface.get(), 0, 0);
        cairo_pattern_set_filter(cairo_get_source(canvas.context()), CAIRO_FILTER_BEST);
        cairo_paint(canvas.context());
    } else {
        drawArrow(canvas, place, scale);
    }
    blend(tile, cursor.opacity, stage.frame(), picture);
}

void drawClick(const ShownClick& click, const Style::Clicks& style, const Stage& stage, const View& view,
               const YuvPicture& picture) {
    const ScreenPoint centre = view.toFilm(click.position);
    if (!isNear(centre))
        return;
    const double age = std::min(1.0, click.age / style.duration);
    const double eased = 1 - std::pow(1 - age, 3);
    const double most = stage.points(style.radius);
    const double radius = most * (0.3 + 0.7 * eased);
    const double line = std::max(1.0, most * (0.03 + 0.1 * (1 - age)));
    const double opacity = click.isHeld ? 1 : 1 - age;
    const double reach = radius + line;
    Tile tile(commonPart(coverOf(centre.x - reach, centre.y - reach, centre.x + reach, centre.y + reach, stage),
                         stage.frame()));
    if (tile.place.empty() || tile.pixels.empty())
        return;
    const Canvas canvas(tile);
    cairo_t* context = canvas.context();
    cairo_arc(context, centre.x, centre.y, click.isHeld ? most * 0.43 : radius, 0, 2 * std::numbers::pi);
    canvas.setColour(style.colour, click.isHeld ? 0.35 : 0.25);
    cairo_fill(context);
    cairo_arc(context, centre.x, centre.y, radius, 0, 2 * std::numbers::pi);
    cairo_set_line_width(context, line);
    canvas.setColour(style.colour);
    cairo_stroke(context);
    blend(tile, opacity, stage.frame(), picture);
}

void CaptionLayer::draw(const KeyCaption* caption, double film, const Stage& stage, const YuvPicture& picture) {
    if (style_.display == KeyDisplay::Hidden || !caption)
        return;
    std::vector<CaptionPart> parts = partsAt(*caption, film, style_.display == KeyDisplay::Shown);
    if (parts.empty())
        return;
    if (parts != shown_) {
        shown_ = std::move(parts);
        tile_ = made(stage);
    }
    constexpr double fade = 0.2;
    blend(tile_, std::min(1.0, (caption->end - film) / fade), tile_.place, picture);
}

Tile CaptionLayer::made(const Stage& stage) const {
    const double size = stage.points(style_.size);
    const LaidCaption caption = laidOut(shown_, style_, size, stage.film().width * 0.9);
    const double boxWidth = caption.width + 1.6 * size;
    const double boxHeight = caption.height + 1.2 * size;
    const double left = (stage.film().width - boxWidth) / 2;
    const double top = stage.film().height - boxHeight - stage.points(70);
    Tile tile(coverOf(left, top, left + boxWidth, top + boxHeight, stage));
    const Canvas canvas(tile);
    canvas.setColour(style_.background);
    canvas.addRoundedRect(left, top, boxWidth, boxHeight, size * 0.6);
    cairo_fill(canvas.context());
    double x = left + 0.8 * size;
    for (const LaidText& text : caption.texts) {
        drawText(canvas, text, style_, {x, top + (boxHeight - text.height) / 2}, size);
        x += text.width + size * s_gap;
    }
    return tile;
}

} // namespace Render
