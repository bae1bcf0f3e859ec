// Setting the system clock. Under a sysroot the clock is never touched: the time is written to
// a file there instead, so tests and demonstrations can check it.
#pragma once

#include <cstdint>

namespace kest {

// Sets the system clock to `seconds` (Unix time) and `microseconds` (0 to 999999, else
// vq::dsc::exception::InvalidArgument); seconds that time_t cannot hold raise
// vq::dsc::exception::OutOfRange. Under a sysroot, replaces the redirected clock file with the
// line "SECONDS MICROSECONDS". Failures raise vq::dsc::osdep::PosixError.
void SetSystemClock(int64_t seconds, int64_t microseconds);

}  // namespace kest
