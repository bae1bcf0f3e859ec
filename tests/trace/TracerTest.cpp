#include <sys/statvfs.h>
#include <unistd.h>

#include <atomic>
#include <functional>
#include <regex>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "support/PathHelpers.h"
#include "support/TraceGate.h"
#include "trace/FreeSpace.h"
#include "trace/TraceLog.h"
#include "trace/Tracer.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::trace {

using ::testing::ElementsAre;

namespace {

constexpr uint32_t kAllOutputs = kTraceToLogFile | kTraceToStandardOutput | kTraceToStandardError;
constexpr uint32_t kFileAndErrors = kTraceToLogFile | kTraceToStandardError;

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

bool IsStampLine(const std::string& line) {
    static const std::regex stamp(R"(  Thread = 0x[0-9A-F]+, Time = \d{8} \d{6}[.,]\d{3})");
    return std::regex_match(line, stamp);
}

// A sysroot with an empty log directory "/log", and standard error captured.
class TracerFixture {
  public:
    TracerFixture() { sysroot_.MakeDirectory("/log"); }

    // Traces errors to `outputs`, with the log file in the log directory.
    void Start(uint32_t outputs, uint32_t threshold = 0) const {
        InitializeTracing(kTraceErrors, outputs, Wide(LogDirectory()), threshold);
    }
    // The path the log file will have: a first initialisation names it, its lock file shows it.
    std::string LogPath() const {
        InitializeTracing(kTraceErrors, kTraceToStandardError, L"", 0);
        const std::vector<std::string> locks =
            EntriesOf(sysroot_.PathOf("/var/tmp/korvane/shared/mutex"));
        EXPECT_EQ(locks.size(), 1u);
        return locks.empty() ? std::string() : LogDirectory() + "/" + locks[0];
    }
    std::string LogDirectory() const { return sysroot_.PathOf("/log"); }
    std::vector<std::string> LogFiles() const { return EntriesOf(LogDirectory()); }
    // The content of the only log file (empty when there is none).
    std::string LogText() const {
        std::vector<std::string> files = LogFiles();
        EXPECT_LE(files.size(), 1u);
        return files.empty() ? std::string() : sysroot_.ReadFile("/log/" + files[0]);
    }
    const TempSysroot& Sysroot() const { return sysroot_; }
    std::string ErrorText() const { return errors_.Text(); }

