#pragma once

// Copies a stream without what nobody else should see.
//
//     Redaction redaction;
//     redaction.clearsKeys = true;
//     std::ofstream copy("keyboardAction.dat", std::ios::binary);
//     redactStream(StreamSource::file("private/keyboardAction.dat").open(), redaction, copy);

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataUUIDs.h"
#include "StreamSource.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <ostream>
#include <set>
#include <string>

namespace ZULMetaData {

/// What takes the place of a hidden text: an ellipsis, whatever its length was.
inline constexpr const char* s_hiddenText = "\xe2\x80\xa6";

/// A part of the recording.
struct TimeRange {
    double from = 0; ///< seconds; both ends belong to it
    double to = 0;   ///< seconds
};

/// What a copy must lack.
struct Redaction {
    std::set<uuid> removedKinds; ///< streams of these are left out as a whole

    /// Every keystroke becomes character code 0 without modifier flags, which tell something of the text, too. Their
    /// times stay.
    bool clearsKeys = false;

    /// Whether a title, text, comment or name becomes `s_hiddenText`. Gets the stored bytes.
    std::function<bool(const std::string&)> hidesText;

    /// Entries with a time in it are removed, and those whose time is not a number.
    std::optional<TimeRange> removedTimes;
};

/// What a copy lacks.
struct RedactedStream {
    /// Why it is not in the copy.
    enum Removal : std::int32_t {
        Kept, ///< it is in the copy
        Asked,
        Undecodable, ///< of a kind or version that cannot be looked into, though something in it might have to go
        Headless,    ///< too short for a stream's header
    };

    MetaDataHeader header;            ///< of the original; without a kind where it has none
    Removal removal = Kept;           ///< why the stream is not in the copy
    std::uint64_t entries = 0;        ///< in the copy
    std::uint64_t entriesRemoved = 0; ///< for their times
    std::uint64_t entriesChanged = 0; ///< of those in the copy
    std::uint64_t bytesLeftOut = 0;   ///< behind the last entry that could be read, which nobody could check
};

/// Appends the copy to `out`, or nothing where the stream is removed. Failures of `out` show in its state alone.
ZULMETADATA_API RedactedStream redactStream(const StreamSource::Bytes& stream, const Redaction& redaction,
                                            std::ostream& out);

} // namespace ZULMetaData
