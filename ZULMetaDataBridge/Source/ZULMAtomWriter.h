#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"

#include <vector>

namespace ZULMetaData {

/// Attaches streams to a movie in the way that recorders rely on. New code should use `SafeMovieSave::attach`, which is
/// safe.
class ZULMETADATA_API ZULMAtomWriter {
public:
    /// Repairs the last atom of the movie and appends the stream files to it as one atom, in this order. If a file
    /// cannot be opened, a line on standard output says so; there is no other report. Throws as
    /// `MP4MetaData::appendMetaDataFiles` does.
    void writeMetaDataFiles(const std::vector<FileLocation>& files, const FileLocation& toFile) const;
};

} // namespace ZULMetaData
