#include "support/ProcessControl.h"

#include <signal.h>

#include <cerrno>

#include "support/Exceptions.h"

namespace vq {
namespace dsc {
namespace osdep {

void KillProcess(pid_t processId) {
    // 0 and negative ids address whole process groups or every process: never meant here.
    if (processId <= 0) {
        throw exception::InvalidArgument();
    }
    if (kill(processId, SIGKILL) != 0 && errno != ESRCH) {
        throw PosixError();
    }
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
