#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "opacity" (float, narrowed from 64 bits) and "timestamp" (float, seconds) for every change of the cursor's
/// opacity.
class CursorOpacityMetaDataParser final : public KindMetaDataParser<CursorOpacityKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> cursorOpacityData() const { return entries(); }
    void setCursorOpacityData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
