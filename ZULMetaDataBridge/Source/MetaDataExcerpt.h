#pragma once

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataParser.h"

#include <string>

namespace ZULMetaData {

/// A small file that holds the metadata of `recording`, every byte of it, and none of its pictures and sound: readers
/// find the same streams and recording information in it, at other offsets. It is a container of the same type, to be
/// named with the same extension; of a bare stream, all of it. Throws `std::system_error` where reading fails.
ZULMETADATA_API std::string metaDataExcerpt(MetaDataParser& recording);

} // namespace ZULMetaData
