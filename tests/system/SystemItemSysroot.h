// A temporary sysroot for the system item: the simulated controller's files, the firmware
// version file, the time-zone table, the web-service settings and a logging hardware-clock tool.
#pragma once

#include <string>

#include "common/ChassisTestTags.h"
#include "common/StateText.h"
#include "sim/SimFixture.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::system {

constexpr char kTimeZoneTablePath[] = "/usr/share/vqsysapi/timezone.ini";
constexpr char kWebServicePath[] = "/etc/korvane/share/vqkest.ini";
constexpr char kHardwareClockLog[] = "/hwclock.log";
constexpr char kClockFile[] = "/run/kest/system-clock";

// The [System] section of a controller with a description, identity, languages and an Olson time
// zone; each "Key = value" line of `overrides` replaces the line of that key or, for a new key,
// is added (a "[Faults]" section, too).
inline std::string SystemState(const std::string& overrides = "") {
    std::string state =
        "[System]\nDeviceDescription = KEST 9100\nTargetClass = KEST\nHostName = kest-01\n"
        "TargetID = 77\nSerialNumber = 6699\nUserComment = rack 4\nLanguageName = German\n"
        "SupportedLanguages = English,German,French\nTimeZone = America/Chicago\n"
        "TimezoneOffset = -360\nFullyQualifiedDNSName = kest-01.example.net\n";
    return kest::test::WithOverrides(state, overrides);
}

// A small table: two legacy texts and three Olson names.
constexpr char kSmallTimeZoneTable[] =
    "[LegacyToOlson]\nCST6CDT = America/Chicago\nPST8PDT = America/Los_Angeles\n"
    "EST5EDT = America/New_York\n[OlsonToLegacy]\nAmerica/Chicago = CST6CDT\n"
    "America/Los_Angeles = PST8PDT\nAmerica/New_York = EST5EDT\n";

class SystemItemSysroot : public kest::test::sim::SimSysroot {
  public:
    SystemItemSysroot() {
        WriteState(SystemState());
        sysroot_.WriteFile("/etc/korvane/version", "22.5.0\nbuild 17\n");
        sysroot_.WriteFile(kTimeZoneTablePath, kSmallTimeZoneTable);
        sysroot_.MakeDirectory("/etc/korvane/share");
        sysroot_.WriteScript("/sbin/hwclock",
                             "echo \"$@\" >> '" + sysroot_.PathOf(kHardwareClockLog) + "'\n");
    }

    // What the system clock was last set to ("seconds microseconds\n"; empty: never).
    std::string Clock() const { return sysroot_.ReadFile(kClockFile); }

    // The logged calls whose name starts with "Set" (name, status and arguments), one a line.
    std::string SetterCalls() const {
        std::string setters;
        for (const std::string& line : CallLog()) {
            setters += line.compare(0, 3, "Set") == 0 ? line + "\n" : "";
        }
        return setters;
    }
};

}  // namespace kest::test::system

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace tags = kest::test::tags;
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
