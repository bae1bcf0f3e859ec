// kestcfg's command line: options that apply to every command, accepted before or after the
// command, and each command with its own arguments and --help.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Commands.h"

namespace kest::cfg {

struct CommandLine {
    CommandOptions options;
    bool version = false;
    const CommandDescription* command = nullptr;  // null when only --version is asked for
    std::vector<std::string> arguments;           // the command's arguments in their order
    std::optional<std::string> help;              // --help: the text to print instead
};

// Parses argv. A mistake throws a usage error whose message ends with a hint at the help of the
// command concerned.
CommandLine ParseCommandLine(int argc, const char* const* argv);

}  // namespace kest::cfg
