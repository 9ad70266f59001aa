#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the positions of the cursor. Each entry has "x", "y" (std::int32_t, pixels) and "timestamp" (float, seconds).
class CursorLocationMetaDataParser final : public KindMetaDataParser<CursorLocationKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> cursorLocationData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setCursorLocationData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
