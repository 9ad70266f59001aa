#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the buttons that were pressed or released. Each entry has "action" (text), "rawActionValue" (std::int32_t) and
/// "timestamp" (float, seconds).
class CursorActionMetaDataParser final : public KindMetaDataParser<CursorActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> cursorActionData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setCursorActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
