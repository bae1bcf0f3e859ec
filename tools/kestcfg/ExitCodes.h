// kestcfg's exit codes and the failures that carry them to main.
#pragma once

#include <stdexcept>
#include <string>

enum ExitCode : int {
    kExitSuccess = 0,
    kExitRejectedValue = 1,
    kExitUsageError = 2,
    kExitFailure = 3,
};

// A failure that ends the program with `code` after printing the message.
class CommandFailure : public std::runtime_error {
  public:
    CommandFailure(ExitCode code, const std::string& message)
        : std::runtime_error(message), code_(code) {}
    ExitCode Code() const { return code_; }

  private:
    ExitCode code_;
};

// The command line cannot be understood (exit code 2).
CommandFailure UsageError(const std::string& message);
// The plug-in or the system failed (exit code 3).
CommandFailure Failure(const std::string& message);
