#include "support/Sleep.h"

#include <time.h>

#include <cerrno>

namespace vq {
namespace dsc {
namespace osdep {

void SleepMs(uint32_t milliseconds) {
    constexpr long kNanosecondsPerSecond = 1000000000L;
    timespec deadline{};
    clock_gettime(CLOCK_MONOTONIC, &deadline);
    deadline.tv_sec += static_cast<time_t>(milliseconds / 1000);
    deadline.tv_nsec += static_cast<long>(milliseconds % 1000) * 1000000L;
    if (deadline.tv_nsec >= kNanosecondsPerSecond) {
        deadline.tv_sec += 1;
        deadline.tv_nsec -= kNanosecondsPerSecond;
    }
    // An absolute deadline lets an interrupted sleep resume for exactly the remaining time.
    while (clock_nanosleep(CLOCK_MONOTONIC, TIMER_ABSTIME, &deadline, nullptr) == EINTR) {
    }
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
