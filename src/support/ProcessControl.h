// Control of other processes.
#pragma once

#include <sys/types.h>

namespace vq {
namespace dsc {
namespace osdep {

// Sends SIGKILL to `processId`; a process that no longer exists counts as killed. An id that is
// not positive raises vq::dsc::exception::InvalidArgument, other failures PosixError.
void KillProcess(pid_t processId);

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
