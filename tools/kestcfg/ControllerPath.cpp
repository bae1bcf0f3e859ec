#include "ControllerPath.h"

#include <stdlib.h>
#include <sys/stat.h>

namespace kest::cfg {

std::string ControllerPath(const std::string& systemPath) {
    const char* root = getenv("KEST_SYSROOT");
    return (root != nullptr ? std::string(root) : std::string()) + systemPath;
}

std::vector<std::string> MissingControllerFiles() {
    std::vector<std::string> missing;
    for (const char* file : {"/etc/korvane/version", "/usr/share/vqsysapi/timezone.ini"}) {
        struct stat status {};
        if (stat(ControllerPath(file).c_str(), &status) != 0) {
            missing.push_back(ControllerPath(file));
        }
    }
    return missing;
}

}  // namespace kest::cfg
