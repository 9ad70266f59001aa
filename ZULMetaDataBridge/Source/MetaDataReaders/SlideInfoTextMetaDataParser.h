#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "text" (text) and "timestamp" (float, seconds) for every slide.
class SlideInfoTextMetaDataParser final : public KindMetaDataParser<SlideInfoTextKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> slideTextData() const { return entries(); }
    void setSlideTextData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
