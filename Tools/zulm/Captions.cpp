#include "Tools/zulm/Captions.h"

#include <algorithm>
#include <cmath>

namespace Zulm {

namespace {

constexpr double s_lastDuration = 5; ///< seconds of the last title if the length of the movie is not known
constexpr double s_endOfTime = 1e9;  ///< seconds: 30 years, within what every format can hold

} // namespace

double endOfCaptions(std::optional<double> duration) {
    return std::min(duration.value_or(s_endOfTime), s_endOfTime);
}

std::vector<PlacedCaption> placed(std::vector<Caption> captions, double unitsPerSecond,
                                  std::optional<double> duration) {
    std::stable_sort(captions.begin(), captions.end(),
                     [](const Caption& left, const Caption& right) { return left.start < right.start; });
    const double lastEnd = std::floor(endOfCaptions(duration) * unitsPerSecond);
    const auto unitsAt = [&](double seconds) {
        return std::llround(std::min(std::round(seconds * unitsPerSecond), lastEnd));
    };
    std::vector<PlacedCaption> result;
    for (const Caption& caption : captions) {
        const double end = std::isfinite(caption.end) ? caption.end : duration.value_or(caption.start + s_lastDuration);
        const std::int64_t start = std::min(unitsAt(caption.start), std::max(std::llround(lastEnd) - 1, 0LL));
        const PlacedCaption next{start, unitsAt(end), caption.text};
        if (!result.empty() && result.back().start == next.start) {
            result.back().text += " \xc2\xb7 " + next.text; // middle dot
            result.back().end = std::max(result.back().end, next.end);
            continue;
        }
        if (!result.empty())
            result.back().end = std::min(result.back().end, next.start);
        result.push_back(next);
    }
    for (PlacedCaption& caption : result)
        caption.end = std::max(caption.end, caption.start + 1);
    return result;
}

} // namespace Zulm
