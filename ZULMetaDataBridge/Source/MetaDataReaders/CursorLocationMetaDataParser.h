#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "x", "y" (std::int32_t, pixels) and "timestamp" (float, seconds) for every recorded cursor position.
class CursorLocationMetaDataParser final : public KindMetaDataParser<CursorLocationKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> cursorLocationData() const { return entries(); }
    void setCursorLocationData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
