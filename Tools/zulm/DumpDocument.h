#pragma once

// What `zulm dump --format json` prints, written as the entries are read: an hour of recording does not have to fit
// into memory as a document.

#include "Tools/zulm/Recording.h"

#include <nlohmann/json.hpp>

#include <functional>
#include <string_view>
#include <utility>
#include <vector>

namespace Zulm {

using TextSink = std::function<void(std::string_view)>;

/// What is between the brackets of an array that is written as its elements come.
class OpenArray {
public:
    explicit OpenArray(TextSink sink) : sink_(std::move(sink)) {}

    /// Writes `document` up to the end of its last member, an empty array.
    void begin(const nlohmann::ordered_json& document);
    void add(const nlohmann::ordered_json& element);

    /// In front of an element that is written otherwise.
    void separate();
    void end() { sink_("]}"); }

private:
    TextSink sink_;
    bool isEmpty_ = true;
};

class DumpDocument {
public:
    DumpDocument(const Recording& recording, const TextSink& sink);

    /// A stream that is not decoded has no entries.
    void beginStream(const StreamInfo& stream, bool isDecoded);
    void add(const nlohmann::ordered_json& entry) { entries_.add(entry); }
    void endStream();
    void end();

private:
    TextSink sink_;
    OpenArray files_;
    OpenArray streams_;
    OpenArray entries_;
    bool isDecoded_ = false;
};

/// All of it, with every entry of the streams of these types.
void writeDump(Recording& recording, const std::vector<ZULMetaData::uuid>& types, const TextSink& sink);

} // namespace Zulm
