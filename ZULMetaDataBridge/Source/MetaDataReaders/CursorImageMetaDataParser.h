#pragma once

#include "../../../Platform/Image.h"
#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "image" (an `Image`, or the text "nil" where a cursor that came before shows again: look its "id" up there),
/// "id" (std::int64_t), "hotspotOffsetX", "hotspotOffsetY" (std::int32_t, pixels) and "timestamp" (float, seconds)
/// for every appearance of the cursor.
class CursorImageMetaDataParser final : public KindMetaDataParser<CursorImageKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> cursorImageData() const { return entries(); }
    void setCursorImageData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
