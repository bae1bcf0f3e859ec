#include "support/Sysroot.h"

#include <cstdlib>

namespace kest {
namespace {

// Set by the build: without the seam, KEST_SYSROOT is never read.
constexpr bool kSysrootSeam = KEST_SYSROOT_SEAM != 0;

// The value of an environment variable when it holds an absolute path, else empty. Uses
// secure_getenv so that a privileged process ignores a caller's redirection.
std::string AbsolutePathFromEnvironment(const char* name) {
    const char* value = secure_getenv(name);
    if (value == nullptr || value[0] != '/') {
        return std::string();
    }
    return value;
}

}  // namespace

bool HasSysroot() {
    return kSysrootSeam && !AbsolutePathFromEnvironment("KEST_SYSROOT").empty();
}

std::string SysrootDirectory() {
    if (!kSysrootSeam) {
        return std::string();
    }
    std::string directory = AbsolutePathFromEnvironment("KEST_SYSROOT");
    while (!directory.empty() && directory.back() == '/') {
        directory.pop_back();
    }
    return directory;
}

std::string ResolveSystemPath(const std::string& absolutePath) {
    if (absolutePath.empty() || absolutePath[0] != '/') {
        return absolutePath;
    }
    return SysrootDirectory() + absolutePath;
}

namespace paths {

std::string SharedSettingsDirectory() {
    return ResolveSystemPath("/etc/korvane/share/");
}

std::string DiagnosticsSettingsFile() {
    return SharedSettingsDirectory() + "vqsysdiag.ini";
}

std::string WebServiceSettingsFile() {
    return SharedSettingsDirectory() + "vqkest.ini";
}

std::string PrimaryLogDirectory() {
    return SharedSettingsDirectory() + "vqsyslog";
}

std::string FallbackLogDirectory() {
    return ResolveSystemPath("/var/local/korvane/vqsyslog");
}

std::string VersionFile() {
    return ResolveSystemPath("/etc/korvane/version");
}

std::string TimeZoneTableFile() {
    return ResolveSystemPath("/usr/share/vqsysapi/timezone.ini");
}

std::string FirmwareUpdateTool() {
    return ResolveSystemPath("/usr/local/korvane/bin/fwupdate");
}

std::string FirmwareUpdateStatusFile() {
    return ResolveSystemPath("/var/run/firmware_update/status");
}

std::string FirmwareStagingDirectory() {
    return ResolveSystemPath("/var/volatile/tmp");
}

std::string FirmwareStagingFile() {
    return FirmwareStagingDirectory() + "/kestsysxp.fwupdate.cfg";
}

std::vector<std::string> RealTimeClockDevices() {
    return {ResolveSystemPath("/dev/rtc"), ResolveSystemPath("/dev/rtc0"),
            ResolveSystemPath("/dev/misc/rtc")};
}

std::string AdjtimeFile() {
    return ResolveSystemPath("/etc/adjtime");
}

std::string HardwareClockTool() {
    return ResolveSystemPath("/sbin/hwclock");
}

std::string SharedTemporaryFileDirectory() {
    std::string overridden = AbsolutePathFromEnvironment("VQDSCTMPSHAREDFILEDIR");
    if (!overridden.empty()) {
        return overridden;
    }
    return ResolveSystemPath("/var/tmp/korvane/shared");
}

std::string NamedMutexDirectory() {
    return SharedTemporaryFileDirectory() + "/mutex";
}

std::string RedirectedSystemClockFile() {
    return ResolveSystemPath("/run/kest/system-clock");
}

}  // namespace paths
}  // namespace kest
