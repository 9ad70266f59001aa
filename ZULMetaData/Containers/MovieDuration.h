#pragma once

#include "../../SharedDependencies/Export.h"
#include "../ByteSource.h"
#include "../ZULMMetaDataParser.h"

#include <optional>

namespace ZULMetaData {

/// How long a movie lasts, in seconds: what the header in its first `moov` atom declares. If the movie is fragmented,
/// its fragments count as well: what their header (`mehd`) declares, else the durations of their samples. Of more than
/// 50,000 fragments only the last ones are read, so that the work stays bounded.
///
/// Returns nothing for a movie without a header, as while it is still being recorded, for a header that is cut short,
/// counts in no timescale or leaves the duration open, and for any other container. A file of segments without a header
/// lasts as long as its segment indexes (`sidx`) say. Throws `std::system_error` if reading fails.
///@{
ZULMETADATA_API std::optional<double> movieDuration(const ByteSource& file, Container::Type type);
ZULMETADATA_API std::optional<double> movieDuration(MetaDataParser& movie);
///@}

} // namespace ZULMetaData
