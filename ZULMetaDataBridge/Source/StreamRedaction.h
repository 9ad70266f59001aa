#pragma once

// Copies a stream without what nobody else should see.
//
//     Redaction redaction;
//     redaction.clearsKeys = true;
//     std::ofstream copy("keyboardAction.dat", std::ios::binary);
//     redactStream(StreamSource::file("private/keyboardAction.dat").open(), redaction, copy);

#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ByteSource.h"
#include "../../ZULMetaData/ZULMMetaDataUUIDs.h"

#include <cstdint>
#include <optional>
#include <ostream>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// The text that replaces every hidden text: an ellipsis, whatever the length of the hidden text was.
inline constexpr const char* s_hiddenText = "\xe2\x80\xa6";

/// A part of the recording.
struct TimeRange {
    double from = 0; ///< seconds; both ends belong to it
    double to = 0;   ///< seconds
};

/// What happens to one entry of a stream.
struct RedactedEntry {
    /// How the copy differs from the original in this entry.
    enum Action : std::int32_t {
        Removed, ///< the copy lacks it
        Changed, ///< the copy has another entry in its place
        Added,   ///< the copy needs it because of entries that were removed before it
    };

    Action action = Removed;   ///< what is done
    MetaDataHeader header;     ///< of the original stream
    double time = 0;           ///< seconds
    std::string_view original; ///< the bytes of the original entry; empty for an entry that is added
};

/// What a copy must lack.
///
/// Removing the entries of a time needs more than leaving them out:
/// - A text that held inside a removed range is hidden wherever it is recorded, even if it was recorded before the
///   range: it was in force inside. A hidden text also takes the place of the texts that a range removes if another
///   text would seem to hold on inside the range.
/// - The last value inside a range is still in force after it. An entry with this value is added directly after the
///   range unless another entry takes over. Keystrokes and scroll deltas are events and are not carried over.
/// - The first entry of a cursor image after the range gets the picture if the range removed it.
/// - The recorded region, the scale factor and the system data describe the whole recording and stay.
struct Redaction {
    std::set<uuid> removedKinds; ///< streams of these kinds are left out as a whole
    std::set<uuid> keptKinds;    ///< if not empty, the streams of all other kinds are left out too

    /// Every keystroke becomes character code 0 without modifier flags, because the flags reveal something of the text
    /// too. The times of the keystrokes stay.
    bool clearsKeys = false;

    /// Returns whether a title, text, comment or name becomes `s_hiddenText`. Receives the stored bytes.
    Callback<bool(const std::string&)> hidesText;

    /// Entries with a time in one of these ranges are removed, and entries whose time is not a number.
    std::vector<TimeRange> removedTimes;

    /// Called for every entry that is removed, changed or added, in the order of the stream. May be empty.
    Callback<void(const RedactedEntry&)> onEntry;
};

/// What a copy lacks.
struct RedactedStream {
    /// Why the stream is not in the copy.
    enum Removal : std::int32_t {
        Kept,        ///< it is in the copy
        Asked,       ///< its kind is to be left out
        Undecodable, ///< its kind or version cannot be decoded, though something in it might have to go
        Headless,    ///< it is too short for a stream's header
    };

    MetaDataHeader header;            ///< of the original; without a kind if it has none
    Removal removal = Kept;           ///< `Kept` for a stream that was copied
    std::uint64_t entries = 0;        ///< in the copy
    std::uint64_t entriesRemoved = 0; ///< because of their times
    std::uint64_t entriesChanged = 0; ///< of the entries in the copy
    std::uint64_t entriesAdded = 0;   ///< of the entries in the copy
    std::uint64_t bytesLeftOut = 0;   ///< after the last entry that could be read, which nobody could check
};

/// The texts that go with a redaction, as they are stored.
struct RedactedTexts {
    std::set<std::string> hidden;  ///< hidden by `hidesText`, or in force inside a removed range
    std::set<std::string> removed; ///< left out with the streams of their kinds
};

/// Adds the texts of one stream that go with the redaction. Empty texts are not secrets and are left out. A caller
/// that redacts several streams collects the texts of all of them first, and hides each text in every stream.
ZULMETADATA_API void collectRedactedTexts(const ByteSource& stream, const Redaction& redaction, RedactedTexts& texts);

/// Appends the copy to `out`, or nothing if the stream is removed. Failures of `out` show in its state alone.
ZULMETADATA_API RedactedStream redactStream(const ByteSource& stream, const Redaction& redaction, std::ostream& out);

} // namespace ZULMetaData
