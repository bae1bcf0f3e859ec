// kestcfg sim init: the demo controller's files, and a user without root using their own.
#include <grp.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>

#include <gtest/gtest.h>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

TEST(KestcfgSimTest, InitCreatesTheControllerFilesWithTheShippedTimeZoneTable) {
    kest::test::TempSysroot sysroot;
    const std::string root = sysroot.Root() + "/controller";
    const RunResult result = RunKestcfg({"--json", "sim", "init", root});
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ("sysroot=\"" + root +
                  "\"\nfiles/0=\"/etc/korvane/version\"\n"
                  "files/1=\"/etc/korvane/share/vqsysdiag.ini\"\n"
                  "files/2=\"/usr/share/vqsysapi/timezone.ini\"\nfiles/3=\"/sbin/hwclock\"\n"
                  "files/4=\"/usr/local/korvane/bin/fwupdate\"\nfiles/5=\"/dev/rtc0\"\n"
                  "files/6=\"/var/lib/vqtargetcfg/state.ini\"\n",
              FlattenJson(result.out));
    EXPECT_EQ("22.5.0\n", ReadWhole(root + "/etc/korvane/version"));
    EXPECT_EQ(ReadWhole(KESTCFG_SOURCE_DATA_DIR "/timezone.ini"),
              ReadWhole(root + "/usr/share/vqsysapi/timezone.ini"));
    for (const auto& [path, mode] : {std::pair{"", 0700},
                                     {"/sbin/hwclock", 0755},
                                     {"/usr/local/korvane/bin/fwupdate", 0755}}) {
        EXPECT_EQ(std::filesystem::perms(mode), std::filesystem::status(root + path).permissions());
    }
}

TEST(KestcfgSimTest, InitNeedsANewOrEmptyDirectory) {
    kest::test::TempSysroot sysroot;
    sysroot.WriteFile("/existing", "keep me\n");
    // Empty, but others could replace the tool stand-ins in it.
    for (const char* open : {"/shared", "/group", "/theirs"}) {
        sysroot.MakeDirectory(open);
    }
    chmod(sysroot.PathOf("/shared").c_str(), 01777);
    chmod(sysroot.PathOf("/group").c_str(), 0770);
    ASSERT_EQ(0, chown(sysroot.PathOf("/theirs").c_str(), 65534, 65534));
    ASSERT_EQ(0, symlink(sysroot.PathOf("/group").c_str(), sysroot.PathOf("/link").c_str()));
    for (const std::string& directory :
         {sysroot.Root(), sysroot.PathOf("/existing"), std::string("/"), sysroot.PathOf("/shared"),
          sysroot.PathOf("/group"), sysroot.PathOf("/theirs"), sysroot.PathOf("/link")}) {
        SCOPED_TRACE(directory);
        const RunResult result = RunKestcfg({"sim", "init", directory});
        EXPECT_EQ(3, result.exitCode);
        EXPECT_EQ(0u, result.err.find("kestcfg: ")) << result.err;
    }
    EXPECT_EQ("keep me\n", sysroot.ReadFile("/existing"));
    EXPECT_FALSE(sysroot.Exists("/sbin"));
    for (const char* open : {"/shared", "/group", "/theirs"}) {
        EXPECT_FALSE(sysroot.Exists(std::string(open) + "/sbin")) << open;
    }
}

TEST(KestcfgSimTest, AUserWithoutRootMakesAndUsesADemoControllerOfTheirOwn) {
    if (getuid() != 0) {
        GTEST_SKIP() << "dropping privileges needs root";
    }
    kest::test::TempSysroot sysroot;
    ASSERT_EQ(0, chmod(sysroot.Root().c_str(), 0755));
    const std::string home = sysroot.Root() + "/home";
    ASSERT_EQ(0, mkdir(home.c_str(), 0700));
    ASSERT_EQ(0, chown(home.c_str(), 65534, 65534));
    const std::string root = home + "/controller";
    std::vector<std::vector<std::string>> steps = {
        {"sim", "init", root},
        {"--sysroot", root, "get", "chassis", "comment"},
        {"--sysroot", root, "set", "chassis", "comment=mine", "web-service=true"},
        {"--sysroot", root, "set", "eth0", "polling-interval=250"},
        {"--sysroot", root, "firmware", "eth0", root + "/etc/korvane/version"},
        {"--sysroot", root, "firmware-status"},
    };
    if (kest::test::cfg::KestcfgStartsItself()) {
        steps.push_back(
            {"--sysroot", root, "set", "eth0", "polling-interval=260", "--confirm-within", "60"});
        steps.push_back({"--sysroot", root, "confirm"});
    }
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        if (setgroups(0, nullptr) != 0 || setgid(65534) != 0 || setuid(65534) != 0) {
            _exit(100);
        }
        for (size_t i = 0; i < steps.size(); ++i) {
            const RunResult result = RunKestcfg(steps[i]);
            if (result.exitCode != 0) {
                fprintf(stderr, "step %zu: %s", i, result.err.c_str());
                _exit(static_cast<int>(i) + 1);
            }
        }
        _exit(0);
    }
    int status = 0;
    ASSERT_EQ(child, waitpid(child, &status, 0));
    ASSERT_TRUE(WIFEXITED(status));
    EXPECT_EQ(0, WEXITSTATUS(status)) << "the step that failed, counting from 1";
    EXPECT_NE(std::string::npos,
              ReadWhole(root + "/var/lib/vqtargetcfg/state.ini").find("UserComment=mine\n"));
    EXPECT_NE(std::string::npos, ReadWhole(root + "/var/log/fwupdate.log").find(" 3\n"));
}

}  // namespace

}  // namespace kest::test::cfg
