#include "support/Sysroot.h"

#include <glob.h>
#include <stdlib.h>

#include <ctime>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/SystemClock.h"

namespace kest::test::support {

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

void PrintTo(const SysrootCase& c, std::ostream* out) {
    *out << (c.value == nullptr ? "unset" : '"' + std::string(c.value) + '"');
}

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
    EXPECT_EQ(paths::VersionFile(), prefix + "/etc/korvane/version");
    EXPECT_EQ(paths::FirmwareStagingFile(), prefix + "/var/volatile/tmp/kestsysxp.fwupdate.cfg");
    EXPECT_EQ(paths::NamedMutexDirectory(), prefix + "/var/tmp/korvane/shared/mutex");
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

// Under a sysroot the time goes to a file, replaced whole. 2100-01-01 is taken where time_t has
// 64 bits and refused, never wrapped to 1901, where it has 32 bits (ARMv7 Linux).
TEST(SystemClockTest, UnderASysrootTheTimeGoesToAFile) {
    kest::test::TempSysroot sysroot;
    EXPECT_THROW(kest::SetSystemClock(1, 1000000), vq::dsc::exception::InvalidArgument);
    EXPECT_THROW(kest::SetSystemClock(1, -1), vq::dsc::exception::InvalidArgument);
    if (sizeof(time_t) < sizeof(int64_t)) {
        EXPECT_THROW(kest::SetSystemClock(4102444800, 0), vq::dsc::exception::OutOfRange);
    }
    EXPECT_FALSE(sysroot.Exists("/run"));
    kest::SetSystemClock(1700000000, 500000);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "1700000000 500000\n");
    kest::SetSystemClock(5, 0);
    EXPECT_EQ(sysroot.ReadFile("/run/kest/system-clock"), "5 0\n");
    if (sizeof(time_t) >= sizeof(int64_t)) {
        kest::SetSystemClock(4102444800, 0);
        EXPECT_EQ("4102444800 0\n", sysroot.ReadFile("/run/kest/system-clock"));
    }
    glob_t files{};
    EXPECT_EQ(glob(sysroot.PathOf("/run/kest/*").c_str(), 0, nullptr, &files), 0);
    EXPECT_EQ(files.gl_pathc, 1u) << "no temporary file is left behind";
    globfree(&files);
    kest::test::TempSysroot other;
    other.WriteFile("/run", "not a directory");
    EXPECT_THROW(kest::SetSystemClock(1, 0), vq::dsc::osdep::PosixError);
}

}  // namespace

}  // namespace kest::test::support
