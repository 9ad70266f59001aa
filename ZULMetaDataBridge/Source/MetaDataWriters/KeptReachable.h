#pragma once

#include "../../../SharedDependencies/Export.h"

namespace ZULMetaData {

/// Remembers an object that is never released, for as long as the program runs, so that leak checkers see it as
/// in use. Safe to call from several threads.
ZULMETADATA_API void keepReachable(const void* object);

} // namespace ZULMetaData
