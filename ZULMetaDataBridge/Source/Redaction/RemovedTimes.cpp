#include "ZULMetaDataBridge/Source/Redaction/RemovedTimes.h"

#include <algorithm>
#include <cmath>

namespace ZULMetaData::detail {

RemovedTimes::RemovedTimes(std::vector<TimeRange> ranges) {
    std::erase_if(ranges, [](const TimeRange& range) { return !(range.from <= range.to); });
    std::sort(ranges.begin(), ranges.end(), [](const auto& left, const auto& right) { return left.from < right.from; });
    for (const TimeRange& range : ranges) {
        if (!ranges_.empty() && range.from <= ranges_.back().to)
            ranges_.back().to = std::max(ranges_.back().to, range.to);
        else
            ranges_.push_back(range);
    }
}

bool RemovedTimes::isRemoved(double time) const {
    return !ranges_.empty() && (std::isnan(time) || rangeAt(time));
}

const TimeRange* RemovedTimes::rangeAt(double time) const {
    const auto found = std::find_if(ranges_.begin(), ranges_.end(),
                                    [time](const auto& range) { return range.from <= time && time <= range.to; });
    return found == ranges_.end() ? nullptr : &*found;
}

bool RemovedTimes::meets(double begin, double end) const {
    return std::any_of(ranges_.begin(), ranges_.end(),
                       [=](const auto& range) { return begin <= range.to && range.from < end; });
}

} // namespace ZULMetaData::detail
