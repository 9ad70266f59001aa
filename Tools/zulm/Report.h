#pragma once

// The JSON documents of the commands that report.

#include <nlohmann/json.hpp>

#include <optional>
#include <string>

namespace Zulm {

/// {"schema": "zulm.COMMAND", "schema_version": 1, "tool_version": ..., "files": [...]} on standard output.
void printReport(const std::string& command, nlohmann::ordered_json files);

/// The same without its files, for a command that prints them as they come.
nlohmann::ordered_json reportHeader(const std::string& command);

/// On several lines, without the end of the last one. Bytes that are no text show as U+FFFD.
std::string reportText(const nlohmann::ordered_json& document);

/// What is reported of a file begins with: {"path": ...}, and its bytes as "path_base64" where they are not UTF-8.
nlohmann::ordered_json fileHeader(const std::string& path);

/// A number as it is, "Infinity", "-Infinity" or "NaN" where it is none, null where there is nothing.
nlohmann::ordered_json numberDocument(std::optional<double> number);

} // namespace Zulm
