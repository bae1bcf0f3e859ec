#include "ExitCodes.h"

CommandFailure UsageError(const std::string& message) {
    return CommandFailure(kExitUsageError, message);
}

CommandFailure Failure(const std::string& message) {
    return CommandFailure(kExitFailure, message);
}
