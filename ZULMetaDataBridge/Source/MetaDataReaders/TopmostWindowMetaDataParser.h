#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the places of the window on top. Each entry has "x", "y", "width", "height" (std::int32_t, pixels) and
/// "timestamp" (float, seconds).
class TopmostWindowMetaDataParser final : public KindMetaDataParser<TopmostWindowKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> topmostWindowData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setTopmostWindowData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
