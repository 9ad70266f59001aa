#pragma once

// What validating a file has found, for a person and for a program.

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <nlohmann/json.hpp>

#include <string>

namespace Zulm {

/// "damage" or "notice".
const char* severityText(ZULMetaData::Severity severity);

/// "cursorLocation at offset 56: the last entry has 4 of 16 bytes [torn-entry]"
std::string findingText(const ZULMetaData::Finding& finding);

/// "at offset 56: the last entry has 4 of 16 bytes (2 more)": the first damage in the stream, and how much else. Empty
/// if there is none; for a stream of which nothing is readable, says that it could not be examined.
std::string damageIn(const ZULMetaData::StreamReport& stream);

/// {"code": ..., "severity": "damage" or "notice", "place": ..., "offset": ..., "message": ...}
nlohmann::ordered_json findingDocument(const ZULMetaData::Finding& finding);

/// The file's object of `zulm verify --json`.
nlohmann::ordered_json verifyDocument(const std::string& name, const ZULMetaData::ValidationReport& report);

} // namespace Zulm
