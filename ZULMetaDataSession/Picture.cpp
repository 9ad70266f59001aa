#include "ZULMetaDataSession/Picture.h"

namespace ZULMetaData {

namespace {

constexpr PictureSize s_usualSize{1280, 720};

ScreenRect asScreenRect(const Rect& rect) {
    return {double(rect.x), double(rect.y), double(rect.width), double(rect.height)};
}

} // namespace

ScreenPoint Picture::toPixels(const ScreenPoint& point) const {
    const ScreenPoint scale = pixelsPerUnit();
    return {(point.x - region_.x) * scale.x, (point.y - region_.y) * scale.y};
}

ScreenRect Picture::toPixels(const ScreenRect& rect) const {
    const ScreenPoint scale = pixelsPerUnit();
    const ScreenPoint corner = toPixels(ScreenPoint(rect.x, rect.y));
    return {corner.x, corner.y, rect.width * scale.x, rect.height * scale.y};
}

ScreenRect Picture::toPixels(const Rect& rect) const {
    return toPixels(asScreenRect(rect));
}

Picture RecordedArea::toPicture(const PictureSize& movie) const {
    const double pixels = scale > 0 ? scale : 1;
    if (region)
        return {asScreenRect(*region),
                movie.hasArea() ? movie : PictureSize{region->width * pixels, region->height * pixels}};
    const PictureSize size = movie.hasArea() ? movie : s_usualSize;
    return {{0, 0, size.width / pixels, size.height / pixels}, size};
}

} // namespace ZULMetaData
