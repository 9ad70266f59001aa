#include "ZULMetaDataSession/Insights/Idle.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <span>

namespace ZULMetaData {

namespace {

/// Returns the times at which a button went down or up.
std::vector<double> pressesAndReleasesOf(const Track<CursorActionKind>& actions) {
    std::vector<double> times;
    for (std::size_t i = 0; i < actions.size(); ++i)
        if (actions.values()[i].button)
            times.push_back(actions.times()[i]);
    return times;
}

std::vector<double> mergedTimes(std::span<const double> left, std::span<const double> right) {
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
    const std::vector<double> input =
        mergedTimes(mergedTimes(keys.times(), scrolling.times()), pressesAndReleasesOf(actions));
    std::vector<IdleSpan> spans;
    double last = 0;
    const auto endAt = [&](double time) {
        const double end = std::min(time, duration);
        if (end > last && end - last >= options.least)
            spans.push_back({last, end});
        last = std::max(last, end);
    };
    auto next = input.begin();
    for (std::size_t i = 0; i < positions.size(); ++i) {
        if (i > 0 && positions.values()[i] == positions.values()[i - 1])
            continue; // the cursor did not move
        for (; next != input.end() && *next <= positions.times()[i]; ++next)
            endAt(*next);
        endAt(positions.times()[i]);
    }
    std::for_each(next, input.end(), endAt);
    endAt(duration);
    return spans;
}

} // namespace ZULMetaData
