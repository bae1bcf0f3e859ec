#include "ExitCodes.h"

namespace kest::cfg {

CommandFailure UsageError(const std::string& message) {
    return CommandFailure(kExitUsageError, message);
}

CommandFailure Failure(const std::string& message) {
    return CommandFailure(kExitFailure, message);
}

}  // namespace kest::cfg
