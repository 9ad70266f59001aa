#pragma once

#include "Tools/record/Instant.h"
#include "Tools/record/RecordingFolder.h"

#include <cstdint>

namespace Recorder {

/// How much a recording has written.
struct Written {
    std::uint64_t movieBytes = 0;
    std::uint64_t streamBytes = 0;
    std::uint64_t frames = 0;
};

/// Keeps as much space in reserve as it takes to end a recording well: its streams are copied into the movie, whose
/// index has an entry for each frame.
class DiskWatch {
public:
    explicit DiskWatch(RecordingFolder& folder) : folder_(folder) {}

    /// Looks now and then. Returns false when only the reserve is left.
    bool hasRoom(const Written& written);

private:
    RecordingFolder& folder_;
    Instant nextCheck_ = 0;
    Instant nextRate_ = 0;
    std::uint64_t ratedBytes_ = 0; ///< of the movie when its rate was taken last
    std::uint64_t fastest_ = 0;    ///< bytes that the movie grew by in a second
};

} // namespace Recorder
