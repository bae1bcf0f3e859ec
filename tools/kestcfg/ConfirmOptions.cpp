#include "ConfirmOptions.h"

namespace kest::cfg {

void AddConfirmOptions(const std::string& name, CLI::App& command, CommandOptions& options) {
    if (name == "set" || name == "apply") {
        command
            .add_option_function<long long>(
                "--confirm-within",
                [&options](long long seconds) {
                    if (seconds <= 0 || seconds > kLongestConfirmWithin) {
                        throw CLI::ValidationError("--confirm-within",
                                                   "takes 1 to " +
                                                       std::to_string(kLongestConfirmWithin) +
                                                       " seconds, not " + std::to_string(seconds));
                    }
                    options.confirmWithin = seconds;
                },
                "restore the old settings after SECONDS (1 to 3600) unless kestcfg confirm "
                "is run first")
            ->type_name("SECONDS");
    } else if (name == "rollback") {
        // The watcher's own invocation; people run rollback without it.
        command.add_option("--watch", options.watch)->group("");
    }
}

}  // namespace kest::cfg
