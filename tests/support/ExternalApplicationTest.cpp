#include "support/ExternalApplication.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>

#include <gtest/gtest.h>

#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/TextConversion.h"

namespace {

using vq::dsc::osdep::ExternalApplication;
using Mode = ExternalApplication::LaunchMode;
using State = ExternalApplication::State;

// Starts "/bin/sh -c script".
void StartShell(ExternalApplication& application, const std::wstring& script) {
    ASSERT_TRUE(application.Start(L"/bin/sh", {L"-c", script}));
}

// True when the process no longer exists at all, not even as a zombie.
bool IsGoneAndReaped(pid_t pid) {
    int status = 0;
    return waitpid(pid, &status, WNOHANG) == -1 && errno == ECHILD;
}

struct ExitCase {
    const wchar_t* script;
    int32_t expectedResult;
};

class ExitResultTest : public ::testing::TestWithParam<std::tuple<Mode, ExitCase>> {};

TEST_P(ExitResultTest, WaitRecordsExitStatusOrMinusSignal) {
    ExternalApplication application(std::get<0>(GetParam()));
    StartShell(application, std::get<1>(GetParam()).script);
    EXPECT_EQ(application.GetState(), State::Running);
    EXPECT_TRUE(application.Wait());
    EXPECT_EQ(application.GetState(), State::Finished);
    EXPECT_EQ(application.ExitResult(), std::get<1>(GetParam()).expectedResult);
}

INSTANTIATE_TEST_SUITE_P(
    ModesAndResults, ExitResultTest,
    ::testing::Combine(::testing::Values(Mode::Default, Mode::Fork, Mode::Vfork),
                       ::testing::Values(ExitCase{L"exit 0", 0}, ExitCase{L"exit 1", 1},
                                         ExitCase{L"exit 7", 7}, ExitCase{L"kill -9 $$", -9})));

TEST(ExternalApplicationTest, ProgramThatCannotBeExecutedExitsWithOne) {
    for (Mode mode : {Mode::Fork, Mode::Vfork}) {
        ExternalApplication application(mode);
        ASSERT_TRUE(application.Start(L"/nonexistent/program", {}));
        EXPECT_TRUE(application.Wait());
        EXPECT_EQ(application.ExitResult(), 1);
    }
}

TEST(ExternalApplicationTest, SecondStartIsRefused) {
    ExternalApplication application;
    StartShell(application, L"exit 0");
    EXPECT_THROW(application.Start(L"/bin/true", {}), vq::dsc::exception::InvalidOperation);
    EXPECT_FALSE(application.Start(L"/bin/true", {}, true));
    EXPECT_TRUE(application.Wait());
}

TEST(ExternalApplicationTest, InvalidLaunchModeFailsEveryStart) {
    ExternalApplication application(static_cast<Mode>(3));
    EXPECT_THROW(application.Start(L"/bin/true", {}), vq::dsc::osdep::PosixError);
    ExternalApplication quiet(static_cast<Mode>(3));
    EXPECT_FALSE(quiet.Start(L"/bin/true", {}, true));
    EXPECT_EQ(quiet.GetState(), State::StartAttempted);
    EXPECT_TRUE(quiet.Wait());
}

TEST(ExternalApplicationTest, WaitWithoutStartReturnsAtOnce) {
    ExternalApplication application;
    EXPECT_TRUE(application.Wait(-1));
}

TEST(ExternalApplicationTest, ZeroTimeOutChecksOnceWithoutBlocking) {
    ExternalApplication application;
    StartShell(application, L"exec sleep 30");
    EXPECT_FALSE(application.Wait(0, false, true));
    EXPECT_EQ(application.GetState(), State::Running);
    EXPECT_EQ(kill(application.ProcessId(), 0), 0);
    EXPECT_THROW(application.Wait(0), vq::dsc::exception::Timeout);
    kill(application.ProcessId(), SIGKILL);
    EXPECT_TRUE(application.Wait());
    EXPECT_EQ(application.ExitResult(), -9);
}

TEST(ExternalApplicationTest, TimeOutWithoutKillLeavesChildRunning) {
    ExternalApplication application;
    StartShell(application, L"exec sleep 30");
    const auto start = std::chrono::steady_clock::now();
    EXPECT_THROW(application.Wait(250), vq::dsc::exception::Timeout);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(250));
    EXPECT_EQ(application.GetState(), State::Running);
    kill(application.ProcessId(), SIGKILL);
    EXPECT_TRUE(application.Wait());
}

