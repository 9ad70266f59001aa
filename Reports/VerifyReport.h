#pragma once

#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"

#include <nlohmann/json.hpp>

#include <string>

namespace Zulm {

/// The file's object of `zulm verify --json`.
nlohmann::ordered_json verifyDocument(const std::string& name, const ZULMetaData::ValidationReport& report);

} // namespace Zulm
