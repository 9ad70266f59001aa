#include "ZULMetaDataSession/Insights/Zooms.h"

#include "ZULMetaDataSession/Insights/KeyCaptions.h"
#include "ZULMetaDataSession/Insights/ScreenGeometry.h"

#include <algorithm>
#include <cmath>
#include <optional>

namespace ZULMetaData {

namespace {

using detail::contains;
using detail::hasArea;
using detail::middleOf;

/// Returns the part of both, which has no area if they do not meet.
ScreenRect commonOf(const ScreenRect& left, const ScreenRect& right) {
    const double x = std::max(left.x, right.x);
    const double y = std::max(left.y, right.y);
    return {x, y, std::min(left.x + left.width, right.x + right.width) - x,
            std::min(left.y + left.height, right.y + right.height) - y};
}

/// What happens at one place.
struct Scene {
    double first = 0; ///< when it begins
    double last = 0;  ///< when it ends
    ScreenPoint centre;
    ZoomReason reason = ZoomReason::Clicks;
};

/// Collects clicks that are close to each other.
class ClickGroups {
public:
    ClickGroups(const ScreenRect& screen, const ZoomOptions& options) : screen_(screen), options_(options) {}

    void add(const Click& click) {
        const ScreenPoint point(*click.position);
        if (scenes_.empty() || click.start - lastPress_ > options_.groupTime || !isNear(point)) {
            scenes_.push_back({click.start, click.end, point, ZoomReason::Clicks});
            box_ = {point.x, point.y, 0, 0};
        }
        include(point);
        if (click.isDrag && click.endPosition && contains(screen_, *click.endPosition))
            include(*click.endPosition);
        scenes_.back().last = std::max(scenes_.back().last, click.end);
        scenes_.back().centre = middleOf(box_);
        lastPress_ = click.start;
    }

    const std::vector<Scene>& scenes() const { return scenes_; }

private:
    bool isNear(const ScreenPoint& point) const {
        const double x = (point.x - scenes_.back().centre.x) / screen_.width;
        const double y = (point.y - scenes_.back().centre.y) / screen_.height;
        return x * x + y * y <= options_.groupDistance * options_.groupDistance;
    }

    void include(const ScreenPoint& point) {
        const double right = std::max(box_.x + box_.width, point.x);
        const double bottom = std::max(box_.y + box_.height, point.y);
        box_.x = std::min(box_.x, point.x);
        box_.y = std::min(box_.y, point.y);
        box_.width = right - box_.x;
        box_.height = bottom - box_.y;
    }

    const ScreenRect& screen_;
    const ZoomOptions& options_;
    std::vector<Scene> scenes_;
    ScreenRect box_; ///< around the clicks of the last scene
    double lastPress_ = 0;
};

/// Returns the clicks that can be seen, in the order of their presses, without the one that stops the recording.
std::vector<const Click*> visibleClicks(const std::vector<Click>& clicks, const ScreenRect& screen, double duration,
                                        double stopTime) {
    std::vector<const Click*> sorted;
    for (const Click& click : clicks)
        if (std::isfinite(click.start))
            sorted.push_back(&click);
    std::stable_sort(sorted.begin(), sorted.end(),
                     [](const Click* left, const Click* right) { return left->start < right->start; });
    if (!sorted.empty() && duration - sorted.back()->start <= stopTime)
        sorted.pop_back();
    std::erase_if(sorted, [&](const Click* click) {
        return click->start < 0 || click->start >= duration || !click->position || !contains(screen, *click->position);
    });
    return sorted;
}

/// Finds where somebody types.
class TypingFinder {
public:
    TypingFinder(const Track<CursorLocationKind>& positions, const Track<TopmostWindowKind>& windows,
                 const ScreenRect& screen)
        : positions_(positions), windows_(windows), screen_(screen) {}

