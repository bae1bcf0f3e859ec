// kestcfg's command line: [--sysroot DIR] [--plugin PATH] [--json] [--no-wait] COMMAND
// [ARGUMENTS...]
#pragma once

#include <string>
#include <vector>

struct CommandLine {
    std::string sysroot;  // empty: KEST_SYSROOT is left as it is
    std::string plugin;   // empty: the plug-in next to the program
    bool json = false;
    bool noWait = false;  // fail instead of waiting while another kestcfg changes the controller
    bool help = false;
    std::string command;
    std::vector<std::string> arguments;
};

// Parses argv; options come before the command. Throws a usage error for an unknown option, an
// option without its value, or a missing command (unless --help was given).
CommandLine ParseCommandLine(int argc, const char* const* argv);

// The usage text, ending with a newline.
std::string UsageText();
