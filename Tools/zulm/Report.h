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

/// A document as text, without the end of its last line: in one line, and in several ones. Bytes that are no text show
/// as U+FFFD, and what cannot be seen as an escape of JSON.
std::string jsonLine(const nlohmann::ordered_json& document);
std::string reportText(const nlohmann::ordered_json& document);

/// What is reported of a file begins with: {"path": ...}, and its bytes as "path_base64" where they are not UTF-8.
nlohmann::ordered_json fileHeader(const std::string& path);

/// Adds a text, and its bytes as "KEY_base64" if they are not UTF-8.
void addText(nlohmann::ordered_json& document, const std::string& key, const std::string& bytes);

/// A number as it is, "Infinity", "-Infinity" or "NaN" where it is none, null where there is nothing.
nlohmann::ordered_json numberDocument(std::optional<double> number);

} // namespace Zulm
