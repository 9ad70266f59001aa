#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "comment" (text) and "timestamp" (float, seconds) for every slide.
class SlideInfoCommentMetaDataParser final : public KindMetaDataParser<SlideInfoCommentKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> slideCommentData() const { return entries(); }
    void setSlideCommentData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
