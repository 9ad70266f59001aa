#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "name" (text) and "timestamp" (float, seconds) for every application that came to the front.
class TopmostAppNameMetaDataParser final : public KindMetaDataParser<TopmostAppNameKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> appNameData() const { return entries(); }
    void setAppNameData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
