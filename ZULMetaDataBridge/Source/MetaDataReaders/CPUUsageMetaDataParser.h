#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads how busy the machine was. Each entry has "cpuUsage" (float, in the unit of the recorder) and "timestamp"
/// (float, seconds).
class CPUUsageMetaDataParser final : public KindMetaDataParser<CPUUsageKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> cpuUsageData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setCpuUsageData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
