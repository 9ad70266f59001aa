#pragma once

// A simulated recording session: what is observed in it is recorded through the writers, and kept beside as what the
// parsers must give back.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <cstdint>
#include <functional>
#include <initializer_list>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Demo {

inline constexpr int s_duration = 20;            ///< of the session, in seconds
inline constexpr std::int32_t s_timescale = 600; ///< units of a second, in the movie and in the streams

using ExpectedEntry = std::vector<std::pair<std::string, EntryValue>>;

/// One kind's part of the session.
struct Track {
    std::string kind;
    FileLocation file;
    std::vector<ExpectedEntry> expected;
    std::function<std::shared_ptr<EntryList>(const FileLocation& movie)> read;
};

/// Records every kind into a stream file of its own in `folder`.
std::vector<Track> recordSession(const FileLocation& folder);

} // namespace ZULMetaData::Demo
