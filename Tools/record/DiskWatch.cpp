#include "Tools/record/DiskWatch.h"

#include <algorithm>

namespace Recorder {

namespace {

constexpr Instant s_diskInterval = 100 * s_millisecond;
constexpr std::uint64_t s_leastRoom = std::uint64_t{1} << 20;
constexpr std::uint64_t s_bytesOfFrame = 40; ///< in the index

} // namespace

bool DiskWatch::hasRoom(const Written& written) {
    const Instant instant = now();
    if (instant < nextCheck_)
        return true;
    nextCheck_ = instant + s_diskInterval;
    if (instant >= nextRate_) {
        nextRate_ = instant + s_second;
        fastest_ = std::max(written.movieBytes - ratedBytes_, fastest_ / 2);
        ratedBytes_ = written.movieBytes;
    }
    // The reserve also holds what is on its way to the disk when another program takes all that was free.
    const std::uint64_t needed =
        2 * s_leastRoom + 2 * fastest_ + 2 * written.streamBytes + written.frames * s_bytesOfFrame;
    return folder_.reserve(needed) && folder_.freeBytes() >= s_leastRoom + fastest_;
}

} // namespace Recorder
