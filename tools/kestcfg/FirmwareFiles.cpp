#include "FirmwareFiles.h"

#include "ControllerPath.h"

#include <stdlib.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <cctype>
#include <fstream>
#include <sstream>

namespace kest::cfg {

namespace {

constexpr char kStatusFile[] = "/var/run/firmware_update/status";
constexpr char kLockFile[] = "/var/run/firmware_update/update.lock";

// True when /proc/locks lists a lock on the file with `status`.
bool IsLocked(const struct stat& status) {
    std::ifstream locks("/proc/locks");
    std::string line;
    char wanted[64];
    std::snprintf(wanted, sizeof wanted, " %02x:%02x:%llu ", major(status.st_dev),
                  minor(status.st_dev), static_cast<unsigned long long>(status.st_ino));
    while (std::getline(locks, line)) {
        if (line.find(wanted) != std::string::npos && line.find("->") == std::string::npos) {
            return true;
        }
    }
    return false;
}

}  // namespace

std::optional<char> StatusFileCode() {
    std::ifstream file(ControllerPath(kStatusFile));
    char c = 0;
    while (file.get(c)) {
        if (!std::isspace(static_cast<unsigned char>(c))) {
            return c;
        }
    }
    return std::nullopt;
}

std::string StatusCodeMeaning(char code) {
    if (code >= '0' && code <= '4') {
        return std::string("stage ") + code + " of 5";
    }
    if (code == '5') {
        return "last stage reached, finishing";
    }
    return std::string("failed (code ") + code + ")";
}

UpdateLock ReadUpdateLock() {
    UpdateLock lock;
    const std::string path = ControllerPath(kLockFile);
    struct stat status {};
    if (stat(path.c_str(), &status) != 0) {
        return lock;
    }
    lock.present = true;
    lock.held = IsLocked(status);
    std::ifstream file(path);
    long long pid = 0;
    if (file >> pid && pid > 0) {
        lock.pid = static_cast<pid_t>(pid);
    }
    return lock;
}

}  // namespace kest::cfg
