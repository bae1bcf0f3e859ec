#include <sys/statvfs.h>
#include <unistd.h>

#include <atomic>
#include <optional>
#include <regex>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "TraceTestSupport.h"
#include "common/TempSysroot.h"
#include "support/PathHelpers.h"
#include "support/TraceGate.h"
#include "trace/FreeSpace.h"
#include "trace/TraceLog.h"
#include "trace/Tracer.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::trace {

using kest::test::TempSysroot;

namespace {

constexpr uint32_t kAllOutputs = kTraceToLogFile | kTraceToStandardOutput | kTraceToStandardError;
const std::regex kStampLine(R"(  Thread = 0x[0-9A-F]+, Time = \d{8} \d{6}[.,]\d{3})");

std::atomic<int> measurements{0};
std::atomic<uint64_t> reportedFreeBytes{0};

int32_t FakeMeasure(const char*, uint64_t*, uint64_t* freeBytes) {
    ++measurements;
    *freeBytes = reportedFreeBytes;
    return 0;
}

std::wstring Wide(const std::string& text) {
    return std::wstring(text.begin(), text.end());
}

// A sysroot with an empty log directory "/log", and standard error captured.
class TracerFixture {
  public:
    TracerFixture() { sysroot_.MakeDirectory("/log"); }

    std::string LogDirectory() const { return sysroot_.PathOf("/log"); }
    std::vector<std::string> LogFiles() const { return EntriesOf(LogDirectory()); }
    // The content of the only log file (empty when there is none).
    std::string LogText() const {
        std::vector<std::string> files = LogFiles();
        EXPECT_LE(files.size(), 1u);
        return files.empty() ? std::string() : sysroot_.ReadFile("/log/" + files[0]);
    }
    const TempSysroot& Sysroot() const { return sysroot_; }

    StreamCapture& Errors() { return errors_; }

  private:
    TempSysroot sysroot_;
    StreamCapture errors_{2, sysroot_.PathOf("/stderr.txt")};
};

TEST(TracerTest, NothingBeforeInitialisationOrUnderMaskZeroThenWholeRecords) {
    RunInChild([] {
        TracerFixture fixture;
        StreamCapture output(1, fixture.Sysroot().PathOf("/stdout.txt"));
        TraceLine(' ', "before initialisation", true);
        InitializeTracing(0, kAllOutputs, Wide(fixture.LogDirectory()), 0);
        TraceIfEnabled("masked", 0xFFFFFFFF);
        EXPECT_TRUE(fixture.LogFiles().empty());
        InitializeTracing(kTraceErrors, kAllOutputs, Wide(fixture.LogDirectory()), 0);
        EXPECT_EQ(GetTraceMask(), kTraceErrors);
        TraceStatus("Failure to persist property changes", E_FAIL);
        TraceLine(' ', "single line", false);
        TraceIfEnabled(std::string(3000, 'x'), kTraceErrors);

        std::vector<std::string> files = fixture.LogFiles();
        ASSERT_EQ(files.size(), 1u);
        char pid[16];
        snprintf(pid, sizeof pid, "%08lX", static_cast<unsigned long>(getpid()));
        EXPECT_TRUE(std::regex_match(
            files[0], std::regex(R"(\d{8}_\d{6}-uxTracer-)" + std::string(pid) + R"(\.log)")));
        std::vector<std::string> lines = LinesOf(fixture.LogText());
        ASSERT_EQ(lines.size(), 5u);
        EXPECT_EQ(lines[0], "  Failure to persist property changes(-2147467259)");
        EXPECT_TRUE(std::regex_match(lines[1], kStampLine)) << lines[1];
        EXPECT_EQ(lines[2], "  single line");
        EXPECT_EQ(lines[3], "  " + std::string(2045, 'x'));
        EXPECT_TRUE(std::regex_match(lines[4], kStampLine)) << lines[4];
        EXPECT_EQ(fixture.Errors().Text(), fixture.LogText());
        EXPECT_EQ(output.Text(), fixture.LogText());
    });
}

TEST(TracerTest, ShortSpaceAtTheFirstLineCreatesNoFileButStandardErrorGoesOn) {
    RunInChild([] {
        TracerFixture fixture;
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        reportedFreeBytes = 1000;
        InitializeTracing(kTraceErrors, kTraceToLogFile | kTraceToStandardError,
                          Wide(fixture.LogDirectory()), 2000);
        TraceLine(' ', "first", false);
        reportedFreeBytes = 1u << 30;
        TraceLine(' ', "second", false);
        EXPECT_TRUE(fixture.LogFiles().empty());
        EXPECT_EQ(fixture.Errors().Text(), "  first\n  second\n");
    });
}

TEST(TracerTest, ThresholdZeroNeverMeasuresAndTheAbortMessageEndsTheFile) {
    RunInChild([] {
        TracerFixture fixture;
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        reportedFreeBytes = 0;
        uint32_t outputs = kTraceToLogFile | kTraceToStandardError;
        InitializeTracing(kTraceErrors, outputs, Wide(fixture.LogDirectory()), 0);
        TraceLine(' ', "unmeasured", false);
        EXPECT_EQ(measurements, 0);
        reportedFreeBytes = 4096;
        InitializeTracing(kTraceErrors, outputs, Wide(fixture.LogDirectory()), 4096);
        TraceLine(' ', "enough", false);
        reportedFreeBytes = 4095;
        TraceLine(' ', "short", false);
        reportedFreeBytes = 1u << 30;
        TraceLine(' ', "later", false);
        const std::string abort = kest::trace::kAbortMessage;
        EXPECT_EQ(fixture.LogText(), "  unmeasured\n  enough\n" + abort + "\n");
        EXPECT_EQ(fixture.Errors().Text(), "  unmeasured\n  enough\n" + abort + "\n  later\n");
    });
}

TEST(TracerTest, WithAThresholdEveryLineOfARecordIsMeasuredBeforeItIsWritten) {
    RunInChild([] {
        TracerFixture fixture;
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        reportedFreeBytes = 4096;
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.LogDirectory()), 4096);
        TraceIfEnabled("record", kTraceErrors);
        EXPECT_EQ(measurements, 3);  // before opening, then before each of the two lines
        std::vector<std::string> lines = LinesOf(fixture.LogText());
        ASSERT_EQ(lines.size(), 2u);
        EXPECT_EQ(lines[0], "  record");
        EXPECT_TRUE(std::regex_match(lines[1], kStampLine)) << lines[1];
    });
}

