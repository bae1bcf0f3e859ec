// One child process running an external program: started once, then waited for.
//
// The program starts clean: in its own session, with an empty signal mask and default signal
// dispositions, with only descriptors 0 to 2 and the ones handed over on purpose, and with a
// fixed environment. A small intermediate process (in a session of its own as well) starts the
// program, waits for it and reports its pid and exit status over a pipe, so the status arrives
// even when the host ignores SIGCHLD and lets the system reap its children.
//
// Thread safety: the setters, Start and Wait may be called from any thread and run one at a time
// under the object's mutex; ExitResult, GetState and ProcessId may be read at any moment.
#pragma once

#include <sys/types.h>

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "support/FileDescriptor.h"
#include "support/Mutex.h"

namespace vq {
namespace dsc {
namespace osdep {

class ExternalApplication {
  public:
    // Fork runs PrepareChild in the program's process before exec; Default and Vfork do not.
    // Any other value makes every start fail.
    enum class LaunchMode : int32_t { Default = 0, Fork = 1, Vfork = 2 };
    enum class State : int32_t { Created = 0, StartAttempted = 1, Running = 2, Finished = 3 };

    explicit ExternalApplication(LaunchMode mode = LaunchMode::Default);
    // Neither waits for nor kills a running child.
    virtual ~ExternalApplication();
    ExternalApplication(const ExternalApplication&) = delete;
    ExternalApplication& operator=(const ExternalApplication&) = delete;

    // Directory the child changes to before running the program; empty keeps the parent's.
    void SetWorkingDirectory(const std::wstring& directory);
    // Descriptors beyond 0 to 2 that the program keeps open; their close-on-exec flag is
    // cleared in the child only, never in the parent.
    void SetInheritedDescriptors(std::vector<int> descriptors);
    // The program's whole environment as "NAME=value" entries; empty (the default) gives an
    // empty environment.
    void SetEnvironment(std::vector<std::string> variables);

    // Runs `program` (looked up on the parent's PATH when it has no slash) with argv[0] =
    // program followed by `arguments`. True when the child was created. Failures raise
    // InvalidOperation (second start), NonexistentException (working directory missing) or
    // PosixError (no child, or an inherited descriptor that is not open); with `noThrow` every
    // failure returns false instead. A program that cannot be executed makes the child exit
    // with status 1.
    bool Start(const std::wstring& program, const std::vector<std::wstring>& arguments,
               bool noThrow = false);
    // As Start, with the arguments cut from `commandLine` by SplitCommandLine.
    bool StartCommandLine(const std::wstring& program, const std::wstring& commandLine,
                          bool noThrow = false);

    // Waits for the child: `timeoutMs` -1 (any negative) waits without limit, 0 checks once.
    // True when the child has finished or was never started. On time-out the child is killed
    // and reaped when `killOnTimeout` is set; then Timeout is raised, or false returned with
    // `noThrow` (which also turns a lost exit status into false instead of PosixError).
    bool Wait(int32_t timeoutMs = -1, bool killOnTimeout = false, bool noThrow = false);

    // The exit status (0 to 255), or minus the number of the signal that ended the child.
    int32_t ExitResult() const { return exitResult_.load(); }
    State GetState() const { return state_.load(); }
    // The program's process id; 0 before a child was created.
    pid_t ProcessId() const { return processId_.load(); }

    // Cuts text into arguments at blanks, tabs, line feeds and carriage returns. Runs of them
    // count as one; there is no quoting.
    static std::vector<std::wstring> SplitCommandLine(const std::wstring& commandLine);

  protected:
    // Runs in the program's process between fork and exec when the launch mode is Fork (for
    // example to redirect the standard streams). The child exits with status 1 if it throws.
    virtual void PrepareChild() {}

  private:
    struct LaunchPlan;

    bool StartLocked(const std::wstring& program, const std::vector<std::wstring>& arguments);
    bool WaitLocked(int32_t timeoutMs, bool killOnTimeout);
    // Reads the intermediate's final report within `timeoutMs` (negative: without limit); true
    // once the exit result is recorded.
    bool ReceiveExitStatus(int32_t timeoutMs);
    // Records a finished child and reaps the intermediate process.
    void Finish(int32_t exitResult);
    [[noreturn]] void RunIntermediate(const LaunchPlan& plan);
    [[noreturn]] void RunProgram(const LaunchPlan& plan);

    const LaunchMode mode_;
    std::wstring workingDirectory_;
    std::vector<int> inheritedDescriptors_;
    std::vector<std::string> environment_;
    std::atomic<pid_t> processId_{0};
    std::atomic<State> state_{State::Created};
    std::atomic<int32_t> exitResult_{0};
    pid_t intermediateId_ = 0;
    kest::FileDescriptor
        reportDescriptor_;  // read end of the intermediate's report pipe while running
    Mutex mutex_;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
