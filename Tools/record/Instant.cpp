#include "Tools/record/Instant.h"

#include <ctime>

namespace Recorder {

Instant now() {
    timespec time{};
    clock_gettime(CLOCK_MONOTONIC, &time);
    return time.tv_sec * s_second + time.tv_nsec;
}

} // namespace Recorder
