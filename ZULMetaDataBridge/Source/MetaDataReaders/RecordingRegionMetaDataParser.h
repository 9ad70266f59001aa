#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the recorded region. The entry has "x", "y", "width", "height" (std::int32_t, pixels) and "timestamp" (float,
/// seconds).
class RecordingRegionMetaDataParser final : public KindMetaDataParser<RecordingRegionKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> recordingRegionData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setRecordingRegionData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
