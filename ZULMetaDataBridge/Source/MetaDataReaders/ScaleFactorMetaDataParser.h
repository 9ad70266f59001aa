#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "scaleFactor" (std::int32_t) and "timestamp" (float, seconds) for the display's scale factor.
class ScaleFactorMetaDataParser final : public KindMetaDataParser<ScaleFactorKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> scaleFactorData() const { return entries(); }
    void setScaleFactorData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
