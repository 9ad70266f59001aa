#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the opacity of the cursor. Each entry has "opacity" (float, narrowed from 64 bits) and "timestamp" (float,
/// seconds).
class CursorOpacityMetaDataParser final : public KindMetaDataParser<CursorOpacityKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> cursorOpacityData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setCursorOpacityData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
