#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the comments on slides. Each entry has "comment" (text) and "timestamp" (float, seconds).
class SlideInfoCommentMetaDataParser final : public KindMetaDataParser<SlideInfoCommentKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> slideCommentData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setSlideCommentData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
