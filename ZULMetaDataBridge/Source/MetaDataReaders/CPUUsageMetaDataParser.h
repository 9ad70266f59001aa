#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "cpuUsage" (float) and "timestamp" (float, seconds) for every measurement.
class CPUUsageMetaDataParser final : public KindMetaDataParser<CPUUsageKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> cpuUsageData() const { return entries(); }
    void setCpuUsageData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
