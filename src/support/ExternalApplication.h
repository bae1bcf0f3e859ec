// One child process running an external program: started once, then waited for.
#pragma once

#include <sys/types.h>

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "support/Mutex.h"

namespace vq {
namespace dsc {
namespace osdep {

class ExternalApplication {
  public:
    // How the child is created. Default means Vfork; any other value makes every start fail.
    enum class LaunchMode : int32_t { Default = 0, Fork = 1, Vfork = 2 };
    enum class State : int32_t { Created = 0, StartAttempted = 1, Running = 2, Finished = 3 };

    explicit ExternalApplication(LaunchMode mode = LaunchMode::Default);
    // Neither waits for nor kills a running child.
    virtual ~ExternalApplication();
    ExternalApplication(const ExternalApplication&) = delete;
    ExternalApplication& operator=(const ExternalApplication&) = delete;

    // Directory the child changes to before running the program; empty keeps the parent's.
    void SetWorkingDirectory(const std::wstring& directory);

    // Runs `program` (looked up on PATH when it has no slash) with argv[0] = program followed by
    // `arguments`. True when the child was created. Failures raise InvalidOperation (second
    // start), NonexistentException (working directory missing) or PosixError (no child); with
    // `noThrow` every failure returns false instead. A program that cannot be executed makes the
    // child exit with status 1.
    bool Start(const std::wstring& program, const std::vector<std::wstring>& arguments,
               bool noThrow = false);
    // As Start, with the arguments cut from `commandLine` by SplitCommandLine.
    bool StartCommandLine(const std::wstring& program, const std::wstring& commandLine,
                          bool noThrow = false);

    // Waits for the child: `timeoutMs` -1 (any negative) waits without limit, 0 checks once.
    // True when the child has finished or was never started. On time-out the child is killed
    // and reaped when `killOnTimeout` is set; then Timeout is raised, or false returned with
    // `noThrow` (which also turns a failing waitpid into false instead of PosixError).
    bool Wait(int32_t timeoutMs = -1, bool killOnTimeout = false, bool noThrow = false);

    // The exit status (0 to 255), or minus the number of the signal that ended the child.
    int32_t ExitResult() const { return exitResult_.load(); }
    State GetState() const { return state_.load(); }
    // The child's process id; 0 before a child was created.
    pid_t ProcessId() const { return processId_.load(); }

    // Cuts text into arguments at blanks, tabs, line feeds and carriage returns. Runs of them
    // count as one; there is no quoting.
    static std::vector<std::wstring> SplitCommandLine(const std::wstring& commandLine);

  protected:
    // Runs in the child between fork and exec when the launch mode is Fork (for example to
    // redirect the standard streams). The child exits with status 1 if it throws.
    virtual void PrepareChild() {}

  private:
    bool StartLocked(const std::wstring& program, const std::vector<std::wstring>& arguments);
    bool WaitLocked(int32_t timeoutMs, bool killOnTimeout);
    // One waitpid; true when the child has ended (its result is then recorded).
    bool CollectExitStatus(bool block);
    [[noreturn]] void RunChildAfterFork(const char* program, char* const* argv,
                                        const char* directory);

    const LaunchMode mode_;
    std::wstring workingDirectory_;
    std::atomic<pid_t> processId_{0};
    std::atomic<State> state_{State::Created};
    std::atomic<int32_t> exitResult_{0};
    Mutex mutex_;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
