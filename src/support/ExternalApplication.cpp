#include "support/ExternalApplication.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <climits>

#include "support/Exceptions.h"
#include "support/PathHelpers.h"
#include "support/ProcessControl.h"
#include "support/TextConversion.h"
#include "support/WholeTransfer.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr int kChildFailureStatus = 1;
// Highest descriptor the fallback closes one by one when the limit is unbounded.
constexpr int kDescriptorScanLimit = 65536;

// What the intermediate process tells the parent: first Started (the program's pid) or
// NotStarted (an errno), later Ended (the program's wait status).
struct Report {
    enum Kind : int32_t { Started = 1, NotStarted = 2, Ended = 3 };
    int32_t kind;
    int32_t value;
};

bool IsCommandLineSeparator(wchar_t c) {
    return c == L' ' || c == L'\t' || c == L'\n' || c == L'\r';
}

int32_t ExitResultFromWaitStatus(int status) {
    if (WIFSIGNALED(status)) {
        return -WTERMSIG(status);
    }
    return WEXITSTATUS(status);
}

// One report with a single write (smaller than PIPE_BUF, so it arrives whole). Safe between
// fork and exec.
void SendReport(int descriptor, Report::Kind kind, int32_t value) {
    const Report report{kind, value};
    static_cast<void>(kest::WriteWhole(descriptor, &report, sizeof report));
}

// Reads one whole report; false at end of file or on failure.
bool ReceiveReport(int descriptor, Report& report) {
    return kest::ReadWhole(descriptor, &report, sizeof report);
}

// Closes descriptors `first` to `last`. Safe between fork and exec.
void CloseRange(int first, int last) {
#ifdef SYS_close_range
    if (syscall(SYS_close_range, static_cast<unsigned>(first), static_cast<unsigned>(last), 0) ==
        0) {
        return;
    }
#endif
    rlimit limit{};
    int end = kDescriptorScanLimit;
    if (getrlimit(RLIMIT_NOFILE, &limit) == 0 && limit.rlim_cur != RLIM_INFINITY) {
        end = static_cast<int>(std::min<rlim_t>(limit.rlim_cur, INT_MAX));
    }
    for (int descriptor = first; descriptor <= last && descriptor < end; ++descriptor) {
        close(descriptor);
    }
}

// Closes every descriptor above 2 except those in the sorted `keep`. Safe between fork and exec.
void CloseDescriptorsExcept(const int* keep, size_t count) {
    int next = STDERR_FILENO + 1;
    for (size_t index = 0; index < count; ++index) {
        if (keep[index] > next) {
            CloseRange(next, keep[index] - 1);
        }
        next = std::max(next, keep[index] + 1);
    }
    CloseRange(next, INT_MAX);
}

// Gives every signal its default action; SIGPIPE stays ignored when `ignorePipe` is set.
// Safe between fork and exec.
void ResetSignalDispositions(bool ignorePipe) {
    struct sigaction action {};
    sigemptyset(&action.sa_mask);
    for (int signal = 1; signal < NSIG; ++signal) {
        if (signal == SIGKILL || signal == SIGSTOP) {
            continue;
        }
        action.sa_handler = signal == SIGPIPE && ignorePipe ? SIG_IGN : SIG_DFL;
        sigaction(signal, &action, nullptr);  // fails harmlessly for reserved signals
    }
}

pid_t WaitPidRetryingInterrupts(pid_t child, int& status) {
    pid_t result;
    do {
        result = waitpid(child, &status, 0);
    } while (result < 0 && errno == EINTR);
    return result;
}

// Blocks every signal of the calling thread for its lifetime and restores the mask after.
class AllSignalsBlocked {
  public:
    AllSignalsBlocked() {
        sigset_t all;
        sigfillset(&all);
        pthread_sigmask(SIG_SETMASK, &all, &previous_);
    }
    ~AllSignalsBlocked() { pthread_sigmask(SIG_SETMASK, &previous_, nullptr); }
    AllSignalsBlocked(const AllSignalsBlocked&) = delete;
    AllSignalsBlocked& operator=(const AllSignalsBlocked&) = delete;

  private:
    sigset_t previous_;
};

// A pipe whose ends are closed on destruction unless handed on.
struct ReportPipe {
    ReportPipe() {
        int ends[2];
        if (pipe2(ends, O_CLOEXEC) != 0) {
            throw PosixError();
        }
        readEnd.Reset(ends[0]);
        writeEnd.Reset(ends[1]);
    }

