#include "hostkit/DemoController.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "support/FileDescriptor.h"
#include "support/WholeTransfer.h"

namespace kest::hostkit {

namespace {

// The controller as the simulated library reads it: a chassis and one Ethernet adapter, eth0,
// in TCP/IP mode with a static address, polling every 100 ms.
constexpr char kState[] =
    R"(; State of the demo controller, read by the simulated controller library at every call.
; Numbers are decimal or 0x-hexadecimal. Edit freely: the next kestcfg command sees the change.

[System]
DeviceDescription = KEST 9100
TargetClass = KEST
HostName = kest-demo
TargetID = 17
SerialNumber = 0x00A1B2C3
UserComment = Demo controller on a desk
LanguageName = English
SupportedLanguages = English,German,French,Chinese,Korean,Japanese
TimeZone = Europe/Berlin
TimezoneOffset = 60
FullyQualifiedDNSName = kest-demo.local

[Network]
PrimaryDeviceIndex = 0

; Adapter modes: 1 disabled, 2 TCP/IP, 8 EtherCAT. Request mode 1 is a static address.
[Device0]
Type = 1
InterfaceName = eth0
Index = 0
MACAddress = 02:4B:45:53:54:00
Mode = 2
SupportedModes = 0x0B
RequestMode = 1
SupportedRequestModes = 0x03
IPAddress = 192.168.10.20
SubnetMask = 255.255.255.0
Gateway = 192.168.10.1
DNSServer = 192.168.10.1
SupportedMediaModes = 0x1F
CurrentMediaMode = 1
PreferredMediaMode = 1
SupportedPollingModes = 0x03
PollingMode = 2
PollingInterval = 100
InterfaceUp = 1
AdapterUp = 1
)";

constexpr char kVersion[] = "22.5.0\n";

// Diagnostics: errors and INI-cache failures go to a log file in /etc/korvane/share/vqsyslog.
constexpr char kDiagnostics[] = R"([AllComponents]
Severity = 3
Target = 1
LowDiskThreshold = 0
)";

std::string SystemError(const std::string& what, const std::string& path) {
    return what + " " + path + ": " + std::strerror(errno);
}

// Creates `path` and its missing parents.
void MakeDirectories(const std::string& path) {
    for (size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
        const std::string prefix = path.substr(0, slash);
        struct stat status {};
        if (!prefix.empty() && mkdir(prefix.c_str(), 0755) != 0 && errno != EEXIST) {
            throw std::runtime_error(SystemError("cannot create the directory", prefix));
        }
        if (!prefix.empty() && (stat(prefix.c_str(), &status) != 0 || !S_ISDIR(status.st_mode))) {
            throw std::runtime_error("cannot create the directory " + prefix +
                                     ": something else is there");
        }
        if (slash == std::string::npos) {
            return;
        }
    }
}

// True when the directory open at `descriptor` has no entries; false when it cannot be read.
bool IsEmptyDirectory(int descriptor) {
    const int listed = fcntl(descriptor, F_DUPFD_CLOEXEC, 0);
    DIR* directory = listed >= 0 ? fdopendir(listed) : nullptr;
    if (directory == nullptr) {
        if (listed >= 0) {
            close(listed);
        }
        return false;
    }
    bool empty = true;
    while (const dirent* entry = readdir(directory)) {
        if (std::strcmp(entry->d_name, ".") != 0 && std::strcmp(entry->d_name, "..") != 0) {
            empty = false;
            break;
        }
    }
    closedir(directory);
    return empty;
}

