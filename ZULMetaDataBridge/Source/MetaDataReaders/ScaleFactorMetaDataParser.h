#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the scale factor of the display. The entry has "scaleFactor" (std::int32_t) and "timestamp" (float, seconds).
class ScaleFactorMetaDataParser final : public KindMetaDataParser<ScaleFactorKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> scaleFactorData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setScaleFactorData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
