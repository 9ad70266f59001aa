#pragma once

// What a redaction does, as text and as JSON.

#include "Reports/JsonWriter.h"
#include "ZULMetaDataBridge/Source/RecordingRedaction.h"

#include <functional>
#include <string>

namespace Zulm {

/// A redaction of one file.
struct RedactReport {
    std::string file;
    std::string output; ///< empty if nothing is written
    ZULMetaData::RedactedRecording recording;
};

/// Calls its argument with each entry that is removed, changed or added. Empty if the entries are not to be shown.
using VisitEntries = std::function<void(const std::function<void(const ZULMetaData::RedactedEntry&)>&)>;

/// Writes to standard output, entry by entry.
void printRedaction(const RedactReport& report, const VisitEntries& visitEntries);

/// Writes the object of the file, entry by entry.
void writeRedaction(JsonWriter& writer, const RedactReport& report, const VisitEntries& visitEntries);

/// Why a stream is not in the copy, or "kept".
const char* removalText(ZULMetaData::RedactedStream::Removal removal);

} // namespace Zulm