// Makes `root` the demo controller's directory: creates it with mode 0700, or accepts an
// existing one only when it is an empty directory of the caller that neither group nor others
// may write. Anyone else able to change the tree could replace the tool stand-ins, which run as
// the plug-in's user.
void PrepareRootDirectory(const std::string& root) {
    const std::string::size_type slash = root.find_last_of('/');
    if (slash != std::string::npos && slash > 0) {
        MakeDirectories(root.substr(0, slash));
    }
    const bool created = mkdir(root.c_str(), 0700) == 0;
    if (!created && errno != EEXIST) {
        throw std::runtime_error(SystemError("cannot create the directory", root));
    }
    const kest::FileDescriptor directory(
        open(root.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    struct stat status {};
    const bool usable = directory.IsOpen() && fstat(directory.Get(), &status) == 0 &&
                        status.st_uid == geteuid() && (status.st_mode & (S_IWGRP | S_IWOTH)) == 0 &&
                        IsEmptyDirectory(directory.Get());
    if (!usable) {
        throw std::runtime_error(
            root +
            " is not a new or empty directory of yours that only you may write; sim "
            "init needs one (mktemp -d makes one)");
    }
}

std::string ReadWhole(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    if (!file) {
        throw std::runtime_error(SystemError("cannot read", path));
    }
    return content.str();
}

// Text as one single-quoted shell word.
std::string ShellQuoted(const std::string& text) {
    std::string quoted = "'";
    for (const char c : text) {
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    }
    return quoted + "'";
}

// Stands in for the hardware-clock tool: records the arguments of each call.
std::string HardwareClockScript(const std::string& root) {
    return "#!/bin/sh\n"
           "# Stands in for the hardware-clock tool of the demo controller: records each call.\n"
           "printf '%s\\n' \"$*\" >> " +
           ShellQuoted(root + "/var/log/hwclock.log") + "\n";
}

// Stands in for the firmware-update tool: records its arguments and walks the status file
// through the stages 0 to 5. It is started with an empty environment, so it names its paths
// itself; each stage replaces the file at once, so a reader never sees it empty.
std::string FirmwareToolScript(const std::string& root) {
    return "#!/bin/sh\n"
           "# Stands in for the firmware-update tool of the demo controller: records its\n"
           "# arguments and reports the stages 0 to 5 in the status file.\n"
           "PATH=/usr/bin:/bin\n"
           "root=" +
           ShellQuoted(root) +
           "\n"
           "printf '%s\\n' \"$*\" >> \"$root/var/log/fwupdate.log\"\n"
           "status=\"$root/var/run/firmware_update/status\"\n"
           "mkdir -p \"$root/var/run/firmware_update\"\n"
           "for stage in 0 1 2 3 4 5; do\n"
           "    printf '%s\\n' \"$stage\" > \"$status.new\" && mv -f \"$status.new\" \"$status\"\n"
           "    sleep 0.3\n"
           "done\n"
           "exit 0\n";
}

class TreeWriter {
  public:
    explicit TreeWriter(std::string root) : root_(std::move(root)) {}

    // Writes `content` to `systemPath` under the root with `mode`, creating parents.
    void Write(const std::string& systemPath, const std::string& content, mode_t mode) {
        const std::string path = root_ + systemPath;
        MakeDirectories(path.substr(0, path.rfind('/')));
        kest::FileDescriptor file(
            open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, mode));
        if (!file.IsOpen()) {
            throw std::runtime_error(SystemError("cannot create", path));
        }
        if (!kest::WriteWhole(file.Get(), content)) {
            throw std::runtime_error(SystemError("cannot write", path));
        }
        if (fchmod(file.Get(), mode) != 0 || file.Close() != 0) {
            throw std::runtime_error(SystemError("cannot finish", path));
        }
        written_.push_back(systemPath);
    }

    // Creates the directory `systemPath` under the root.
    void Directory(const std::string& systemPath) { MakeDirectories(root_ + systemPath); }

    const std::vector<std::string>& Written() const { return written_; }

  private:
    std::string root_;
    std::vector<std::string> written_;
};

}  // namespace

std::vector<std::string> CreateDemoController(const std::string& root,
                                              const std::string& timeZoneTable) {
    // Only a new or empty directory: the tree holds stand-ins for system tools, which must
    // never land on a machine's own paths or mix with other files.
    PrepareRootDirectory(root);
    const std::string zones = ReadWhole(timeZoneTable);

    TreeWriter tree(root);
    tree.Write("/etc/korvane/version", kVersion, 0644);
    tree.Write("/etc/korvane/share/vqsysdiag.ini", kDiagnostics, 0644);
    tree.Write("/usr/share/vqsysapi/timezone.ini", zones, 0644);
    tree.Write("/sbin/hwclock", HardwareClockScript(root), 0755);
    tree.Write("/usr/local/korvane/bin/fwupdate", FirmwareToolScript(root), 0755);
    // A readable clock device tells the plug-in that there is a hardware clock to set.
    tree.Write("/dev/rtc0", "", 0644);
    // Every directory the plug-in and kestcfg use at run time, so that a user without root can
    // work with a controller of their own: logs, the tracer's shared lock, the run directory,
    // the firmware staging and status directories.
    for (const char* directory :
         {"/etc/korvane/share/vqsyslog", "/var/local/korvane/vqsyslog", "/var/tmp/korvane/shared",
          "/run/kest", "/var/run/firmware_update", "/var/volatile/tmp", "/var/log"}) {
        tree.Directory(directory);
    }
    // Written last: its presence marks a complete controller.
    tree.Write(kControllerStatePath, kState, 0644);
    return tree.Written();
}

void WriteControllerState(const std::string& root, const std::string& state) {
    TreeWriter(root).Write(kControllerStatePath, state, 0644);
}

}  // namespace kest::hostkit