TEST(ExternalApplicationTest, TimeOutWithKillKillsAndReapsChild) {
    for (bool noThrow : {true, false}) {
        ExternalApplication application;
        StartShell(application, L"exec sleep 30");
        if (noThrow) {
            EXPECT_FALSE(application.Wait(150, true, true));
        } else {
            EXPECT_THROW(application.Wait(150, true), vq::dsc::exception::Timeout);
        }
        EXPECT_EQ(application.GetState(), State::Finished);
        EXPECT_EQ(application.ExitResult(), -9);
        EXPECT_TRUE(IsGoneAndReaped(application.ProcessId()));
        EXPECT_TRUE(application.Wait(0));
    }
}

TEST(ExternalApplicationTest, ChildRunsInWorkingDirectory) {
    kest::test::TempSysroot directory;
    ExternalApplication application;
    application.SetWorkingDirectory(vq::dsc::WideFromNarrow(directory.Root()));
    StartShell(application, L"pwd > where");
    ASSERT_TRUE(application.Wait());
    EXPECT_EQ(directory.ReadFile("/where"), directory.Root() + "\n");
}

TEST(ExternalApplicationTest, MissingWorkingDirectoryIsRefused) {
    ExternalApplication application;
    application.SetWorkingDirectory(L"/nonexistent/directory");
    EXPECT_THROW(application.Start(L"/bin/true", {}), vq::dsc::exception::NonexistentException);
    EXPECT_EQ(application.GetState(), State::StartAttempted);
    EXPECT_TRUE(application.Wait());
}

struct SplitCase {
    const wchar_t* commandLine;
    std::vector<std::wstring> arguments;
};

class SplitCommandLineTest : public ::testing::TestWithParam<SplitCase> {};

TEST_P(SplitCommandLineTest, CutsAtWhitespaceRuns) {
    EXPECT_EQ(ExternalApplication::SplitCommandLine(GetParam().commandLine), GetParam().arguments);
}

INSTANTIATE_TEST_SUITE_P(Texts, SplitCommandLineTest,
                         ::testing::Values(SplitCase{L"  a   b  ", {L"a", L"b"}},
                                           SplitCase{L"", {}}, SplitCase{L" \t\r\n", {}},
                                           SplitCase{L"--systohc --noadjfile --utc",
                                                     {L"--systohc", L"--noadjfile", L"--utc"}},
                                           SplitCase{L"x\ty\nz\rw", {L"x", L"y", L"z", L"w"}},
                                           SplitCase{L"'a b'", {L"'a", L"b'"}}));

TEST(ExternalApplicationTest, CommandLineArgumentsReachTheProgram) {
    kest::test::TempSysroot sysroot;
    sysroot.WriteScript("/bin/args", "printf '%s|' \"$0\" \"$@\" > \"$KEST_SYSROOT/args\"\n");
    ExternalApplication application;
    const std::wstring program = vq::dsc::WideFromNarrow(sysroot.PathOf("/bin/args"));
    ASSERT_TRUE(application.StartCommandLine(program, L"  a \t b\n"));
    ASSERT_TRUE(application.Wait());
    EXPECT_EQ(sysroot.ReadFile("/args"), sysroot.PathOf("/bin/args") + "|a|b|");
}

// Sends the child's standard output to a file before the program runs.
class RedirectingApplication : public ExternalApplication {
  public:
    RedirectingApplication(Mode mode, std::string output)
        : ExternalApplication(mode), output_(std::move(output)) {}

  protected:
    void PrepareChild() override {
        const int file = open(output_.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
        dup2(file, STDOUT_FILENO);
        close(file);
    }

  private:
    std::string output_;
};

TEST(ExternalApplicationTest, ChildHookRunsOnlyInForkMode) {
    kest::test::TempSysroot directory;
    RedirectingApplication forked(Mode::Fork, directory.PathOf("/forked"));
    ASSERT_TRUE(forked.Start(L"/bin/echo", {L"hello"}));
    ASSERT_TRUE(forked.Wait());
    EXPECT_EQ(directory.ReadFile("/forked"), "hello\n");

    RedirectingApplication vforked(Mode::Vfork, directory.PathOf("/vforked"));
    ASSERT_TRUE(vforked.Start(L"/bin/true", {}));
    ASSERT_TRUE(vforked.Wait());
    EXPECT_FALSE(directory.Exists("/vforked"));
}

}  // namespace
