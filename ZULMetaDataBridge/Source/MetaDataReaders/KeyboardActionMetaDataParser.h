#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "characterCode" (std::int32_t), "characterString" (bytes, perhaps not UTF-8), "eventFlagsCode" (std::int32_t),
/// "eventFlagsString" (text) and "timestamp" (float, seconds) for every key.
class KeyboardActionMetaDataParser final : public KindMetaDataParser<KeyboardActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> keyboardActionData() const { return entries(); }
    void setKeyboardActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
