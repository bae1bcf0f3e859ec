// Sleeping on the monotonic clock.
#pragma once

#include <cstdint>

namespace vq {
namespace dsc {
namespace osdep {

// Sleeps for `milliseconds` on the monotonic clock; a signal does not cut the sleep short.
void SleepMs(uint32_t milliseconds);

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
