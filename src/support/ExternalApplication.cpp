#include "support/ExternalApplication.h"

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

#include "support/Exceptions.h"
#include "support/PathHelpers.h"
#include "support/ProcessControl.h"
#include "support/Sleep.h"
#include "support/TextConversion.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr int32_t kPollIntervalMs = 100;
constexpr int kChildFailureStatus = 1;

bool IsCommandLineSeparator(wchar_t c) {
    return c == L' ' || c == L'\t' || c == L'\n' || c == L'\r';
}

// A vfork child shares the parent's memory and stack: it may only change directory, exec and
// _exit, all on data prepared before vfork.
pid_t SpawnWithVfork(const char* program, char* const* argv, const char* directory) {
    const pid_t child = vfork();
    if (child == 0) {
        if (directory != nullptr && chdir(directory) != 0) {
            _exit(kChildFailureStatus);
        }
        execvp(program, argv);
        _exit(kChildFailureStatus);
    }
    return child;
}

pid_t WaitPidRetryingInterrupts(pid_t child, int& status, int options) {
    pid_t result;
    do {
        result = waitpid(child, &status, options);
    } while (result < 0 && errno == EINTR);
    return result;
}

int32_t ExitResultFromWaitStatus(int status) {
    if (WIFSIGNALED(status)) {
        return -WTERMSIG(status);
    }
    return WEXITSTATUS(status);
}

}  // namespace

ExternalApplication::ExternalApplication(LaunchMode mode)
    : mode_(mode == LaunchMode::Default ? LaunchMode::Vfork : mode) {}

ExternalApplication::~ExternalApplication() = default;

void ExternalApplication::SetWorkingDirectory(const std::wstring& directory) {
    ScopedLock lock(mutex_);
    workingDirectory_ = directory;
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

    // Everything the child needs is built here, before the child exists.
    std::vector<std::string> argumentTexts;
    argumentTexts.reserve(arguments.size() + 1);
    argumentTexts.push_back(NarrowFromWide(program));
    for (const std::wstring& argument : arguments) {
        argumentTexts.push_back(NarrowFromWide(argument));
    }
    std::vector<char*> argv;
    argv.reserve(argumentTexts.size() + 1);
    for (std::string& text : argumentTexts) {
        argv.push_back(&text[0]);
    }
    argv.push_back(nullptr);
    const std::string directory = NarrowFromWide(workingDirectory_);
    const char* directoryOrNull = directory.empty() ? nullptr : directory.c_str();

    pid_t child = -1;
    if (mode_ == LaunchMode::Vfork) {
        child = SpawnWithVfork(argv[0], argv.data(), directoryOrNull);
    } else if (mode_ == LaunchMode::Fork) {
        child = fork();
        if (child == 0) {
            RunChildAfterFork(argv[0], argv.data(), directoryOrNull);
        }
    } else {
        errno = EINVAL;
    }
    if (child < 0) {
        throw PosixError();
    }
    processId_.store(child);
    state_.store(State::Running);
    return true;
}

void ExternalApplication::RunChildAfterFork(const char* program, char* const* argv,
                                            const char* directory) {
    try {
        PrepareChild();
    } catch (...) {
        _exit(kChildFailureStatus);
    }
    if (directory != nullptr && chdir(directory) != 0) {
        _exit(kChildFailureStatus);
    }
    execvp(program, argv);
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
    const bool unlimited = timeoutMs < 0;
    int32_t remainingMs = timeoutMs;
    while (true) {
        if (CollectExitStatus(unlimited)) {
            return true;
        }
        if (remainingMs <= 0) {
            break;
        }
        const int32_t stepMs = std::min(remainingMs, kPollIntervalMs);
        SleepMs(static_cast<uint32_t>(stepMs));
        remainingMs -= stepMs;
    }
    if (killOnTimeout) {
        const pid_t child = processId_.load();
        KillProcess(child);
        // Reap the killed child so that no zombie is left behind.
        int status = 0;
        const bool reaped = WaitPidRetryingInterrupts(child, status, 0) == child;
        exitResult_.store(reaped ? ExitResultFromWaitStatus(status) : -SIGKILL);
        state_.store(State::Finished);
    }
    throw exception::Timeout();
}

bool ExternalApplication::CollectExitStatus(bool block) {
    int status = 0;
    const pid_t result = WaitPidRetryingInterrupts(processId_.load(), status, block ? 0 : WNOHANG);
    if (result < 0) {
        throw PosixError();
    }
    if (result == 0) {
        return false;
    }
    exitResult_.store(ExitResultFromWaitStatus(status));
    state_.store(State::Finished);
    return true;
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
