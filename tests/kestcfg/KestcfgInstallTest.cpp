// kestcfg as "cmake --install" lays it out in a prefix: it finds its plug-in and data relative to
// itself, and the simulated controller library stays in the package's private directory.
#include <gtest/gtest.h>

#include <string>

#include "common/TempSysroot.h"
#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

TEST(KestcfgInstallTest, TheInstalledToolWorksOnADemoControllerWithTheSimulatorKeptApart) {
    kest::test::TempSysroot prefix;
    for (const char* component : {"", "simulator"}) {
        std::vector<std::string> arguments = {CMAKE_COMMAND_PATH, "--install", KEST_BINARY_DIR,
                                              "--prefix", prefix.Root()};
        if (*component != '\0') {
            arguments.insert(arguments.end(), {"--component", component});
        }
        const RunResult installed = RunProgram(arguments);
        ASSERT_EQ(0, installed.exitCode) << installed.err;
    }
    const std::string plugin = "/" KEST_PLUGIN_INSTALL_DIR "/libvqkestSysApiChassisExpert.so";
    for (const std::string& file :
         {plugin, std::string("/" KEST_SIMULATOR_INSTALL_DIR "/libvqtargetcfg.so.1"),
          std::string("/" KEST_DATA_INSTALL_DIR "/timezone.ini"),
          std::string("/include/uxsys/Expert.h"),
          std::string("/share/bash-completion/completions/kestcfg")}) {
        EXPECT_TRUE(prefix.Exists(file)) << file;
    }
    EXPECT_FALSE(prefix.Exists("/" KEST_PLUGIN_INSTALL_DIR "/libvqtargetcfg.so.1"));
    EXPECT_FALSE(prefix.Exists("/lib/libvqtargetcfg.so.1"));
    EXPECT_EQ(std::string::npos, ReadWhole(prefix.PathOf(plugin)).find(KEST_BINARY_DIR "/sim"))
        << "the installed plug-in keeps no search path to the simulator";
    if (KestcfgStartsItself()) {
        EXPECT_NE(std::string::npos,
                  ReadWhole(prefix.PathOf("/share/man/man1/kestcfg.1")).find(".SH DESCRIPTION"));
    }

    // The completion offers commands, property names and named values.
    const RunResult completed = RunProgram(
        {"/bin/bash", "-c",
         "source \"$0\"; complete() { COMP_WORDS=(\"$@\"); COMP_CWORD=$(($# - 1)); _kestcfg; "
         "echo \"${COMPREPLY[*]}\"; }; complete kestcfg fi; complete kestcfg set eth0 poll; "
         "complete kestcfg set eth0 adapter-mode=t",
         prefix.PathOf("/share/bash-completion/completions/kestcfg")});
    EXPECT_EQ("firmware firmware-status\npolling-mode= polling-interval=\nadapter-mode=tcpip\n",
              completed.out)
        << completed.err;

    const std::string kestcfg = prefix.PathOf("/bin/kestcfg");
    const std::string controller = prefix.Root() + "/controller";
    ASSERT_EQ(0, RunProgram(Kestcfg({"sim", "init", controller}, kestcfg)).exitCode);
    const RunResult set = RunProgram(
        Kestcfg({"--sysroot", controller, "set", "chassis", "comment=installed"}, kestcfg));
    EXPECT_EQ(0, set.exitCode) << set.err;
    EXPECT_NE(
        std::string::npos,
        ReadWhole(controller + "/var/lib/vqtargetcfg/state.ini").find("UserComment=installed"));
    const RunResult version = RunProgram(Kestcfg({"--simulator", "--version"}, kestcfg));
    EXPECT_EQ(
        "kestcfg 22.5\nplug-in 22.5 (" + prefix.Root() + "/bin/../" + plugin.substr(1) + ")\n",
        version.out)
        << version.err;
}

}  // namespace

}  // namespace kest::test::cfg