    std::vector<Scene> find(const Track<KeyboardActionKind>& keys, double duration, const ZoomOptions& options) const {
        std::vector<Scene> scenes;
        Scene scene;
        std::size_t count = 0;
        const auto endScene = [&] {
            const std::optional<ScreenPoint> place = placeAt(scene.first);
            if (count > 0 && count >= options.typingKeys && place)
                scenes.push_back({scene.first, scene.last, *place, ZoomReason::Typing});
            count = 0;
        };
        const auto inRecording = keys.between(0, duration);
        for (std::size_t i = 0; i < inRecording.size(); ++i) {
            if (!typesCharacter(inRecording.values[i]))
                continue;
            const double time = inRecording.times[i];
            if (count > 0 && time - scene.last > options.typingGap)
                endScene();
            if (count++ == 0)
                scene.first = time;
            scene.last = time;
        }
        endScene();
        return scenes;
    }

private:
    std::optional<ScreenPoint> placeAt(double time) const {
        const ScreenRect window = windowAt(time);
        const Point* cursor = positions_.at(time);
        if (cursor && contains(hasArea(window) ? window : screen_, *cursor))
            return *cursor;
        return hasArea(window) ? std::optional(middleOf(window)) : std::nullopt;
    }

    /// Returns the part of the window on top that can be seen, without area if there is none.
    ScreenRect windowAt(double time) const {
        const Rect* window = windows_.at(time);
        return window ? commonOf(detail::screenRect(*window), screen_) : ScreenRect();
    }

    const Track<CursorLocationKind>& positions_;
    const Track<TopmostWindowKind>& windows_;
    const ScreenRect& screen_;
};

/// Makes zooms of scenes that come in the order of their starts.
class ZoomMaker {
public:
    ZoomMaker(const ScreenRect& screen, double duration, const ZoomOptions& options)
        : screen_(screen), duration_(duration), options_(options), factor_(std::max(1.0, options.factor)) {}

    void add(const Scene& scene) {
        const double start = std::max(0.0, scene.first - options_.lead);
        const double end = std::min(duration_, std::max(scene.last + options_.hold, start + options_.least));
        if (end - start < options_.least)
            return;
        const ScreenRect area = zoomedArea(screen_, scene.centre, factor_);
        const ZoomPlace place{start, scene.first, middleOf(area), area, scene.reason};
        if (zooms_.empty() || start - zooms_.back().end >= std::max(0.0, options_.mergeGap))
            zooms_.push_back({start, end, factor_, {place}});
        else
            extend(zooms_.back(), place, end);
    }

    std::vector<Zoom> finish() { return std::move(zooms_); }

private:
    static void extend(Zoom& zoom, const ZoomPlace& place, double end) {
        zoom.end = std::max(zoom.end, end);
        ZoomPlace& last = zoom.places.back();
        const bool isSame = last.centre.x == place.centre.x && last.centre.y == place.centre.y;
        if (last.start == place.start)
            last = place;
        else if (!isSame)
            zoom.places.push_back(place);
    }

    const ScreenRect& screen_;
    double duration_;
    const ZoomOptions& options_;
    double factor_;
    std::vector<Zoom> zooms_;
};

/// Returns the start of a part of `length` around `middle` that lies within [start, start + whole].
double startWithin(double start, double whole, double middle, double length) {
    return std::max(start, std::min(middle - length / 2, start + whole - length));
}

} // namespace

const ZoomPlace& Zoom::placeAt(double time) const {
    const auto after = std::upper_bound(places.begin(), places.end(), time,
                                        [](double asked, const ZoomPlace& place) { return asked < place.start; });
    return after == places.begin() ? places.front() : *(after - 1);
}

std::vector<Zoom> zoomsOf(const std::vector<Click>& clicks, const Track<KeyboardActionKind>& keys,
                          const Track<CursorLocationKind>& positions, const Track<TopmostWindowKind>& windows,
                          const ScreenRect& screen, double duration, const ZoomOptions& options) {
    if (!hasArea(screen))
        return {};
    ClickGroups groups(screen, options);
    for (const Click* click : visibleClicks(clicks, screen, duration, options.stopTime))
        groups.add(*click);
    std::vector<Scene> scenes = TypingFinder(positions, windows, screen).find(keys, duration, options);
    scenes.insert(scenes.begin(), groups.scenes().begin(), groups.scenes().end());
    std::stable_sort(scenes.begin(), scenes.end(),
                     [](const Scene& left, const Scene& right) { return left.first < right.first; });
    ZoomMaker maker(screen, duration, options);
    for (const Scene& scene : scenes)
        maker.add(scene);
    return maker.finish();
}

ScreenRect zoomedArea(const ScreenRect& screen, const ScreenPoint& centre, double factor) {
    const double width = screen.width / std::max(1.0, factor);
    const double height = screen.height / std::max(1.0, factor);
    return {startWithin(screen.x, screen.width, centre.x, width),
            startWithin(screen.y, screen.height, centre.y, height), width, height};
}

} // namespace ZULMetaData
