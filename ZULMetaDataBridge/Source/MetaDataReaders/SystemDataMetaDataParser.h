#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// Reads the facts about the machine. The entry has "processorCount", "activeProcessorCount", "osVersion", "ram" (texts
/// with a prefix, such as "RAM:16384MB") and "timestamp" (float, seconds).
class SystemDataMetaDataParser final : public KindMetaDataParser<SystemDataKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// Returns the list of the last `read`, or null before the first one.
    std::shared_ptr<EntryList> systemDataMetaData() const { return entries(); }
    /// Replaces that list until the next `read`.
    void setSystemDataMetaData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); }
};

} // namespace ZULMetaData
