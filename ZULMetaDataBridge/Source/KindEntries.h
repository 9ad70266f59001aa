#pragma once

// Properties of entries that depend on the kind of their stream, for code that handles streams of any kind.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "MetaDataKinds.h"

#include <cstdint>
#include <optional>
#include <string_view>

namespace ZULMetaData {

/// Returns whether entries of this kind and version can be decoded.
ZULMETADATA_API bool isDecodable(const MetaDataHeader& header);

/// Returns the size of every entry in bytes, or 0 if each entry has its own size. Readers use the size that the kind
/// determines, whatever the header says; only if the stream cannot be decoded, the size is the one in the header.
ZULMETADATA_API std::uint32_t entrySizeOf(const MetaDataHeader& header);

/// Returns the entries of a stream, divided as readers of its kind divide them.
ZULMETADATA_API StreamEntries entriesOf(ReadBytes read, std::uint64_t length);

/// Returns the time of an entry in seconds. It is empty if the entry does not fit its kind or cannot be decoded.
ZULMETADATA_API std::optional<double> timeOfEntry(const MetaDataHeader& header, std::string_view bytes);

} // namespace ZULMetaData
