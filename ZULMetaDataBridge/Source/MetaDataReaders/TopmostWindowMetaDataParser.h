#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "x", "y", "width", "height" (std::int32_t, pixels) and "timestamp" (float, seconds) for every change of the
/// window on top.
class TopmostWindowMetaDataParser final : public KindMetaDataParser<TopmostWindowKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> topmostWindowData() const { return entries(); }
    void setTopmostWindowData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
