// kestcfg: loads the KEST chassis plug-in and drives it as a configuration host would.
#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <exception>
#include <iostream>
#include <memory>
#include <optional>
#include <string>

#include "CommandLine.h"
#include "Commands.h"
#include "ExitCodes.h"
#include "ExpertSession.h"
#include "Interruption.h"
#include "PluginLoader.h"

namespace {

// Points KEST_SYSROOT at `directory` (made absolute), which must exist. `origin` names where
// the directory came from for the error message.
void UseSysroot(const std::string& directory, const std::string& origin) {
    char absolute[PATH_MAX];
    struct stat status {};
    if (realpath(directory.c_str(), absolute) == nullptr || stat(absolute, &status) != 0 ||
        !S_ISDIR(status.st_mode)) {
        throw UsageError("the sysroot " + directory + " (" + origin + ") is not a directory");
    }
    setenv("KEST_SYSROOT", absolute, 1);
}

// A --plugin path as dlopen should take it: a bare file name means the current directory, not the
// loader's search path.
std::string PluginPathArgument(const std::string& path) {
    return path.find('/') == std::string::npos ? "./" + path : path;
}

int Run(int argc, const char* const* argv) {
    const CommandLine line = ParseCommandLine(argc, argv);
    if (line.help) {
        std::cout << UsageText();
        return kExitSuccess;
    }
    const CommandDescription* command = FindCommand(line.command);
    if (command == nullptr) {
        throw UsageError("unknown command " + line.command);
    }
    if (line.arguments.size() < command->minArguments ||
        line.arguments.size() > command->maxArguments) {
        throw UsageError("wrong number of arguments; usage: kestcfg [OPTIONS] " +
                         command->synopsis);
    }
    CommandContext context{nullptr, line.arguments, line.json, std::cout, std::cerr};
    if (command->expertUse == ExpertUse::kNone) {
        command->run(context);
        return kExitSuccess;
    }

    if (!line.sysroot.empty()) {
        UseSysroot(line.sysroot, "--sysroot");
    } else if (const char* fromEnvironment = getenv("KEST_SYSROOT");
               fromEnvironment != nullptr && *fromEnvironment != '\0') {
        UseSysroot(fromEnvironment, "KEST_SYSROOT");
    }
    std::optional<ControllerTurn> turn;
    if (command->takesTurn) {
        turn.emplace(line.noWait, std::cerr);
        context.turn = &*turn;
    }
    const Plugin plugin(line.plugin.empty() ? DefaultPluginPath()
                                            : PluginPathArgument(line.plugin));
    const InterfaceRef<IuxSysExpert3> expert = plugin.CreateExpert();
    context.expert = expert.Get();
    // Ends the handling of interruptions a command began once Uninitialize has returned.
    struct InterruptionHandlingEnd {
        ~InterruptionHandlingEnd() { EndInterruptionHandling(); }
    } interruptionHandlingEnd;
    std::unique_ptr<ExpertSession> session;
    if (command->expertUse == ExpertUse::kItems) {
        session = std::make_unique<ExpertSession>(expert.Get());
    }
    command->run(context);
    return kExitSuccess;
}

// The exit code of a run that ended with `code`, unless a signal interrupted it.
int ExitCodeUnlessInterrupted(int code) {
    const int signalNumber = RecordedInterruption();
    return signalNumber != 0 ? ExitCodeAfterSignal(signalNumber) : code;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return ExitCodeUnlessInterrupted(Run(argc, argv));
    } catch (const CommandFailure& failure) {
        std::cout.flush();
        if (*failure.what() != '\0') {
            std::cerr << "kestcfg: " << failure.what() << "\n";
        }
        if (failure.Code() == kExitUsageError) {
            std::cerr << "Try 'kestcfg --help' for more information.\n";
        }
        return ExitCodeUnlessInterrupted(failure.Code());
    } catch (const std::exception& failure) {
        std::cout.flush();
        std::cerr << "kestcfg: " << failure.what() << "\n";
        return ExitCodeUnlessInterrupted(kExitFailure);
    }
}
