#include "support/Sysroot.h"

#include <dirent.h>
#include <stdlib.h>

#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/SystemClock.h"

namespace {

// Sets or unsets an environment variable for one test and restores it afterwards.
class ScopedEnvironment {
  public:
    ScopedEnvironment(const char* name, const char* value) : name_(name) {
        const char* previous = getenv(name);
        hadPrevious_ = previous != nullptr;
        previous_ = hadPrevious_ ? previous : "";
        if (value != nullptr) {
            setenv(name, value, 1);
        } else {
            unsetenv(name);
        }
    }
    ~ScopedEnvironment() {
        if (hadPrevious_) {
            setenv(name_, previous_.c_str(), 1);
        } else {
            unsetenv(name_);
        }
    }

  private:
    const char* name_;
    std::string previous_;
    bool hadPrevious_;
};

struct SysrootCase {
    const char* value;  // KEST_SYSROOT, null for unset
    const char* prefix;
    bool hasSysroot;
};

class SysrootResolutionTest : public ::testing::TestWithParam<SysrootCase> {};

TEST_P(SysrootResolutionTest, ResolvesOnlyUnderAnAbsoluteSysroot) {
    ScopedEnvironment sysroot("KEST_SYSROOT", GetParam().value);
    ScopedEnvironment shared("VQDSCTMPSHAREDFILEDIR", nullptr);
    const std::string prefix = GetParam().prefix;
    EXPECT_EQ(kest::SysrootDirectory(), prefix);
    EXPECT_EQ(kest::HasSysroot(), GetParam().hasSysroot);
    EXPECT_EQ(kest::ResolveSystemPath("/dev/rtc0"), prefix + "/dev/rtc0");
    EXPECT_EQ(kest::ResolveSystemPath("relative/path"), "relative/path");

    namespace paths = kest::paths;
    const std::pair<std::function<std::string()>, const char*> fixedPaths[] = {
        {paths::SharedSettingsDirectory, "/etc/korvane/share/"},
        {paths::DiagnosticsSettingsFile, "/etc/korvane/share/vqsysdiag.ini"},
        {paths::WebServiceSettingsFile, "/etc/korvane/share/vqkest.ini"},
        {paths::PrimaryLogDirectory, "/etc/korvane/share/vqsyslog"},
        {paths::FallbackLogDirectory, "/var/local/korvane/vqsyslog"},
        {paths::VersionFile, "/etc/korvane/version"},
        {paths::TimeZoneTableFile, "/usr/share/vqsysapi/timezone.ini"},
        {paths::FirmwareUpdateTool, "/usr/local/korvane/bin/fwupdate"},
        {paths::FirmwareUpdateStatusFile, "/var/run/firmware_update/status"},
        {paths::FirmwareStagingDirectory, "/var/volatile/tmp"},
        {paths::FirmwareStagingFile, "/var/volatile/tmp/kestsysxp.fwupdate.cfg"},
        {paths::AdjtimeFile, "/etc/adjtime"},
        {paths::HardwareClockTool, "/sbin/hwclock"},
        {paths::SharedTemporaryFileDirectory, "/var/tmp/korvane/shared"},
        {paths::NamedMutexDirectory, "/var/tmp/korvane/shared/mutex"},
        {paths::RedirectedSystemClockFile, "/run/kest/system-clock"}};
    for (const auto& [resolve, path] : fixedPaths) {
        EXPECT_EQ(resolve(), prefix + path);
    }
    EXPECT_EQ(paths::RealTimeClockDevices(),
              (std::vector<std::string>{prefix + "/dev/rtc", prefix + "/dev/rtc0",
                                        prefix + "/dev/misc/rtc"}));
}

INSTANTIATE_TEST_SUITE_P(Values, SysrootResolutionTest,
                         ::testing::Values(SysrootCase{nullptr, "", false},
                                           SysrootCase{"", "", false},
                                           SysrootCase{"relative/root", "", false},
                                           SysrootCase{"/", "", true},
                                           SysrootCase{"/srv/root", "/srv/root", true},
                                           SysrootCase{"/srv/root//", "/srv/root", true}));

TEST(SharedFileDirectoryTest, AbsoluteOverrideWinsOverTheSysroot) {
    ScopedEnvironment sysroot("KEST_SYSROOT", "/srv/root");
    {
        ScopedEnvironment shared("VQDSCTMPSHAREDFILEDIR", "/run/shared");
        EXPECT_EQ(kest::paths::SharedTemporaryFileDirectory(), "/run/shared");
        EXPECT_EQ(kest::paths::NamedMutexDirectory(), "/run/shared/mutex");
    }
    ScopedEnvironment shared("VQDSCTMPSHAREDFILEDIR", "run/shared");
    EXPECT_EQ(kest::paths::NamedMutexDirectory(), "/srv/root/var/tmp/korvane/shared/mutex");
}

std::vector<std::string> DirectoryEntries(const std::string& path) {
    std::vector<std::string> names;
    if (DIR* directory = opendir(path.c_str())) {
        while (const dirent* entry = readdir(directory)) {
            if (entry->d_name[0] != '.') {
                names.push_back(entry->d_name);
            }
        }
        closedir(directory);
    }
    return names;
}

TEST(SystemClockTest, UnderASysrootTheTimeGoesToAFile) {
    kest::test::TempSysroot sysroot;
    kest::SetSystemClock(1700000000, 500000);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "1700000000 500000\n");
    kest::SetSystemClock(5, 0);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "5 0\n");
    EXPECT_EQ(DirectoryEntries(sysroot.PathOf("/run/kest")),
              std::vector<std::string>{"system-clock"});
}

TEST(SystemClockTest, RefusesBadMicrosecondsAndReportsWriteFailures) {
    kest::test::TempSysroot sysroot;
    EXPECT_THROW(kest::SetSystemClock(1, 1000000), vq::dsc::exception::InvalidArgument);
    EXPECT_THROW(kest::SetSystemClock(1, -1), vq::dsc::exception::InvalidArgument);
    EXPECT_FALSE(sysroot.Exists("/run"));
    sysroot.WriteFile("/run", "not a directory");
    EXPECT_THROW(kest::SetSystemClock(1, 0), vq::dsc::osdep::PosixError);
}

}  // namespace
