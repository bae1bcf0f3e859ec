// Initialize as a host sees it: the diagnostics settings file decides which failures reach the
// trace log, and where the log goes. The tracer fixes its log path once per process, so each
// host session runs in a child process of its own and the test reads the files it left.
#include <glob.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <regex>
#include <string>
#include <vector>

#include "ExpertHost.h"
#include "common/ChildProcess.h"

namespace kest::test::e2e {
namespace {

constexpr char kSettingsPath[] = "/etc/korvane/share/vqsysdiag.ini";
constexpr char kPrimaryLogDirectory[] = "/etc/korvane/share/vqsyslog";
constexpr char kFallbackLogDirectory[] = "/var/local/korvane/vqsyslog";

class ExpertInitializeTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(kSystemState);
        ExpertHostTest::SetUp();
    }

    // In a child process: Initialize, ask for an item that does not exist (a failure traced under
    // the error bit), Uninitialize. The child's exit code: 0 when every status was the expected
    // one; -1 when it did not exit.
    int SessionWithFailedLookup() {
        const int status = kest::test::WaitForChild(kest::test::StartChild([this] {
            IuxSysPropertyBag* bag = nullptr;
            _exit(expert->Initialize() != S_OK                                        ? 1
                  : expert->GetPropertiesOfItem(L"eth7", &bag) != UX_E_ITEM_NOT_FOUND ? 2
                  : expert->Uninitialize() != S_OK                                    ? 3
                                                                                      : 0);
        }));
        return status != -1 && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

    // The names of the trace logs in the log directory `systemPath`.
    std::vector<std::string> TraceLogs(const std::string& systemPath) const {
        static const std::regex logName(".*/[0-9]{8}_[0-9]{6}-uxTracer-[0-9A-F]{8}\\.log");
        glob_t found{};
        glob(sysroot.PathOf(systemPath + "/*").c_str(), 0, nullptr, &found);
        std::vector<std::string> logs;
        std::copy_if(found.gl_pathv, found.gl_pathv + found.gl_pathc, std::back_inserter(logs),
                     [](const char* path) { return std::regex_match(path, logName); });
        globfree(&found);
        return logs;
    }

    // The content of the one trace log in `systemPath` (empty when there is none).
    std::string TraceLogText(const std::string& systemPath) const {
        const std::vector<std::string> logs = TraceLogs(systemPath);
        EXPECT_LE(logs.size(), 1u);
        return logs.empty() ? std::string()
                            : sysroot.ReadFile(logs[0].substr(sysroot.Root().size()));
    }
};

const std::regex kNotFoundRecord(
    "  Failure to get properties of item\\(-2147220619\\)\n"
    "  Thread = 0x[0-9A-F]+, Time = [0-9]{8} [0-9]{6}\\.[0-9]{3}\n");

TEST_F(ExpertInitializeTest, ExistingSharedLogDirectoryIsPreferred) {
    sysroot.MakeDirectory(kPrimaryLogDirectory);
    sysroot.WriteFile(kSettingsPath, "[AllComponents]\nSeverity = 0x12\n[vqsyscfg]\nSeverity=18\n");
    ASSERT_EQ(0, SessionWithFailedLookup());
    const std::string log = TraceLogText(kPrimaryLogDirectory);
    EXPECT_NE(std::string::npos, log.find("  CuxNetConfigExpert::Initialize()\n")) << log;
    EXPECT_NE(std::string::npos, log.find("  CuxNetConfigExpert::GetPropertiesOfItem()\n"));
    EXPECT_TRUE(std::regex_search(log, kNotFoundRecord)) << log;
    EXPECT_FALSE(sysroot.Exists(kFallbackLogDirectory));
}

TEST_F(ExpertInitializeTest, DiagnosticsSettingsDecideWhetherTheErrorReachesTheLog) {
    const std::string shared = "[AllComponents]\nSeverity = 2\n";
    const std::pair<std::string, bool> cases[] = {
        {"[vqsyscfg]\nSeverity = 2\n", true},
        {shared, true},
        {shared + "[vqsyscfg]\nSeverity = 1\n", false},  // the own section wins
        {"[vqsyscfg]\nSeverity = -2\n" + shared, true},
        {"[vqsyscfg]\nSeverity = 2x\n" + shared, true},
        {"[vqsyscfg]\nSeverity = 9\n" + shared, false},
        {"[vqsyscfg]\nSeverity = \"  \"\n" + shared, true},
        {"[vqsyscfg]\nSeverity = \" +2 \"\n", true},
        {"[vqsyscfg]\nSeverity = 4294967298\n", false},
        {"[vqsyscfg]\nSeverity = 2\nTarget = 0\n", false},
    };
    for (const auto& [settings, traced] : cases) {
        ASSERT_EQ(0,
                  std::system(("rm -rf '" + sysroot.PathOf(kFallbackLogDirectory) + "'").c_str()));
        sysroot.WriteFile(kSettingsPath, settings);
        ASSERT_EQ(0, SessionWithFailedLookup());
        EXPECT_EQ(traced, std::regex_search(TraceLogText(kFallbackLogDirectory), kNotFoundRecord))
            << settings;
    }
}

// What another user planted where the log directory belongs: Initialize succeeds, tracing goes
// on without the log file, and nothing lands where a link points.
TEST_F(ExpertInitializeTest, PlantedEntriesWhereTheLogDirectoryBelongsLeaveTracingWithoutIt) {
    sysroot.WriteFile(kSettingsPath, "[vqsyscfg]\nSeverity = 2\n");
    sysroot.MakeDirectory("/elsewhere");
    sysroot.WriteFile("/var/local/korvane", "a file where a directory belongs\n");
    EXPECT_EQ(0, SessionWithFailedLookup());
    EXPECT_EQ("", TraceLogText(kFallbackLogDirectory));

    // A link of another user in a directory everyone may write, without the sticky bit, as an
    // earlier installation left it.
    const std::string korvane = sysroot.PathOf("/var/local/korvane");
    ASSERT_EQ(0, unlink(korvane.c_str()));
    sysroot.MakeDirectory("/var/local/korvane");
    ASSERT_EQ(0, chmod(korvane.c_str(), 0777));
    ASSERT_EQ(0, symlink(sysroot.PathOf("/elsewhere").c_str(), (korvane + "/vqsyslog").c_str()));
    ASSERT_EQ(0, lchown((korvane + "/vqsyslog").c_str(), 65534, 65534));
    EXPECT_EQ(0, SessionWithFailedLookup());
    EXPECT_TRUE(TraceLogs("/elsewhere").empty());
}

}  // namespace
}  // namespace kest::test::e2e