  private:
    TempSysroot sysroot_;
    StreamCapture errors_{2, sysroot_.PathOf("/stderr.txt")};
};

// Runs `body` in a child process, with a fresh tracer and fixture.
void WithFreshTracer(const std::function<void(TracerFixture&)>& body) {
    RunInChild([&body] {
        TracerFixture fixture;
        body(fixture);
    });
}

TEST(TracerTest, NothingBeforeInitialisationOrUnderMaskZeroThenWholeRecords) {
    WithFreshTracer([](TracerFixture& fixture) {
        StreamCapture output(1, fixture.Sysroot().PathOf("/stdout.txt"));
        TraceLine(' ', "before initialisation", true);
        InitializeTracing(0, kAllOutputs, Wide(fixture.LogDirectory()), 0);
        TraceIfEnabled("masked", 0xFFFFFFFF);
        EXPECT_TRUE(fixture.LogFiles().empty());
        fixture.Start(kAllOutputs);
        EXPECT_EQ(GetTraceMask(), kTraceErrors);
        TraceStatus("Failure to persist property changes", E_FAIL);
        TraceLine(' ', "single line", false);
        TraceIfEnabled(std::string(3000, 'x'), kTraceErrors);

        std::vector<std::string> files = fixture.LogFiles();
        ASSERT_EQ(files.size(), 1u);
        char name[48];
        snprintf(name, sizeof name, R"(\d{8}_\d{6}-uxTracer-%08lX\.log)",
                 static_cast<unsigned long>(getpid()));
        EXPECT_TRUE(std::regex_match(files[0], std::regex(name))) << files[0];
        EXPECT_THAT(LinesOf(fixture.LogText()),
                    ElementsAre("  Failure to persist property changes(-2147467259)",
                                ::testing::Truly(IsStampLine), "  single line",
                                "  " + std::string(2045, 'x'), ::testing::Truly(IsStampLine)));
        EXPECT_EQ(fixture.ErrorText(), fixture.LogText());
        EXPECT_EQ(output.Text(), fixture.LogText());
    });
}

TEST(TracerTest, ShortSpaceAtTheFirstLineCreatesNoFileButStandardErrorGoesOn) {
    WithFreshTracer([](TracerFixture& fixture) {
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        reportedFreeBytes = 1000;
        fixture.Start(kFileAndErrors, 2000);
        TraceLine(' ', "first", false);
        reportedFreeBytes = 1u << 30;
        TraceLine(' ', "second", false);
        EXPECT_TRUE(fixture.LogFiles().empty());
        EXPECT_EQ(fixture.ErrorText(), "  first\n  second\n");
    });
}

// Later initialisations change outputs and threshold but not the path; with threshold 0 nothing
// is measured, and once space is short the abort message ends the file.
TEST(TracerTest, LaterInitialisationsKeepThePathAndTheAbortMessageEndsTheFile) {
    WithFreshTracer([](TracerFixture& fixture) {
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        fixture.Sysroot().MakeDirectory("/other");
        const std::wstring other = Wide(fixture.Sysroot().PathOf("/other"));
        fixture.Start(kTraceToLogFile);
        TraceLine(' ', "first", false);
        InitializeTracing(kTraceErrors, kTraceToStandardError, other, 0);
        TraceLine(' ', "second", false);
        InitializeTracing(kTraceErrors, kTraceToLogFile, other, 0);
        TraceLine(' ', "third", false);
        ShutdownTracing();
        TraceLine(' ', "after shutdown", false);
        InitializeTracing(kTraceErrors, kFileAndErrors, other, 0);
        TraceLine(' ', "unmeasured", false);
        EXPECT_EQ(measurements, 0);
        reportedFreeBytes = 4096;
        InitializeTracing(kTraceErrors, kFileAndErrors, other, 4096);
        TraceLine(' ', "enough", false);
        reportedFreeBytes = 4095;
        TraceLine(' ', "short", false);
        reportedFreeBytes = 1u << 30;
        TraceLine(' ', "later", false);
        const std::string abort = kest::trace::kAbortMessage;
        EXPECT_EQ(fixture.LogText(), "  first\n  third\n  unmeasured\n  enough\n" + abort + "\n");
        EXPECT_TRUE(EntriesOf(fixture.Sysroot().PathOf("/other")).empty());
        EXPECT_EQ(fixture.ErrorText(),
                  "  second\n  unmeasured\n  enough\n" + abort + "\n  later\n");
    });
}

TEST(TracerTest, WithAThresholdEveryLineOfARecordIsMeasuredBeforeItIsWritten) {
    WithFreshTracer([](TracerFixture& fixture) {
        kest::trace::SetFreeSpaceMeasure(&FakeMeasure);
        reportedFreeBytes = 4096;
        fixture.Start(kTraceToLogFile, 4096);
        TraceIfEnabled("record", kTraceErrors);
        EXPECT_EQ(measurements, 3);  // before opening, then before each of the two lines
        EXPECT_THAT(LinesOf(fixture.LogText()),
                    ElementsAre("  record", ::testing::Truly(IsStampLine)));
    });
}

TEST(TracerTest, FreeSpaceBeyondThirtyTwoBitsIsMeasuredWhole) {
    struct statvfs status;
    ASSERT_EQ(statvfs("/tmp", &status), 0);
    if (uint64_t(status.f_frsize) * status.f_bfree < (uint64_t(5) << 30)) {
        GTEST_SKIP() << "needs more than 5 GiB free to measure beyond 32 bits";
    }
    WithFreshTracer([](TracerFixture& fixture) {
        fixture.Start(kTraceToLogFile, UINT32_MAX);
        TraceLine(' ', "room enough", false);
        EXPECT_EQ(fixture.LogText(), "  room enough\n");
    });
}

// A final backslash is no separator. (Every other test names the log directory without a final
// separator; the expert's initialisation tests name it with a final '/'.)
TEST(TracerTest, ABackslashAfterTheDirectoryIsPartOfTheFileName) {
    WithFreshTracer([](TracerFixture& fixture) {
        InitializeTracing(kTraceErrors, kTraceToLogFile, Wide(fixture.LogDirectory() + "\\"), 0);
        TraceLine(' ', "here", false);
        EXPECT_THAT(EntriesOf(fixture.Sysroot().Root()),
                    ::testing::Contains(::testing::StartsWith("log\\")));
    });
}

TEST(TracerTest, OverlongPathTurnsFileOutputOffAndOtherOutputsGoOn) {
    WithFreshTracer([](TracerFixture& fixture) {
        std::string deep = fixture.LogDirectory();
        while (deep.size() < kest::trace::kMaxLogPathLength - 30) {
            deep += "/abcdefghij";
        }
        vq::dsc::osdep::CreateDirectories(deep, 0755);
        InitializeTracing(kTraceErrors, kFileAndErrors, Wide(deep), 0);
        TraceLine(' ', "still on standard error", false);
        EXPECT_EQ(fixture.ErrorText(), "  still on standard error\n");
        // Neither the whole name nor a name cut at 255 bytes appears.
        EXPECT_TRUE(EntriesOf(deep).empty());
    });
}

TEST(TracerTest, PlantedLinksAtTheLogPathAreNeverFollowed) {
    WithFreshTracer([](TracerFixture& fixture) {
        fixture.Sysroot().WriteFile("/victim", "untouched\n");
        const std::string victim = fixture.Sysroot().PathOf("/victim");
        const std::string logPath = fixture.LogPath();
        ASSERT_EQ(symlink(victim.c_str(), logPath.c_str()), 0);
        fixture.Start(kFileAndErrors);
        TraceLine(' ', "through a symbolic link", false);
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        ASSERT_EQ(link(victim.c_str(), logPath.c_str()), 0);
        TraceLine(' ', "through a hard link", false);
        EXPECT_EQ(fixture.Sysroot().ReadFile("/victim"), "untouched\n");
        EXPECT_EQ(fixture.ErrorText(), "  through a symbolic link\n  through a hard link\n");
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        TraceLine(' ', "own file", false);
        EXPECT_EQ(fixture.LogText(), "  own file\n");
    });
}

TEST(TracerTest, ALogFileOfAnotherUserTurnsFileOutputOffForGood) {
    WithFreshTracer([](TracerFixture& fixture) {
        const std::string logPath = fixture.LogPath();
        fixture.Sysroot().WriteFile(logPath.substr(fixture.Sysroot().Root().size()), "theirs\n");
        ASSERT_EQ(chown(logPath.c_str(), 65534, 65534), 0);
        fixture.Start(kFileAndErrors);
        TraceLine(' ', "refused", false);
        ASSERT_EQ(unlink(logPath.c_str()), 0);
        TraceLine(' ', "still off", false);
        EXPECT_EQ(fixture.ErrorText(), "  refused\n  still off\n");
        EXPECT_TRUE(fixture.LogFiles().empty());
    });
}

TEST(TracerTest, ProcessesTracingToOneLogNeverInterleaveInsideARecord) {
    WithFreshTracer([](TracerFixture& fixture) {
        fixture.Start(kTraceToLogFile);
        constexpr int kChildren = 4;
        constexpr int kRecords = 300;
        std::vector<pid_t> children;
        for (int c = 0; c < kChildren; ++c) {
            pid_t child = fork();
            if (child == 0) {
                for (int r = 0; r < kRecords; ++r) {
                    TraceIfEnabled("child " + std::to_string(c) + " record " + std::to_string(r) +
                                       " " + std::string(200, static_cast<char>('a' + c)),
                                   kTraceErrors);
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
            EXPECT_TRUE(IsStampLine(lines[i + 1])) << lines[i + 1];
        }
    });
}

}  // namespace

}  // namespace kest::test::trace
