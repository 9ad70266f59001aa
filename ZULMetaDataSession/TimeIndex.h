#pragma once

// Finds a time among many in about the time that one look into memory takes.

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace ZULMetaData::detail {

/// Divides the time from the first entry to the last into equal slots, each with a few entries, and remembers which
/// entries are in each slot. Recorders write at a steady pace, so the slots are about equally full.
class TimeIndex {
public:
    /// Entries that follow one another.
    struct Slot {
        std::size_t first = 0;
        std::size_t count = 0;
    };

    TimeIndex() = default;

    /// The times ascend and are finite, and outlive the index.
    explicit TimeIndex(std::span<const double> times);

    std::span<const double> times() const { return times_; }

    /// Returns entries with these properties: all before them have a time at or before `time`, and all after them a
    /// later one. Begins to load their times. Other indices can do the same meanwhile.
    Slot slotOf(double time) const;

    /// Returns how many of all entries have a time at or before `time`. `slot` is the one of this time.
    std::size_t countUntil(Slot slot, double time) const;

private:
    std::size_t numberOfSlot(double time) const {
        return static_cast<std::size_t>((time - firstTime_) * slotsPerSecond_);
    }

    std::span<const double> times_;
    double firstTime_ = 0;
    double lastTime_ = 0;
    double slotsPerSecond_ = 0;
    std::vector<std::uint32_t> starts_; ///< the first entry of each slot, and the end; empty if there are no slots
};

} // namespace ZULMetaData::detail
