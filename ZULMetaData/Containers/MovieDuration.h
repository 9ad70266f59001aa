#pragma once

#include "../../SharedDependencies/Export.h"
#include "../ZULMMetaDataParser.h"

#include <istream>
#include <optional>

namespace ZULMetaData {

/// How long a movie lasts, in seconds: what the header in its first `moov` atom declares. If the movie is fragmented,
/// its fragments count as well: what their header (`mehd`) declares, else the durations of their samples. Of more than
/// 50,000 fragments only the last ones are read, so that the work stays bounded.
///
/// Returns nothing for a movie without a header, as while it is still being recorded, for a header that is cut short,
/// counts in no timescale or leaves the duration open, and for any other container. A file of segments without a header
/// lasts as long as its segment indexes (`sidx`) say.
///@{
ZULMETADATA_API std::optional<double> movieDuration(MetaDataParser& movie);
ZULMETADATA_API std::optional<double> movieDuration(std::istream& stream, Container::Type type);
///@}

} // namespace ZULMetaData
