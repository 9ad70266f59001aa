#include "ZULMetaDataSession/TimeIndex.h"

#include <cmath>
#include <limits>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_entriesInASlot = 8; // their times fill a line of the processor's cache
constexpr std::size_t s_fewEntries = 16;    // are counted faster than searched

} // namespace

TimeIndex::TimeIndex(std::span<const double> times) : times_(times) {
    if (times.empty())
        return;
    firstTime_ = times.front();
    lastTime_ = times.back();
    const std::size_t slots = times.size() / s_entriesInASlot;
    slotsPerSecond_ = static_cast<double>(slots) / (lastTime_ - firstTime_);
    const bool isUsable = std::isfinite(slotsPerSecond_) && slotsPerSecond_ > 0;
    if (!isUsable || times.size() > std::numeric_limits<std::uint32_t>::max())
        return;
    starts_.reserve(slots + 2); // the last entry has a slot of its own
    for (std::size_t entry = 0; entry < times.size(); ++entry)
        for (const std::size_t slot = numberOfSlot(times[entry]); starts_.size() <= slot;)
            starts_.push_back(static_cast<std::uint32_t>(entry));
    starts_.push_back(static_cast<std::uint32_t>(times.size()));
}

TimeIndex::Slot TimeIndex::slotOf(double time) const {
    if (times_.empty() || !(time >= firstTime_))
        return {0, 0};
    if (time >= lastTime_)
        return {times_.size(), 0};
    if (starts_.empty())
        return {0, times_.size()};
    const std::size_t number = numberOfSlot(time); // a later time is never in an earlier slot
    const std::size_t first = starts_[number];
    const std::size_t count = starts_[number + 1] - first;
    __builtin_prefetch(times_.data() + first + count / 2);
    return {first, count};
}

std::size_t TimeIndex::countUntil(Slot slot, double time) const {
    auto [first, count] = slot;
    while (count > s_fewEntries) {
        const std::size_t half = count / 2;
        const bool isUntil = times_[first + half] <= time;
        first = isUntil ? first + half + 1 : first;
        count = isUntil ? count - half - 1 : half;
    }
    std::size_t until = 0;
    for (const double entry : times_.subspan(first, count)) // to the end: no branch depends on a time
        until += entry <= time ? 1 : 0;
    return first + until;
}

} // namespace ZULMetaData::detail
