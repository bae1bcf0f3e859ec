// kestcfg's exit codes and the failures that carry them to main.
#pragma once

#include <optional>
#include <stdexcept>
#include <string>

#include "uxsys/Types.h"

enum ExitCode : int {
    kExitSuccess = 0,
    kExitRejectedValue = 1,
    kExitUsageError = 2,
    kExitFailure = 3,
    kExitBusy = 4,
    kExitPartlyDone = 5,
};

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
