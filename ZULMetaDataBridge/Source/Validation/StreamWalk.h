#pragma once

#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"

#include <functional>

namespace ZULMetaData::detail {

/// Whether the next stream begins at a position that should still belong to this one.
using IsNextStream = std::function<bool(std::uint64_t)>;

struct WalkedStream {
    std::uint64_t wholeEnd; ///< the end of the last whole entry, or of the stream if it has no whole header
    bool isTailLeftOut;     ///< whether the next stream begins there, so that a torn entry was never copied
};

/// Validates one stream: its header, then its entries by the layout of its kind. `report` tells where the stream begins
/// in the file, which has `fileSize` bytes. `duration` is the movie's in seconds, if it is known.
WalkedStream walkStream(const ByteSource& stream, std::uint64_t fileSize, std::optional<double> duration,
                        FindingLog& log, StreamReport& report, IsNextStream isNextStream);

} // namespace ZULMetaData::detail
