#pragma once

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataParser.h"

#include <string>

namespace ZULMetaData {

/// Returns a small file that has all the metadata of `recording`, byte for byte, but none of its pictures and sound.
/// Readers find the same streams and recording info in it, at other offsets, and the same duration of the movie to the
/// nanosecond. The file is a container of the same type
/// and should have the same extension. For a bare stream, the result is the whole stream. Throws `std::system_error` if
/// reading fails.
ZULMETADATA_API std::string metaDataExcerpt(MetaDataParser& recording);

} // namespace ZULMetaData
