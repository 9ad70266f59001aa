#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "x", "y" (std::int32_t, pixels) and "timestamp" (float, seconds) for every scroll.
class ScrollActionMetaDataParser final : public KindMetaDataParser<ScrollActionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> scrollActionData() const { return entries(); }
    void setScrollActionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