TEST(TracerTest, FreeSpaceBeyondThirtyTwoBitsIsMeasuredWhole) {
    TempSysroot sysroot;
    struct statvfs status;
    ASSERT_EQ(statvfs(sysroot.Root().c_str(), &status), 0);
    uint64_t freeBytes = uint64_t(status.f_frsize) * status.f_bfree;
    if (freeBytes < (uint64_t(1) << 32) + (uint64_t(1) << 30)) {
        GTEST_SKIP() << "needs more than 5 GiB free to measure beyond 32 bits";
    }
    RunInChild([] {
        TracerFixture fixture;
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.LogDirectory()), UINT32_MAX);
        TraceLine(' ', "room enough", false);
        EXPECT_EQ(fixture.LogText(), "  room enough\n");
    });
}

struct DirectoryCase {
    std::string suffix;
    std::string expectedDirectory;
};

class TracerDirectoryTest : public ::testing::TestWithParam<DirectoryCase> {};

TEST_P(TracerDirectoryTest, OneSeparatorBetweenDirectoryAndFileName) {
    RunInChild([param = GetParam()] {
        TracerFixture fixture;
        InitializeTracing(kTraceErrors, kTraceToLogFile,
                          Wide(fixture.LogDirectory() + param.suffix), 0);
        TraceLine(' ', "here", false);
        EXPECT_THAT(EntriesOf(fixture.Sysroot().PathOf(param.expectedDirectory)),
                    ::testing::Contains(::testing::HasSubstr("-uxTracer-")));
    });
}

INSTANTIATE_TEST_SUITE_P(Separators, TracerDirectoryTest,
                         ::testing::Values(DirectoryCase{"", "/log"}, DirectoryCase{"/", "/log"},
                                           DirectoryCase{"\\", "/"}));

TEST(TracerTest, LaterInitialisationsChangeOutputsButNotThePath) {
    RunInChild([] {
        TracerFixture fixture;
        fixture.Sysroot().MakeDirectory("/other");
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.LogDirectory()), 0);
        TraceLine(' ', "first", false);
        InitializeTracing(kTraceErrors, kTraceToStandardError,
                          Wide(fixture.Sysroot().PathOf("/other")), 0);
        TraceLine(' ', "second", false);
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.Sysroot().PathOf("/other")),
                          0);
        TraceLine(' ', "third", false);
        ShutdownTracing();
        TraceLine(' ', "after shutdown", false);
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.Sysroot().PathOf("/other")),
                          0);
        TraceLine(' ', "fourth", false);
        EXPECT_EQ(fixture.LogText(), "  first\n  third\n  fourth\n");
        EXPECT_TRUE(EntriesOf(fixture.Sysroot().PathOf("/other")).empty());
        EXPECT_EQ(fixture.Errors().Text(), "  second\n");
    });
}

