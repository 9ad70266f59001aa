#pragma once

// The JSON documents of the commands that report.

#include "Reports/JsonWriter.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <nlohmann/json.hpp>

#include <optional>
#include <string>
#include <vector>

namespace Zulm {

/// What a command could not do, or could not find.
struct ReportedError {
    std::string path;    ///< of the file that it is about, as it was named
    std::string message; ///< a sentence without its full stop
};

/// Writes the beginning of {"schema": "zulm.COMMAND", "schema_version": 1, "tool_version": ..., "files": [...],
/// "errors": [...]}. What is written next are elements of "files".
void beginReport(JsonWriter& writer, const std::string& command);

/// Ends what is open, then writes the errors and the end of the document.
void endReport(JsonWriter& writer, const std::vector<ReportedError>& errors);

/// Returns what the report on a file begins with: {"path": ...}, and its bytes as "path_base64" if they are not UTF-8.
nlohmann::ordered_json fileHeader(const std::string& path);

/// Adds a text, and its bytes as "KEY_base64" if they are not UTF-8.
void addText(nlohmann::ordered_json& document, const std::string& key, const std::string& bytes);

/// Returns the name of a registered kind, or null.
nlohmann::ordered_json kindDocument(const ZULMetaData::uuid& type);

/// Returns a number as it is; "Infinity", "-Infinity" or "NaN" if it is not finite; null if there is none.
nlohmann::ordered_json numberDocument(std::optional<double> number);

} // namespace Zulm
