#include "CommandLine.h"

#include <CLI/CLI.hpp>
#include <deque>
#include <map>

#include "ConfirmOptions.h"
#include "ExitCodes.h"

namespace kest::cfg {

namespace {

constexpr char kFooter[] =
    "Items are named as 'kestcfg items' lists them; chassis names the chassis item. Properties\n"
    "are named as 'kestcfg describe' shows them (host-name, ip-address, polling-interval, ...)\n"
    "or by tag number (0x0D11B000). Values follow the property's type: true/false, numbers in\n"
    "decimal or 0x-hexadecimal, mode names (tcpip), text, and times in ISO 8601 UTC\n"
    "(2030-01-02T03:04:05Z) or now.\n"
    "\n"
    "Examples:\n"
    "  dir=$(mktemp -d) && kestcfg sim init \"$dir\" && export KEST_SYSROOT=$dir\n"
    "  kestcfg describe eth0\n"
    "  kestcfg get chassis host-name comment\n"
    "  kestcfg set eth0 polling-interval=250 adapter-mode=tcpip\n"
    "  kestcfg export > settings.json && kestcfg apply --check settings.json\n"
    "\n"
    "Exit status: 0 success, 1 value rejected, 2 usage error or unusable input, 3 failure,\n"
    "4 busy, 5 partly done (some changes stored, some not), 128+N after signal N.";

// The command path of the deepest command the parser got to ("kestcfg sim init").
std::string HelpTopic(const CLI::App& app) {
    std::string topic = app.get_name();
    const CLI::App* current = &app;
    for (;;) {
        const std::vector<const CLI::App*> selected =
            current->get_subcommands([](const CLI::App* sub) { return sub->parsed(); });
        if (selected.empty()) {
            return topic;
        }
        current = selected.front();
        topic += " " + current->get_name();
    }
}

CommandFailure MistakeWithHint(const std::string& message, const std::string& topic) {
    return UsageError(message + "\nTry '" + topic + " --help' for more information.");
}

}  // namespace

CommandLine ParseCommandLine(int argc, const char* const* argv) {
    CommandLine line;
    CLI::App app("Configures a KEST chassis controller through its configuration plug-in.",
                 "kestcfg");
    app.fallthrough();
    app.require_subcommand(0, 1);
    app.add_option("--sysroot", line.options.sysroot,
                   "resolve the controller's fixed paths under DIR (sets KEST_SYSROOT; without "
                   "it, KEST_SYSROOT from the environment applies)")
        ->type_name("DIR");
    app.add_option("--plugin", line.options.plugin,
                   "the plug-in to load (default: the one installed with kestcfg)")
        ->type_name("PATH");
    app.add_flag("--json", line.options.json,
                 "write the result as one JSON document on standard output");
    app.add_flag("--no-wait", line.options.noWait,
                 "fail at once (status 4) when another kestcfg is changing the controller");
    app.add_flag("--simulator", line.options.simulator,
                 "use the installed simulated controller library (chosen by itself for a "
                 "sysroot made by sim init)");
    app.add_flag("--version", line.version, "show the versions of kestcfg and of its plug-in");

    struct Parsed {
        const CommandDescription* command;
        CLI::App* app;
        std::vector<std::vector<std::string>*> values;
    };
    std::deque<std::vector<std::string>> storage;
    std::vector<Parsed> commands;
    std::map<std::string, CLI::App*> groups;
    for (const CommandDescription& command : AllCommands()) {
        CLI::App* parent = &app;
        std::string name = command.name;
        if (const size_t blank = name.find(' '); blank != std::string::npos) {
            const std::string group = name.substr(0, blank);
            name = name.substr(blank + 1);
            CLI::App*& groupApp = groups[group];
            if (groupApp == nullptr) {
                groupApp = app.add_subcommand(group, "demo controllers: " + name + " DIR");
                groupApp->require_subcommand(1);
            }
            parent = groupApp;
        }
        CLI::App* sub = parent->add_subcommand(name, command.summary);
        sub->footer(
            "The options of kestcfg (--sysroot, --plugin, --json, --no-wait) may follow the "
            "command too.");
        Parsed parsed{&command, sub, {}};
        for (const ArgumentDescription& argument : command.arguments) {
            std::vector<std::string>& values = storage.emplace_back();
            CLI::Option* option =
                argument.repeated
                    ? sub->add_option(argument.name, values, argument.help)
                    : sub->add_option_function<std::string>(
                          argument.name,
                          [&values](const std::string& value) { values.assign(1, value); },
                          argument.help);
            option->type_name("");
            if (argument.required) {
                option->required();
            }
            parsed.values.push_back(&values);
        }
        if (command.name == "apply") {
            sub->add_flag("--check", line.options.check,
                          "validate and show the differences, but change nothing");
            sub->add_flag("--diff", line.options.diff,
                          "show each difference with the current and the new value");
        }
        AddConfirmOptions(command.name, *sub, line.options);
        commands.push_back(std::move(parsed));
    }

    app.footer(kFooter);
    try {
        app.parse(argc, argv);
    } catch (const CLI::CallForHelp&) {
        line.help = app.help();
        return line;
    } catch (const CLI::ParseError& error) {
        throw MistakeWithHint(error.what(), HelpTopic(app));
    }

    for (const Parsed& parsed : commands) {
        if (parsed.app->parsed()) {
            line.command = parsed.command;
            for (const std::vector<std::string>* values : parsed.values) {
                line.arguments.insert(line.arguments.end(), values->begin(), values->end());
            }
        }
    }
    if (line.command == nullptr && !line.version) {
        throw MistakeWithHint("no command given", HelpTopic(app));
    }
    if (app.count("--sysroot") != 0 && line.options.sysroot.empty()) {
        throw MistakeWithHint("option --sysroot needs a directory", HelpTopic(app));
    }
    if (app.count("--plugin") != 0 && line.options.plugin.empty()) {
        throw MistakeWithHint("option --plugin needs a path", HelpTopic(app));
    }
    for (const std::string& argument : line.arguments) {
        if (argument.empty()) {
            throw MistakeWithHint("an argument is empty", HelpTopic(app));
        }
    }
    return line;
}

}  // namespace kest::cfg
