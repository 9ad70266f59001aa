#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the texts of slides. Each entry has "text" (text) and "timestamp" (float, seconds).
class SlideInfoTextMetaDataParser final : public KindMetaDataParser<SlideInfoTextKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> slideTextData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setSlideTextData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
