#pragma once

// Tells containers apart by their first bytes, for input that has no file name.

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataParser.h"

#include <string_view>

namespace ZULMetaData {

/// What begins like this; 24 bytes are enough to tell. `RawStream` for an identifier of the registry's family, known or
/// not, `Riff` for its signature, `QuickTime` for an atom whose size covers its header and whose type is printable.
ZULMETADATA_API MetaDataParser::StreamType streamTypeOfContents(std::string_view firstBytes);

/// The extension, with its dot, under which `MetaDataParser::create` takes a file for a container of this type; empty
/// for `Unknown`.
ZULMETADATA_API std::string_view extensionFor(MetaDataParser::StreamType type);

} // namespace ZULMetaData
