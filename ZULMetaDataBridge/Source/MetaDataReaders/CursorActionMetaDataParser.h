#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "action" (text), "rawActionValue" (std::int32_t) and "timestamp" (float, seconds) for every button that was
/// pressed or released.
class CursorActionMetaDataParser final : public KindMetaDataParser<CursorActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> cursorActionData() const { return entries(); }
    void setCursorActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