    kest::FileDescriptor readEnd;
    kest::FileDescriptor writeEnd;
};

}  // namespace

// Everything the child processes need, built before the first fork: between fork and exec they
// may only make system calls on data prepared beforehand.
struct ExternalApplication::LaunchPlan {
    std::vector<std::string> argumentTexts;
    std::vector<char*> argv;
    std::vector<char*> environment;
    std::string directory;
    std::vector<int> inherited;
    std::vector<int> keep;  // sorted: the inherited descriptors and the report pipe
    int reportDescriptor = -1;
};

ExternalApplication::ExternalApplication(LaunchMode mode)
    : mode_(mode == LaunchMode::Default ? LaunchMode::Vfork : mode) {}

ExternalApplication::~ExternalApplication() = default;

void ExternalApplication::SetWorkingDirectory(const std::wstring& directory) {
    ScopedLock lock(mutex_);
    workingDirectory_ = directory;
}

void ExternalApplication::SetInheritedDescriptors(std::vector<int> descriptors) {
    ScopedLock lock(mutex_);
    inheritedDescriptors_ = std::move(descriptors);
}

void ExternalApplication::SetEnvironment(std::vector<std::string> variables) {
    ScopedLock lock(mutex_);
    environment_ = std::move(variables);
}

std::vector<std::wstring> ExternalApplication::SplitCommandLine(const std::wstring& commandLine) {
    std::vector<std::wstring> arguments;
    auto position = commandLine.begin();
    while (true) {
        position = std::find_if_not(position, commandLine.end(), IsCommandLineSeparator);
        if (position == commandLine.end()) {
            return arguments;
        }
        const auto end = std::find_if(position, commandLine.end(), IsCommandLineSeparator);
        arguments.emplace_back(position, end);
        position = end;
    }
}

bool ExternalApplication::Start(const std::wstring& program,
                                const std::vector<std::wstring>& arguments, bool noThrow) {
    try {
        ScopedLock lock(mutex_);
        return StartLocked(program, arguments);
    } catch (const exception::Exception&) {
        if (noThrow) {
            return false;
        }
        throw;
    }
}

bool ExternalApplication::StartCommandLine(const std::wstring& program,
                                           const std::wstring& commandLine, bool noThrow) {
    return Start(program, SplitCommandLine(commandLine), noThrow);
}

bool ExternalApplication::StartLocked(const std::wstring& program,
                                      const std::vector<std::wstring>& arguments) {
    if (state_.load() != State::Created) {
        throw exception::InvalidOperation();
    }
    state_.store(State::StartAttempted);
    if (!workingDirectory_.empty() && !IsDirectory(workingDirectory_)) {
        throw exception::NonexistentException();
    }
    if (mode_ != LaunchMode::Fork && mode_ != LaunchMode::Vfork) {
        throw PosixError(EINVAL);
    }
    for (int descriptor : inheritedDescriptors_) {
        if (descriptor <= STDERR_FILENO || fcntl(descriptor, F_GETFD) < 0) {
            throw PosixError("Descriptor to hand over is not open: " + std::to_string(descriptor),
                             EBADF);
        }
    }

    LaunchPlan plan;
    plan.argumentTexts.push_back(NarrowFromWide(program));
    for (const std::wstring& argument : arguments) {
        plan.argumentTexts.push_back(NarrowFromWide(argument));
    }
    for (std::string& text : plan.argumentTexts) {
        plan.argv.push_back(&text[0]);
    }
    plan.argv.push_back(nullptr);
    for (std::string& variable : environment_) {
        plan.environment.push_back(&variable[0]);
    }
    plan.environment.push_back(nullptr);
    plan.directory = NarrowFromWide(workingDirectory_);
    plan.inherited = inheritedDescriptors_;

    ReportPipe pipe;
    plan.reportDescriptor = pipe.writeEnd.Get();
    plan.keep = plan.inherited;
    plan.keep.push_back(plan.reportDescriptor);
    std::sort(plan.keep.begin(), plan.keep.end());

    pid_t intermediate = -1;
    int forkError = 0;
    {
        // The children start with every signal blocked, so that no handler of the host runs in
        // them before the dispositions are reset.
        AllSignalsBlocked blocked;
        intermediate = fork();
        if (intermediate == 0) {
            RunIntermediate(plan);
        }
        forkError = errno;
    }
    if (intermediate < 0) {
        throw PosixError(forkError);
    }
    pipe.writeEnd.Reset();
    intermediateId_ = intermediate;
    reportDescriptor_ = std::move(pipe.readEnd);

    Report report{};
    const bool received = ReceiveReport(reportDescriptor_.Get(), report);
    if (!received || report.kind != Report::Started) {
        Finish(0);
        state_.store(State::StartAttempted);
        throw PosixError(received && report.kind == Report::NotStarted ? report.value : ECHILD);
    }
    processId_.store(report.value);
    state_.store(State::Running);
    return true;
}

