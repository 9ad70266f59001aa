#pragma once

// The JSON documents of the commands that report.

#include <nlohmann/json.hpp>

#include <string>

namespace Zulm {

/// {"schema": "zulm.COMMAND", "schema_version": 1, "tool_version": ..., "files": [...]} on standard output.
void printReport(const std::string& command, nlohmann::ordered_json files);

} // namespace Zulm
