#include "ProgramLocation.h"

#include <limits.h>
#include <unistd.h>

#include "ExitCodes.h"

namespace kest::cfg {

std::string ProgramDirectory() {
    char program[PATH_MAX];
    const ssize_t length = readlink("/proc/self/exe", program, sizeof program - 1);
    if (length <= 0) {
        throw Failure("cannot find the program's own directory");
    }
    const std::string path(program, static_cast<size_t>(length));
    return path.substr(0, path.rfind('/') + 1);
}

}  // namespace kest::cfg
