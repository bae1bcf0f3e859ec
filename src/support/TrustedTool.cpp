#include "support/TrustedTool.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>

#include "support/Exceptions.h"
#include "support/Sysroot.h"

namespace kest {
namespace {

// True when `path` names something owned by root or the effective user that neither group nor
// others may write.
bool OnlyOwnerMayChange(const std::string& path) {
    struct stat status {};
    if (stat(path.c_str(), &status) != 0) {
        return false;
    }
    return (status.st_uid == 0 || status.st_uid == geteuid()) &&
           (status.st_mode & (S_IWGRP | S_IWOTH)) == 0;
}

}  // namespace

std::string TrustedToolPath(const std::string& path) {
    if (!HasSysroot()) {
        return path;
    }
    char resolved[PATH_MAX];
    if (realpath(path.c_str(), resolved) == nullptr) {
        throw vq::dsc::osdep::PosixError();
    }
    std::string tool = resolved;
    const std::string directory = tool.substr(0, tool.rfind('/'));
    if (!OnlyOwnerMayChange(tool) || !OnlyOwnerMayChange(directory.empty() ? "/" : directory)) {
        throw vq::dsc::osdep::PosixError("Tool may be changed by others, not started: " + tool,
                                         EPERM);
    }
    return tool;
}

}  // namespace kest
