#include "support/Sysroot.h"

#include <stdlib.h>

#include <ctime>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/SystemClock.h"
#include "trace/TraceTestSupport.h"

namespace kest::test::support {

namespace {

// An absolute shared-file directory wins over the sysroot: the named mutex tests show it.
TEST(SysrootTest, ResolvesOnlyUnderAnAbsoluteSysroot) {
    const struct {
        const char* value;  // KEST_SYSROOT, null for unset
        const char* prefix;
        bool hasSysroot;
    } cases[] = {{nullptr, "", false},
                 {"", "", false},
                 {"relative/root", "", false},
                 {"/", "", true},
                 {"/srv/root", "/srv/root", true},
                 {"/srv/root//", "/srv/root", true}};
    for (const auto& c : cases) {
        kest::test::trace::RunInChild([&c] {  // the environment changes end with the child
            SCOPED_TRACE(c.value != nullptr ? c.value : "unset");
            c.value != nullptr ? setenv("KEST_SYSROOT", c.value, 1) : unsetenv("KEST_SYSROOT");
            setenv("VQDSCTMPSHAREDFILEDIR", "run/shared", 1);  // not absolute: ignored
            const std::string prefix = c.prefix;
            EXPECT_EQ(kest::SysrootDirectory(), prefix);
            EXPECT_EQ(kest::HasSysroot(), c.hasSysroot);
            EXPECT_EQ(kest::ResolveSystemPath("/dev/rtc0"), prefix + "/dev/rtc0");
            EXPECT_EQ(kest::ResolveSystemPath("relative/path"), "relative/path");
            namespace paths = kest::paths;
            EXPECT_EQ(paths::VersionFile(), prefix + "/etc/korvane/version");
            EXPECT_EQ(paths::FirmwareStagingFile(),
                      prefix + "/var/volatile/tmp/kestsysxp.fwupdate.cfg");
            EXPECT_EQ(paths::SharedTemporaryFileDirectory(), prefix + "/var/tmp/korvane/shared");
            EXPECT_EQ(paths::NamedMutexDirectory(), prefix + "/var/tmp/korvane/shared/mutex");
            EXPECT_EQ(paths::RealTimeClockDevices(),
                      (std::vector<std::string>{prefix + "/dev/rtc", prefix + "/dev/rtc0",
                                                prefix + "/dev/misc/rtc"}));
        });
    }
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
    EXPECT_EQ(kest::test::trace::EntriesOf(sysroot.PathOf("/run/kest")).size(), 1u)
        << "no temporary file is left behind";
    kest::test::TempSysroot other;
    other.WriteFile("/run", "not a directory");
    EXPECT_THROW(kest::SetSystemClock(1, 0), vq::dsc::osdep::PosixError);
}

}  // namespace

}  // namespace kest::test::support
