#pragma once

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"

namespace ZULMetaData {

/// Repairs a movie in the way that recorders rely on. New code should use `SafeMovieSave::repair`, which is safe.
class ZULMETADATA_API ZULMAtomRepair {
public:
    /// Sets the size of the last atom in a movie that was not finished; see `Util::finalizeAtomsInFile`.
    static bool finalizeAtomsInFile(const FileLocation& file);
};

} // namespace ZULMetaData
