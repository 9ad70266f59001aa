#include "ZULMetaDataSession/Insights/Clicks.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <utility>

namespace ZULMetaData {

namespace {

/// Returns whether two positions are at most `distance` pixels apart. A position that is not known is everywhere.
bool areWithin(const std::optional<Point>& left, const std::optional<Point>& right, double distance) {
    if (!left || !right)
        return true;
    const double x = static_cast<double>(left->x) - right->x;
    const double y = static_cast<double>(left->y) - right->y;
    return x * x + y * y <= distance * distance;
}

/// Makes clicks of presses and releases.
class ClickCollector {
public:
    ClickCollector(const Track<CursorLocationKind>& positions, double duration, const ClickOptions& options)
        : positions_(positions), duration_(duration), options_(options) {}

    void press(double time, MouseButton button, Modifiers modifiers) {
        endWithoutRelease(button, time);
        Click click;
        click.start = time;
        click.button = button;
        click.modifiers = modifiers;
        click.position = positionAt(time);
        held_[static_cast<std::size_t>(button)] = clicks_.size();
        clicks_.push_back(click);
    }

    void release(double time, MouseButton button) {
        std::optional<std::size_t>& held = held_[static_cast<std::size_t>(button)];
        if (held)
            end(clicks_[*held], time);
        held.reset();
    }

    std::vector<Click> finish() {
        for (const MouseButton button : s_mouseButtons)
            endWithoutRelease(button, duration_);
        countMultiples();
        return std::move(clicks_);
    }

private:
    std::optional<Point> positionAt(double time) const {
        const Point* position = positions_.at(time);
        return position ? std::optional(*position) : std::nullopt;
    }

    void end(Click& click, double time) const {
        click.end = time;
        click.endPosition = positionAt(time);
        const auto moves = positions_.values().subspan(positions_.countUntil(click.start));
        const std::size_t count = positions_.countUntil(time) - positions_.countUntil(click.start);
        click.isDrag =
            std::any_of(moves.begin(), moves.begin() + static_cast<std::ptrdiff_t>(count), [&](const Point& position) {
                return !areWithin(click.position, position, options_.dragDistance);
            });
    }

    void endWithoutRelease(MouseButton button, double latest) {
        std::optional<std::size_t>& held = held_[static_cast<std::size_t>(button)];
        if (!held)
            return;
        Click& click = clicks_[*held];
        click.isReleased = false;
        end(click, std::max(click.start, std::min(latest, click.start + options_.unreleased)));
        held.reset();
    }

    void countMultiples() {
        for (std::size_t i = 1; i < clicks_.size(); ++i) {
            const Click& before = clicks_[i - 1];
            Click& click = clicks_[i];
            const bool follows = click.button == before.button && !before.isDrag &&
                                 click.start - before.start <= options_.multipleTime &&
                                 areWithin(before.position, click.position, options_.multipleDistance);
            if (follows)
                click.count = before.count + 1;
        }
    }

    const Track<CursorLocationKind>& positions_;
    double duration_;
    const ClickOptions& options_;
    std::vector<Click> clicks_;
    std::array<std::optional<std::size_t>, s_mouseButtons.size()> held_; ///< numbers of the clicks, by button
};

} // namespace

std::vector<Click> clicksOf(const Track<CursorActionKind>& actions, const Track<CursorLocationKind>& positions,
                            double duration, const ClickOptions& options) {
    ClickCollector collector(positions, duration, options);
    for (std::size_t i = 0; i < actions.size(); ++i) {
        const ButtonAction& action = actions.values()[i];
        if (!action.button)
            continue;
        if (action.isPress)
            collector.press(actions.times()[i], *action.button, action.modifiers);
        else
            collector.release(actions.times()[i], *action.button);
    }
    return collector.finish();
}

} // namespace ZULMetaData
