#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the titles of the window on top. Each entry has "title" (text) and "timestamp" (float, seconds).
class TopmostWindowTitleMetaDataParser final : public KindMetaDataParser<TopmostWindowTitleKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> windowTitleData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setWindowTitleData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
