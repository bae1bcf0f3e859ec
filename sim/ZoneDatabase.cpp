#include "ZoneDatabase.h"

#include <sys/stat.h>

namespace kest::sim {
namespace {

// A zone name may not leave the database directory.
bool IsContainedName(const std::string& zoneName) {
    if (zoneName.empty() || zoneName.find('\0') != std::string::npos) {
        return false;
    }
    size_t start = 0;
    for (;;) {
        const size_t slash = zoneName.find('/', start);
        const std::string component = zoneName.substr(start, slash - start);
        if (component.empty() || component == "." || component == "..") {
            return false;
        }
        if (slash == std::string::npos) {
            return true;
        }
        start = slash + 1;
    }
}

bool IsDirectory(const std::string& path) {
    struct stat info;
    return ::stat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

}  // namespace

bool ZoneFileExists(const std::string& sysroot, const std::string& zoneName) {
    if (!IsContainedName(zoneName)) {
        return false;
    }
    std::string database = sysroot + "/usr/share/zoneinfo";
    if (!IsDirectory(database)) {
        database = "/usr/share/zoneinfo";
    }
    struct stat info;
    const std::string path = database + "/" + zoneName;
    return ::stat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode);
}

}  // namespace kest::sim
