#pragma once

// The readers of edit lists of other programs. Each throws `Error` for what its format says and an edit list cannot.

#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/EditLists/Json.h"

#include <string>
#include <string_view>

namespace ZULMetaData::detail {

EditList readConcat(std::string_view text, const std::string& file, const EditListOptions& options);
EditList readCMX3600(std::string_view text, const std::string& file, const EditListOptions& options);
EditList readCutTable(std::string_view text, const std::string& file, const EditListOptions& options);
EditList readLosslessCut(const JsonValue& document, const std::string& file, const EditListOptions& options);
EditList readAutoEditor(const JsonValue& document, const std::string& file, const EditListOptions& options);
EditList readOpenTimeline(const JsonValue& document, const std::string& file);
EditList readMovieEditList(const ByteSource& movie, const std::string& file, const EditListOptions& options);

/// Returns what a text seems to be by its first lines: `Concat`, `CMX3600`, `CutTable`, or `Recognized` if it is none
/// of them.
EditListFormat recognizedText(std::string_view text);

/// Returns whether a line is an event, a statement or a comment that only a CMX 3600 list begins with.
bool beginsCMX3600(std::string_view line);

/// Returns whether a line has two times at its beginning, each of which may be left out.
bool beginsCutTable(std::string_view line);

/// Returns whether a line is a statement that a list for the concat demuxer begins with.
bool beginsConcat(std::string_view line);

} // namespace ZULMetaData::detail
