#include "support/ExternalApplication.h"

#include <fcntl.h>
#include <pthread.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <set>

#include <gtest/gtest.h>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "support/Exceptions.h"
#include "support/TextConversion.h"

namespace kest::test::support {

namespace {

using vq::dsc::WideFromNarrow;
using vq::dsc::osdep::ExternalApplication;
using Mode = ExternalApplication::LaunchMode;
using State = ExternalApplication::State;
namespace exception = vq::dsc::exception;

void StartShell(ExternalApplication& application, const std::wstring& script) {
    ASSERT_TRUE(application.Start(L"/bin/sh", {L"-c", script}));
}

TEST(ExternalApplicationTest, WaitRecordsExitStatusOrMinusSignalInEveryMode) {
    const struct {
        Mode mode;
        const wchar_t* script;  // null: a program that cannot be executed
        int32_t result;
    } cases[] = {{Mode::Default, L"exit 0", 0},    {Mode::Fork, L"exit 1", 1},
                 {Mode::Vfork, L"exit 7", 7},      {Mode::Fork, L"kill -9 $$", -9},
                 {Mode::Vfork, L"kill -9 $$", -9}, {Mode::Fork, nullptr, 1},
                 {Mode::Vfork, nullptr, 1}};
    for (const auto& c : cases) {
        ExternalApplication application(c.mode);
        if (c.script != nullptr) {
            StartShell(application, c.script);
        } else {
            ASSERT_TRUE(application.Start(L"/nonexistent/program", {}));
        }
        EXPECT_EQ(application.GetState(), State::Running);
        EXPECT_TRUE(application.Wait());
        EXPECT_EQ(application.GetState(), State::Finished);
        EXPECT_EQ(application.ExitResult(), c.result) << (c.script ? c.script : L"not executable");
    }
}

TEST(ExternalApplicationTest, RefusedStartsLeaveNothingToWaitFor) {
    ExternalApplication twice;
    StartShell(twice, L"exit 0");
    EXPECT_THROW(twice.Start(L"/bin/true", {}), exception::InvalidOperation);
    EXPECT_FALSE(twice.Start(L"/bin/true", {}, true));
    EXPECT_TRUE(twice.Wait());

    ExternalApplication badMode(static_cast<Mode>(3));
    EXPECT_THROW(badMode.Start(L"/bin/true", {}), vq::dsc::osdep::PosixError);
    EXPECT_FALSE(ExternalApplication(static_cast<Mode>(3)).Start(L"/bin/true", {}, true));

    ExternalApplication missingDirectory;
    missingDirectory.SetWorkingDirectory(L"/nonexistent/directory");
    EXPECT_THROW(missingDirectory.Start(L"/bin/true", {}), exception::NonexistentException);
    for (ExternalApplication* application : {&badMode, &missingDirectory}) {
        EXPECT_EQ(application->GetState(), State::StartAttempted);
        EXPECT_TRUE(application->Wait());
    }
    EXPECT_TRUE(ExternalApplication().Wait());
}

TEST(ExternalApplicationTest, TimeOutKillsAndReapsTheChildOnlyWhenAsked) {
    ExternalApplication running;
    StartShell(running, L"exec sleep 30");
    EXPECT_FALSE(running.Wait(0, false, true));
    EXPECT_EQ(kill(running.ProcessId(), 0), 0);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_THROW(running.Wait(250), exception::Timeout);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(250));
    EXPECT_EQ(running.GetState(), State::Running);
    kill(running.ProcessId(), SIGKILL);
    EXPECT_TRUE(running.Wait());
    EXPECT_EQ(running.ExitResult(), -9);
    for (bool noThrow : {true, false}) {
        ExternalApplication application;
        StartShell(application, L"exec sleep 30");
        if (noThrow) {
            EXPECT_FALSE(application.Wait(150, true, true));
        } else {
            EXPECT_THROW(application.Wait(150, true), exception::Timeout);
        }
        EXPECT_EQ(application.GetState(), State::Finished);
        EXPECT_EQ(application.ExitResult(), -9);
        int status = 0;
        EXPECT_EQ(waitpid(application.ProcessId(), &status, WNOHANG), -1) << "zombie left";
        EXPECT_EQ(errno, ECHILD);
    }
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

TEST(ExternalApplicationTest,
     CommandLineSplitsAtWhitespaceRunsChildGetsWorkingDirectoryAndForkHook) {
    TempSysroot tree;
    tree.WriteScript("/bin/args", "printf '%s|' \"$0\" \"$@\" \"$(pwd)\"\n");
    RedirectingApplication forked(Mode::Fork, tree.PathOf("/forked"));
    forked.SetWorkingDirectory(WideFromNarrow(tree.PathOf("/bin")));
    // Runs of blanks, tabs and line ends separate the arguments; quotes are nothing special.
    ASSERT_TRUE(
        forked.StartCommandLine(WideFromNarrow(tree.PathOf("/bin/args")), L"  'a \t b'\n\rc\r  "));
    ASSERT_TRUE(forked.Wait());
    EXPECT_EQ(tree.ReadFile("/forked"),
              tree.PathOf("/bin/args") + "|'a|b'|c|" + tree.PathOf("/bin") + "|");
    for (const wchar_t* nothing : {L"", L" \t\r\n"}) {
        EXPECT_TRUE(ExternalApplication::SplitCommandLine(nothing).empty());
    }

    RedirectingApplication vforked(Mode::Vfork, tree.PathOf("/vforked"));
    ASSERT_TRUE(vforked.Start(L"/bin/true", {}));
    ASSERT_TRUE(vforked.Wait());
    EXPECT_FALSE(tree.Exists("/vforked")) << "the hook runs only after fork";
}

std::set<int> OpenDescriptors(pid_t pid) {
    std::set<int> descriptors;
    for (const auto& entry :
         std::filesystem::directory_iterator("/proc/" + std::to_string(pid) + "/fd")) {
        descriptors.insert(std::stoi(entry.path().filename()));
    }
    return descriptors;
}

// The host's state must not reach a started program: ignored and blocked signals, a descriptor
// without close-on-exec. SIGCHLD is ignored as some hosts do, which makes the system reap
// children at once. (The hardware-clock tests show the fixed environment, and an exit status
// arriving under such a host.) The child process set up as such a host ends with the test.
TEST(ExternalApplicationTest, ProgramStartsCleanAndItsStatusArrivesWhenTheHostIgnoresSigchld) {
    RunInChild([] {
        for (int ignored : {SIGINT, SIGPIPE, SIGCHLD}) {
            signal(ignored, SIG_IGN);
        }
        sigset_t blocked;
        sigemptyset(&blocked);
        sigaddset(&blocked, SIGUSR1);
        pthread_sigmask(SIG_BLOCK, &blocked, nullptr);
        const int stray = open("/dev/null", O_RDONLY);
        const int handedOver = open("/dev/null", O_RDONLY | O_CLOEXEC);
        for (Mode mode : {Mode::Fork, Mode::Vfork}) {
            ExternalApplication application(mode);
            application.SetInheritedDescriptors({handedOver});
            ASSERT_TRUE(application.Start(L"/bin/sleep", {L"30"}));
            const pid_t pid = application.ProcessId();
            const std::set<int> expected{0, 1, 2, handedOver};
            auto runs = [pid] {
                std::error_code error;
                const std::filesystem::path exe = "/proc/" + std::to_string(pid) + "/exe";
                return std::filesystem::read_symlink(exe, error).string().find("sleep") !=
                       std::string::npos;
            };
            // Right after exec the dynamic loader briefly holds the libraries it maps open: wait
            // until the program has settled; a descriptor that stays open still fails below.
            for (int attempt = 0; attempt < 2000 && (!runs() || OpenDescriptors(pid) != expected);
                 ++attempt) {
                usleep(5000);
            }
            ASSERT_TRUE(runs()) << "the program never ran";
            EXPECT_EQ(OpenDescriptors(pid), expected);
            std::ifstream in("/proc/" + std::to_string(pid) + "/status");
            const std::string status{std::istreambuf_iterator<char>(in), {}};
            for (const char* nothing :
                 {"\nSigIgn:\t0000000000000000\n", "\nSigBlk:\t0000000000000000\n"}) {
                EXPECT_NE(status.find(nothing), std::string::npos) << status;
            }
            EXPECT_EQ(getsid(pid), pid) << "own session";
            EXPECT_EQ(fcntl(handedOver, F_GETFD), FD_CLOEXEC) << "cleared in the child only";
            EXPECT_FALSE(application.Wait(0, true, true));
            EXPECT_EQ(application.ExitResult(), -9);
        }
        ExternalApplication closedDescriptor;
        closedDescriptor.SetInheritedDescriptors({stray + 100});
        EXPECT_THROW(closedDescriptor.Start(L"/bin/true", {}), vq::dsc::osdep::PosixError);
    });
}

}  // namespace

}  // namespace kest::test::support
