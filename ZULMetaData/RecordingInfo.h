#pragma once

#include "../SharedDependencies/Export.h"
#include "../SharedDependencies/ZCAPHeader.h"
#include "ZULMMetaDataParser.h"

#include <vector>

namespace ZULMetaData {

/// Who made a movie: what its top-level `ZULR` atoms hold, in the order of the file. The last one was stamped last.
/// One too short to hold the record is left out.
ZULMETADATA_API std::vector<ZCAPHeader> readRecordingInfo(MetaDataParser& movie);

} // namespace ZULMetaData
