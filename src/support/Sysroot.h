// Every fixed absolute path of the system, declared once. When the environment variable
// KEST_SYSROOT holds an absolute path, each one is resolved under that directory, so tests and
// demonstrations run against a private tree instead of the machine. The environment is read at
// every call, so a change takes effect at once. A build with the CMake option KEST_SYSROOT_SEAM
// off never reads KEST_SYSROOT: every path is used as it stands.
#pragma once

#include <string>
#include <vector>

namespace kest {

// True when KEST_SYSROOT holds an absolute path: the machine's clock is then never set.
bool HasSysroot();

// The sysroot directory without trailing slashes; empty when there is no sysroot or it is the
// root directory itself.
std::string SysrootDirectory();

// `absolutePath` resolved under the sysroot; unchanged without a sysroot or when it is relative.
std::string ResolveSystemPath(const std::string& absolutePath);

namespace paths {

// Directory of the controller's shared settings files, with its final slash.
std::string SharedSettingsDirectory();
// The diagnostics settings file "vqsysdiag.ini".
std::string DiagnosticsSettingsFile();
// The plug-in's own settings file "vqkest.ini" (the web-service switch).
std::string WebServiceSettingsFile();
// Preferred log directory, used when it exists.
std::string PrimaryLogDirectory();
// Log directory used when the preferred one does not exist.
std::string FallbackLogDirectory();
// The file whose first line is the firmware version.
std::string VersionFile();
// The table of legacy time-zone texts and Olson names.
std::string TimeZoneTableFile();
// The firmware-update tool.
std::string FirmwareUpdateTool();
// The firmware-update tool's progress file.
std::string FirmwareUpdateStatusFile();
// Directory that holds the staged firmware image.
std::string FirmwareStagingDirectory();
// The staged firmware image file.
std::string FirmwareStagingFile();
// The real-time clock device nodes, in the order they are tried.
std::vector<std::string> RealTimeClockDevices();
// The hardware clock's drift file.
std::string AdjtimeFile();
// The tool that copies the system time to the hardware clock.
std::string HardwareClockTool();
// Base directory of files shared between processes: VQDSCTMPSHAREDFILEDIR when it holds an
// absolute path (taken as it is, never under the sysroot), otherwise the resolved default.
std::string SharedTemporaryFileDirectory();
// Directory of the lock files of named mutexes (the trace lock): "mutex" in the shared one.
std::string NamedMutexDirectory();
// File that receives the time to set when the system clock is redirected under a sysroot.
std::string RedirectedSystemClockFile();

}  // namespace paths
}  // namespace kest
