#pragma once

#include "../../SharedDependencies/Export.h"
#include "../../SharedDependencies/ZCAPHeader.h"
#include "../ByteSource.h"
#include "../ZULMMetaDataParser.h"

#include <vector>

namespace ZULMetaData {

/// Returns who made a movie: the records in its top-level `ZULR` atoms, in the order of the file. The last one is the
/// newest. An atom that is too short for a record is left out. Throws `std::system_error` if reading fails.
///@{
ZULMETADATA_API std::vector<ZCAPHeader> readRecordingInfo(const ByteSource& file, Container::Type type);
ZULMETADATA_API std::vector<ZCAPHeader> readRecordingInfo(MetaDataParser& recording);
///@}

} // namespace ZULMetaData
