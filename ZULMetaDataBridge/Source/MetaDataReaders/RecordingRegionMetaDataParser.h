#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "x", "y", "width", "height" (std::int32_t, pixels) and "timestamp" (float, seconds) for the recorded region.
class RecordingRegionMetaDataParser final : public KindMetaDataParser<RecordingRegionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> recordingRegionData() const { return entries(); }
    void setRecordingRegionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
