#pragma once

// Properties of entries that depend on the kind of their stream, for code that handles streams of any kind.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "MetaDataKinds.h"

#include <cstdint>
#include <optional>
#include <string_view>

namespace ZULMetaData {

/// Returns true if the kind of the stream is registered, and its version is one of those that are registered.
ZULMETADATA_API bool isKnownStream(const MetaDataHeader& header);

/// Returns true if the entries of the stream can be decoded here: its kind is one that is recorded, its version is
/// known, and its header states the entry size of that kind.
ZULMETADATA_API bool isDecodable(const MetaDataHeader& header);

/// Returns the size of each entry in bytes for the stream's kind, whatever the header states; 0 if they vary. If the
/// kind is not recorded or the version is not known, returns what the header states.
ZULMETADATA_API std::uint32_t entrySizeOf(const MetaDataHeader& header);

/// Returns the time of an entry in seconds. It is empty if the entry does not fit its kind or cannot be decoded.
ZULMETADATA_API std::optional<double> timeOfEntry(const MetaDataHeader& header, std::string_view bytes);

/// Calls `visit(entry, bytes)` for each entry until it returns false. Returns the offset of the entry that it
/// refused, or the end of the last whole entry.
template <class Visit>
std::uint64_t walkEntries(StreamEntries& entries, Visit visit) {
    while (const auto entry = entries.next())
        if (!visit(*entry, entries.bytesOf(*entry)))
            return entry->offset;
    return entries.wholeBytes();
}

} // namespace ZULMetaData