void ExternalApplication::RunIntermediate(const LaunchPlan& plan) {
    // Its own session keeps the terminal's signals away; all signals stay blocked, so only
    // SIGKILL ends it before it has reported.
    setsid();
    ResetSignalDispositions(true);
    CloseDescriptorsExcept(plan.keep.data(), plan.keep.size());
    const pid_t program = fork();
    if (program == 0) {
        RunProgram(plan);
    }
    if (program < 0) {
        SendReport(plan.reportDescriptor, Report::NotStarted, errno);
        _exit(kChildFailureStatus);
    }
    SendReport(plan.reportDescriptor, Report::Started, program);
    int status = 0;
    if (WaitPidRetryingInterrupts(program, status) != program) {
        _exit(kChildFailureStatus);  // the parent sees the pipe end without a result
    }
    SendReport(plan.reportDescriptor, Report::Ended, status);
    _exit(0);
}

void ExternalApplication::RunProgram(const LaunchPlan& plan) {
    setsid();
    ResetSignalDispositions(false);
    close(plan.reportDescriptor);
    for (int descriptor : plan.inherited) {
        if (fcntl(descriptor, F_SETFD, 0) != 0) {
            _exit(kChildFailureStatus);
        }
    }
    if (mode_ == LaunchMode::Fork) {
        try {
            PrepareChild();
        } catch (...) {
            _exit(kChildFailureStatus);
        }
    }
    if (!plan.directory.empty() && chdir(plan.directory.c_str()) != 0) {
        _exit(kChildFailureStatus);
    }
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
    execvpe(plan.argv[0], plan.argv.data(), plan.environment.data());
    _exit(kChildFailureStatus);
}

bool ExternalApplication::Wait(int32_t timeoutMs, bool killOnTimeout, bool noThrow) {
    try {
        ScopedLock lock(mutex_);
        return WaitLocked(timeoutMs, killOnTimeout);
    } catch (const exception::Exception&) {
        if (noThrow) {
            return false;
        }
        throw;
    }
}

bool ExternalApplication::WaitLocked(int32_t timeoutMs, bool killOnTimeout) {
    if (state_.load() != State::Running) {
        return true;
    }
    if (ReceiveExitStatus(timeoutMs)) {
        return true;
    }
    if (killOnTimeout) {
        KillProcess(processId_.load());
        // The intermediate process reaps the killed program and reports.
        ReceiveExitStatus(-1);
    }
    throw exception::Timeout();
}

bool ExternalApplication::ReceiveExitStatus(int32_t timeoutMs) {
    using Clock = std::chrono::steady_clock;
    const Clock::time_point deadline = Clock::now() + std::chrono::milliseconds(timeoutMs);
    while (true) {
        int pollMs = -1;
        if (timeoutMs >= 0) {
            const auto left = deadline - Clock::now();
            pollMs =
                left.count() <= 0
                    ? 0
                    : static_cast<int>(std::chrono::ceil<std::chrono::milliseconds>(left).count());
        }
        pollfd ready{reportDescriptor_.Get(), POLLIN, 0};
        const int result = poll(&ready, 1, pollMs);
        if (result < 0 && errno != EINTR) {
            throw PosixError();
        }
        if (result > 0) {
            break;
        }
        if (result == 0 && Clock::now() >= deadline) {
            return false;
        }
    }
    Report report{};
    if (!ReceiveReport(reportDescriptor_.Get(), report) || report.kind != Report::Ended) {
        Finish(-SIGKILL);
        throw PosixError("The exit status of the started program was lost", ECHILD);
    }
    Finish(ExitResultFromWaitStatus(report.value));
    return true;
}

void ExternalApplication::Finish(int32_t exitResult) {
    reportDescriptor_.Reset();
    // The intermediate exits right after its last report. A host that ignores SIGCHLD has it
    // reaped by the system, and waitpid then fails with ECHILD, which is fine.
    int status = 0;
    WaitPidRetryingInterrupts(intermediateId_, status);
    exitResult_.store(exitResult);
    state_.store(State::Finished);
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
