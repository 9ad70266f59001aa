#pragma once

// The times that a redaction removes, as ranges that neither overlap nor touch.

#include "ZULMetaDataBridge/Source/StreamRedaction.h"

#include <vector>

namespace ZULMetaData::detail {

class RemovedTimes {
public:
    explicit RemovedTimes(std::vector<TimeRange> ranges);

    /// Returns whether an entry of this time goes. An entry whose time is not a number may be of any time.
    bool isRemoved(double time) const;

    /// Returns the range that holds the time, or null.
    const TimeRange* rangeAt(double time) const;

    /// Returns whether a removed time is at or after `begin` and before `end`.
    bool meets(double begin, double end) const;

private:
    std::vector<TimeRange> ranges_;
};

} // namespace ZULMetaData::detail
