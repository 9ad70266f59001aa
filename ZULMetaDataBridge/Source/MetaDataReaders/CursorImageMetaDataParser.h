#pragma once

#include "../../../Platform/Image.h"
#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the appearances of the cursor. Each entry has "image", "id" (std::int64_t), "hotspotOffsetX", "hotspotOffsetY"
/// (std::int32_t, pixels) and "timestamp" (float, seconds). "image" is a `std::shared_ptr<const Image>`, or the text
/// "nil" if an earlier image with the same "id" shows again or the image cannot be decoded.
class CursorImageMetaDataParser final : public KindMetaDataParser<CursorImageKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> cursorImageData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setCursorImageData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
