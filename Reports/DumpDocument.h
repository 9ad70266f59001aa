#pragma once

// What `zulm dump --format json` prints, written as the entries are read: an hour of recording does not have to fit
// into memory as a document.

#include "Reports/JsonWriter.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <vector>

namespace Zulm {

class DumpDocument {
public:
    /// `writer` has the "files" of a report open and must outlive this.
    explicit DumpDocument(JsonWriter& writer) : writer_(writer) {}

    void beginFile(const ZULMetaData::RecordingFile& recording);

    /// A stream that is not decoded has no entries.
    void beginStream(const ZULMetaData::StreamReport& stream, bool isDecoded);
    void add(const nlohmann::ordered_json& entry) { writer_.element(entry); }
    void endStream();
    void endFile();

private:
    JsonWriter& writer_;
    bool isDecoded_ = false;
};

/// The whole document of one file, with every entry of these of its streams.
void writeDump(ZULMetaData::RecordingFile& recording, const std::vector<ZULMetaData::StreamReport>& streams,
               const TextSink& sink);

} // namespace Zulm
