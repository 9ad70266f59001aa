#include "Tools/record/Instant.h"

#include <cerrno>
#include <ctime>

namespace Recorder {

Instant now() {
    timespec time{};
    clock_gettime(CLOCK_MONOTONIC, &time);
    return time.tv_sec * s_second + time.tv_nsec;
}

void sleepUntil(Instant instant) {
    const timespec time{instant / s_second, instant % s_second};
    while (clock_nanosleep(CLOCK_MONOTONIC, TIMER_ABSTIME, &time, nullptr) == EINTR) {
    }
}

} // namespace Recorder
