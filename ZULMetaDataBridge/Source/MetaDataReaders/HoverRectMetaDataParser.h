#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the rectangles that the cursor hovered over. Each entry has "x", "y", "width", "height" (std::int32_t, pixels)
/// and "timestamp" (float, seconds).
class HoverRectMetaDataParser final : public KindMetaDataParser<HoverRectKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> hoverRectData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setHoverRectData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
