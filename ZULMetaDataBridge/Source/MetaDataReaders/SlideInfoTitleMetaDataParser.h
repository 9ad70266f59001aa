#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "title" (text) and "timestamp" (float, seconds) for every slide.
class SlideInfoTitleMetaDataParser final : public KindMetaDataParser<SlideInfoTitleKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> slideTitleData() const { return entries(); }
    void setSlideTitleData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
