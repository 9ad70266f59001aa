#pragma once

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataParser.h"

#include <optional>

namespace ZULMetaData {

/// How long a movie says it lasts, in seconds: what the header in its first `moov` atom declares. Nothing where it has
/// none, as while it is still being recorded, where the header is cut short, counts in no timescale or leaves the
/// duration open, and for any other container.
ZULMETADATA_API std::optional<double> movieDuration(MetaDataParser& movie);

} // namespace ZULMetaData
