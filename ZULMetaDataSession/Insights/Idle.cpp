#include "ZULMetaDataSession/Insights/Idle.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <span>

namespace ZULMetaData {

namespace {

/// Returns the times at which the cursor was somewhere else than before.
std::vector<double> movesOf(const Track<CursorLocationKind>& positions) {
    std::vector<double> times;
    for (std::size_t i = 0; i < positions.size(); ++i)
        if (i == 0 || positions.values()[i] != positions.values()[i - 1])
            times.push_back(positions.times()[i]);
    return times;
}

/// Returns the times at which a button went down or up.
std::vector<double> pressesAndReleasesOf(const Track<CursorActionKind>& actions) {
    std::vector<double> times;
    for (std::size_t i = 0; i < actions.size(); ++i)
        if (actions.values()[i].button)
            times.push_back(actions.times()[i]);
    return times;
}

std::vector<double> merged(std::span<const double> left, std::span<const double> right) {
    std::vector<double> times;
    times.reserve(left.size() + right.size());
    std::merge(left.begin(), left.end(), right.begin(), right.end(), std::back_inserter(times));
    return times;
}

} // namespace

std::vector<IdleSpan> idleSpansOf(const Track<CursorLocationKind>& positions, const Track<CursorActionKind>& actions,
                                  const Track<KeyboardActionKind>& keys, const Track<ScrollActionKind>& scrolling,
                                  double duration, const IdleOptions& options) {
    if (positions.empty() && actions.empty() && keys.empty() && scrolling.empty())
        return {};
    const std::vector<double> input = merged(merged(keys.times(), scrolling.times()), pressesAndReleasesOf(actions));
    std::vector<IdleSpan> spans;
    double last = 0;
    const auto endAt = [&](double time) {
        if (time > last && time - last >= options.least)
            spans.push_back({last, time});
        last = std::max(last, time);
    };
    for (const double time : merged(movesOf(positions), input))
        endAt(std::min(time, duration));
    endAt(duration);
    return spans;
}

} // namespace ZULMetaData
