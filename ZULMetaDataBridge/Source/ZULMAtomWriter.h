#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"

#include <vector>

namespace ZULMetaData {

/// Attaches streams as recorders always have; `SafeMovieSave::attach` is the safe way.
class ZULMETADATA_API ZULMAtomWriter {
public:
    /// Repairs the movie's last atom and appends the stream files behind it as one atom, in this order. Failures
    /// to open a file show on standard output alone; throws as `MP4MetaData::appendMetaDataFiles` does.
    void writeMetaDataFiles(const std::vector<FileLocation>& files, const FileLocation& toFile) const;
};

} // namespace ZULMetaData
