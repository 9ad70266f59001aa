#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"

namespace ZULMetaData {

/// Mends a movie as recorders always have; `SafeMovieSave::repair` is the safe way.
class ZULMETADATA_API ZULMAtomRepair {
public:
    /// Gives the last atom of a movie that was cut short its real size; see `Util::finalizeAtomsInFile`.
    static bool finalizeAtomsInFile(const FileLocation& file);
};

} // namespace ZULMetaData