TEST(TracerTest, OverlongPathTurnsFileOutputOffAndOtherOutputsGoOn) {
    RunInChild([] {
        TracerFixture fixture;
        std::string deep = fixture.LogDirectory();
        while (deep.size() < kest::trace::kMaxLogPathLength - 30) {
            deep += "/abcdefghij";
        }
        vq::dsc::osdep::CreateDirectories(deep, 0755);
        InitializeTracing(kTraceErrors, kTraceToLogFile | kTraceToStandardError, Wide(deep), 0);
        TraceLine(' ', "still on standard error", false);
        EXPECT_EQ(fixture.Errors().Text(), "  still on standard error\n");
        // Neither the whole name nor a name cut at 255 bytes appears.
        EXPECT_TRUE(EntriesOf(deep).empty());
    });
}

TEST(TracerTest, PlantedLinksAtTheLogPathAreNeverFollowed) {
    RunInChild([] {
        TracerFixture fixture;
        fixture.Sysroot().WriteFile("/victim", "untouched\n");
        std::string victim = fixture.Sysroot().PathOf("/victim");
        // The first initialisation names the log; its lock file shows the name.
        InitializeTracing(kTraceErrors, kTraceToStandardError, L"", 0);
        std::vector<std::string> locks =
            EntriesOf(fixture.Sysroot().PathOf("/var/tmp/korvane/shared/mutex"));
        ASSERT_EQ(locks.size(), 1u);
        std::string logPath = fixture.LogDirectory() + "/" + locks[0];
        ASSERT_EQ(symlink(victim.c_str(), logPath.c_str()), 0);
        InitializeTracing(kTraceErrors, kTraceToLogFile | kTraceToStandardError,
                          Wide(fixture.LogDirectory()), 0);
        TraceLine(' ', "through a symbolic link", false);
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        ASSERT_EQ(link(victim.c_str(), logPath.c_str()), 0);
        TraceLine(' ', "through a hard link", false);
        EXPECT_EQ(fixture.Sysroot().ReadFile("/victim"), "untouched\n");
        EXPECT_EQ(fixture.Errors().Text(), "  through a symbolic link\n  through a hard link\n");
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        TraceLine(' ', "own file", false);
        EXPECT_EQ(fixture.LogText(), "  own file\n");
    });
}

TEST(TracerTest, ALogFileOfAnotherUserTurnsFileOutputOffForGood) {
    RunInChild([] {
        TracerFixture fixture;
        InitializeTracing(kTraceErrors, kTraceToStandardError, L"", 0);
        std::vector<std::string> locks =
            EntriesOf(fixture.Sysroot().PathOf("/var/tmp/korvane/shared/mutex"));
        ASSERT_EQ(locks.size(), 1u);
        fixture.Sysroot().WriteFile("/log/" + locks[0], "theirs\n");
        const std::string logPath = fixture.LogDirectory() + "/" + locks[0];
        ASSERT_EQ(chown(logPath.c_str(), 65534, 65534), 0);
        InitializeTracing(kTraceErrors, kTraceToLogFile | kTraceToStandardError,
                          Wide(fixture.LogDirectory()), 0);
        TraceLine(' ', "refused", false);
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        TraceLine(' ', "still off", false);
        EXPECT_EQ(fixture.Errors().Text(), "  refused\n  still off\n");
        EXPECT_TRUE(fixture.LogFiles().empty());
    });
}

TEST(TracerTest, ProcessesTracingToOneLogNeverInterleaveInsideARecord) {
    RunInChild([] {
        TracerFixture fixture;
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.LogDirectory()), 0);
        constexpr int kChildren = 4;
        constexpr int kRecords = 300;
        std::vector<pid_t> children;
        for (int c = 0; c < kChildren; ++c) {
            pid_t child = fork();
            if (child == 0) {
                for (int r = 0; r < kRecords; ++r) {
                    std::string text = "child " + std::to_string(c) + " record " +
                                       std::to_string(r) + " " +
                                       std::string(200, static_cast<char>('a' + c));
                    TraceIfEnabled(text, kTraceErrors);
                }
                _exit(0);
            }
            children.push_back(child);
        }
        for (pid_t child : children) {
            waitpid(child, nullptr, 0);
        }
        std::vector<std::string> lines = LinesOf(fixture.LogText());
        ASSERT_EQ(lines.size(), size_t(2 * kChildren * kRecords));
        std::vector<int> next(kChildren, 0);
        for (size_t i = 0; i < lines.size(); i += 2) {
            int c = 0;
            int r = 0;
            ASSERT_EQ(sscanf(lines[i].c_str(), "  child %d record %d", &c, &r), 2) << lines[i];
            ASSERT_TRUE(c >= 0 && c < kChildren);
            EXPECT_EQ(r, next[c]++);  // nothing lost, nothing reordered
            EXPECT_EQ(lines[i].substr(lines[i].size() - 200), std::string(200, 'a' + c));
            EXPECT_TRUE(std::regex_match(lines[i + 1], kStampLine)) << lines[i + 1];
        }
    });
}

}  // namespace

}  // namespace kest::test::trace
