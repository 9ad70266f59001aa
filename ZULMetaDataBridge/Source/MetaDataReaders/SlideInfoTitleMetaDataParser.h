#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the titles of slides. Each entry has "title" (text) and "timestamp" (float, seconds).
class SlideInfoTitleMetaDataParser final : public KindMetaDataParser<SlideInfoTitleKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> slideTitleData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setSlideTitleData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
