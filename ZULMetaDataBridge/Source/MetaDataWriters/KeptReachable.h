#pragma once

#include "../../../SharedDependencies/Export.h"

namespace ZULMetaData {

/// Keeps a pointer to an object that is never released, so leak checkers see the object as in use. Several threads may
/// call this at once.
ZULMETADATA_API void keepReachable(const void* object);

} // namespace ZULMetaData
