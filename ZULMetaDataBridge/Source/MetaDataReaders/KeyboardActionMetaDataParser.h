#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the keys that were pressed. Each entry has "characterCode" (std::int32_t), "characterString" (bytes, which may
/// be invalid UTF-8), "eventFlagsCode" (std::int32_t), "eventFlagsString" (text) and "timestamp" (float, seconds). The
/// codes are unsigned; convert them with `static_cast<std::uint32_t>`.
class KeyboardActionMetaDataParser final : public KindMetaDataParser<KeyboardActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> keyboardActionData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setKeyboardActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
