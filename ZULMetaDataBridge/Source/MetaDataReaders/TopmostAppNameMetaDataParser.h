#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the applications that came to the front. Each entry has "name" (text) and "timestamp" (float, seconds).
class TopmostAppNameMetaDataParser final : public KindMetaDataParser<TopmostAppNameKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> appNameData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setAppNameData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
