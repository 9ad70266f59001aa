#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "x", "y", "width", "height" (std::int32_t, pixels) and "timestamp" (float, seconds) for every rectangle that the
/// cursor hovered over.
class HoverRectMetaDataParser final : public KindMetaDataParser<HoverRectKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> hoverRectData() const { return entries(); }
    void setHoverRectData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
