#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "title" (text) and "timestamp" (float, seconds) for every title of the window on top.
class TopmostWindowTitleMetaDataParser final : public KindMetaDataParser<TopmostWindowTitleKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> windowTitleData() const { return entries(); }
    void setWindowTitleData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
