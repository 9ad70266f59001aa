#pragma once

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

namespace ZULMetaData::detail {

/// Validates a container around its streams, and its streams: that every header makes sense and that the items fill the
/// file. Adds what it finds to `report`, except for findings of the ignored codes. Throws `std::runtime_error` if the
/// container of the report is unknown.
void walkContainer(const ByteSource& file, ValidationReport& report, const std::set<FindingCode>& ignored);

} // namespace ZULMetaData::detail
