#pragma once

#include "KindMetaDataParser.h"

namespace ZULMetaData {

/// "processorCount", "activeProcessorCount", "osVersion", "ram" (texts such as RAM:16384MB, prefix included) and
/// "timestamp" (float, seconds) for the machine.
class SystemDataMetaDataParser final : public KindMetaDataParser<SystemDataKind> {
public:
    using KindMetaDataParser::KindMetaDataParser;

    /// What the last `read` gave; null before.
    std::shared_ptr<EntryList> systemDataMetaData() const { return entries(); }
    void setSystemDataMetaData(std::shared_ptr<EntryList> list) { setEntries(std::move(list)); } ///< until `read`
};

} // namespace ZULMetaData
