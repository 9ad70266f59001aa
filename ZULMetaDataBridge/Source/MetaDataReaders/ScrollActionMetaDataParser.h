#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads scroll deltas. Each entry has "x", "y" (std::int32_t, pixels) and "timestamp" (float, seconds).
class ScrollActionMetaDataParser final : public KindMetaDataParser<ScrollActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> scrollActionData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setScrollActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
