#pragma once

// What the kind of a stream tells about its entries, for code that handles streams of any kind.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "MetaDataKinds.h"

#include <cstdint>
#include <optional>
#include <string_view>

namespace ZULMetaData {

/// Whether the stream is of a kind and version whose entries can be decoded here.
ZULMETADATA_API bool isDecodable(const MetaDataHeader& header);

/// Bytes of each of its entries, 0 where they vary: what readers of its kind go by, whatever the header says. Of a
/// stream that cannot be decoded, what the header says.
ZULMETADATA_API std::uint32_t entrySizeOf(const MetaDataHeader& header);

/// Entries as readers of the stream's kind tell them apart.
ZULMETADATA_API StreamEntries entriesOf(ReadBytes read, std::uint64_t length);

/// None where the entry does not fit its kind, and where the stream cannot be decoded.
ZULMETADATA_API std::optional<double> timeOfEntry(const MetaDataHeader& header, std::string_view bytes);

} // namespace ZULMetaData
