#include "Tools/render/Stage.h"

#include <algorithm>
#include <cmath>

namespace Render {

using namespace ZULMetaData;

namespace {

int evenOf(double value) {
    return 2 * static_cast<int>(std::lround(value / 2));
}

} // namespace

Stage::Stage(const FilmSize& film, const PictureSize& movie, const Style& style) : film_(film) {
    const double padding = std::min(points(style.frame.padding), 0.4 * std::min(film.width, film.height));
    const double scale = std::min((film.width - 2 * padding) / movie.width, (film.height - 2 * padding) / movie.height);
    frame_.width = std::clamp(evenOf(movie.width * scale), 2, film.width);
    frame_.height = std::clamp(evenOf(movie.height * scale), 2, film.height);
    frame_.x = evenOf((film.width - frame_.width) / 2.0);
    frame_.y = evenOf((film.height - frame_.height) / 2.0);
}

View::View(const Stage& stage, const ScreenRect& region, const ScreenRect& area)
    : region_(region), area_(area), origin_(stage.frame().x, stage.frame().y),
      scale_(stage.frame().width / area.width, stage.frame().height / area.height) {}

ScreenPoint View::toFilm(const ScreenPoint& point) const {
    return {origin_.x + (point.x - area_.x) * scale_.x, origin_.y + (point.y - area_.y) * scale_.y};
}

PicturePart View::partOf(int width, int height) const {
    const double x = width / region_.width;
    const double y = height / region_.height;
    return {(area_.x - region_.x) * x, (area_.y - region_.y) * y, area_.width * x, area_.height * y};
}

} // namespace Render
