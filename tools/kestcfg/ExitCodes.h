// kestcfg's exit codes, the same for every command, and the failures that carry them to main.
#pragma once

#include <optional>
#include <stdexcept>
#include <string>

#include "uxsys/Types.h"

namespace kest::cfg {

enum ExitCode : int {
    kExitSuccess = 0,
    kExitRejectedValue = 1,  // a value rejected by validation
    kExitUsageError = 2,     // usage error or unusable input
    kExitFailure = 3,        // the plug-in or the system failed
    kExitBusy = 4,           // another kestcfg (with --no-wait) or a firmware update is under way
    kExitPartlyDone = 5,     // some changes were stored, some were not
};

// The exit code after the command was interrupted by signal `signalNumber`: 128 + the number.
constexpr int ExitCodeAfterSignal(int signalNumber) {
    return 128 + signalNumber;
}

// A failure that ends the program with `code` after printing the message; `status` is the
// plug-in's status behind it, when there is one.
class CommandFailure : public std::runtime_error {
  public:
    CommandFailure(ExitCode code, const std::string& message,
                   std::optional<HRESULT> status = std::nullopt)
        : std::runtime_error(message), code_(code), status_(status) {}
    ExitCode Code() const { return code_; }
    std::optional<HRESULT> Status() const { return status_; }

  private:
    ExitCode code_;
    std::optional<HRESULT> status_;
};

// The command line or an input file cannot be used (exit code 2).
CommandFailure UsageError(const std::string& message);
// The plug-in or the system failed (exit code 3).
CommandFailure Failure(const std::string& message);

}  // namespace kest::cfg
