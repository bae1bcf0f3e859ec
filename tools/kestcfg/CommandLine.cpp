#include "CommandLine.h"

#include <algorithm>

#include "Commands.h"
#include "ExitCodes.h"

namespace {

// The value of an option given as "--name VALUE" or "--name=VALUE"; advances `index` past it.
std::string OptionValue(const std::string& name, const std::string& argument, int argc,
                        const char* const* argv, int* index) {
    if (argument.size() > name.size()) {
        return argument.substr(name.size() + 1);
    }
    if (*index + 1 >= argc) {
        throw UsageError("option " + name + " needs a value");
    }
    return argv[++*index];
}

bool IsOption(const std::string& argument, const std::string& name) {
    return argument == name || argument.rfind(name + "=", 0) == 0;
}

}  // namespace

CommandLine ParseCommandLine(int argc, const char* const* argv) {
    CommandLine line;
    int index = 1;
    for (; index < argc; ++index) {
        const std::string argument = argv[index];
        if (argument.empty() || argument[0] != '-') {
            break;
        }
        if (argument == "--") {
            ++index;
            break;
        }
        if (IsOption(argument, "--sysroot")) {
            line.sysroot = OptionValue("--sysroot", argument, argc, argv, &index);
            if (line.sysroot.empty()) {
                throw UsageError("option --sysroot needs a directory");
            }
        } else if (IsOption(argument, "--plugin")) {
            line.plugin = OptionValue("--plugin", argument, argc, argv, &index);
            if (line.plugin.empty()) {
                throw UsageError("option --plugin needs a path");
            }
        } else if (argument == "--json") {
            line.json = true;
        } else if (argument == "--no-wait") {
            line.noWait = true;
        } else if (argument == "--help" || argument == "-h") {
            line.help = true;
        } else {
            throw UsageError("unknown option " + argument);
        }
    }
    if (index < argc) {
        line.command = argv[index++];
    }
    for (; index < argc; ++index) {
        line.arguments.emplace_back(argv[index]);
    }
    if (line.command.empty() && !line.help) {
        throw UsageError("no command given");
    }
    return line;
}

std::string UsageText() {
    std::string text =
        "usage: kestcfg [--sysroot DIR] [--plugin PATH] [--json] [--no-wait] COMMAND "
        "[ARGUMENTS...]\n"
        "\n"
        "options:\n"
        "  --sysroot DIR  resolve the controller's fixed paths under DIR (sets KEST_SYSROOT;\n"
        "                 without it, KEST_SYSROOT from the environment applies)\n"
        "  --plugin PATH  the plug-in to load (default: libvqkestSysApiChassisExpert.so next\n"
        "                 to kestcfg)\n"
        "  --json         print results as JSON, one object per line (per item)\n"
        "  --no-wait      fail at once (exit status 4) while another kestcfg changes the\n"
        "                 controller, instead of waiting for it\n"
        "\n"
        "commands:\n";
    size_t width = 0;
    for (const CommandDescription& command : AllCommands()) {
        width = std::max(width, command.synopsis.size());
    }
    for (const CommandDescription& command : AllCommands()) {
        text += "  " + command.synopsis + std::string(width + 2 - command.synopsis.size(), ' ') +
                command.summary + "\n";
    }
    text +=
        "\n"
        "Properties are named as 'kestcfg get' shows them (host-name, ip-address,\n"
        "polling-interval, ...) or by tag number (0x0D11B000). Values follow the property's\n"
        "type: true/false, numbers in decimal or 0x-hexadecimal, text, and times in ISO 8601\n"
        "UTC (2030-01-02T03:04:05Z) or now.\n"
        "\n"
        "examples:\n"
        "  root=$(mktemp -d) && kestcfg sim init \"$root\" && export KEST_SYSROOT=\"$root\"\n"
        "  kestcfg get eth0\n"
        "  kestcfg set eth0 polling-interval=250\n"
        "  kestcfg refresh 'VQ KEST Chassis' current-time\n"
        "\n"
        "exit status: 0 success, 1 value rejected, 2 usage error or unusable input, 3 other\n"
        "failure, 4 busy (another kestcfg with --no-wait, or a firmware update under way),\n"
        "5 partly done, 128+N interrupted by signal N\n";
    return text;
}
