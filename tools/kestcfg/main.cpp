// kestcfg: loads the KEST chassis plug-in and drives it as a configuration host would.
#include <limits.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstring>
#include <exception>
#include <iostream>
#include <memory>
#include <optional>
#include <string>

#include "CommandLine.h"
#include "Commands.h"
#include "DocumentOutput.h"
#include "ExitCodes.h"
#include "ExpertSession.h"
#include "InstalledLibraries.h"
#include "Interruption.h"
#include "StatusNames.h"
#include "TextLocale.h"
#include "hostkit/HostText.h"
#include "uxsys/HostString.h"

namespace kest::cfg {

using namespace kest::hostkit;

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

// True when the arguments ask for JSON; read before parsing so that a usage error is reported
// as a JSON document too.
bool AsksForJson(int argc, const char* const* argv) {
    for (int i = 1; i < argc && std::strcmp(argv[i], "--") != 0; ++i) {
        if (std::strcmp(argv[i], "--json") == 0) {
            return true;
        }
    }
    return false;
}

// The plug-in's version, reported by a fresh expert.
std::string PluginVersion(IuxSysExpert3* expert) {
    CvqBStr text = nullptr;
    const HRESULT status = expert->GetExpertVersion(&text);
    std::string version = TakeHostString(text);
    if (status < 0) {
        throw Failure("GetExpertVersion failed with " + StatusWithName(status));
    }
    return version;
}

// Runs the command the line names; the plug-in is unloaded when this returns.
void RunCommandLine(const CommandLine& line, Json& document, std::ostream& out) {
    const ExpertUse use = line.version ? ExpertUse::kIdentity : line.command->expertUse;
    if (use != ExpertUse::kNone) {
        if (!line.options.sysroot.empty()) {
            UseSysroot(line.options.sysroot, "--sysroot");
        } else if (const char* fromEnvironment = getenv("KEST_SYSROOT");
                   fromEnvironment != nullptr && *fromEnvironment != '\0') {
            UseSysroot(fromEnvironment, "KEST_SYSROOT");
        }
    }
    if (use == ExpertUse::kNone || use == ExpertUse::kSysroot) {
        CommandContext context{nullptr, line.arguments, line.options, document, out, std::cerr};
        line.command->run(context);
        return;
    }
    const std::string pluginPath =
        line.options.plugin.empty() ? DefaultPluginPath() : PluginPathArgument(line.options.plugin);
    if (line.version) {
        // The tool's version even when the plug-in cannot be loaded.
        document["kestcfg"] = KESTCFG_VERSION;
        if (!line.options.json) {
            out << "kestcfg " << KESTCFG_VERSION << std::endl;
        }
    }
    std::optional<ControllerTurn> turn;
    if (!line.version && line.command->takesTurn) {
        turn.emplace(line.options.noWait, std::cerr);
    }
    const SimulatorLibrary simulator(line.options.simulator);
    const Plugin plugin(pluginPath);
    const InterfaceRef<IuxSysExpert3> expert = plugin.CreateExpert();
    if (line.version) {
        const std::string version = PluginVersion(expert.Get());
        document["plugin"] = version;
        document["pluginPath"] = pluginPath;
        if (!line.options.json) {
            out << "plug-in " << version << " (" << pluginPath << ")\n";
        }
        return;
    }
    CommandContext context{expert.Get(), line.arguments, line.options, document, out, std::cerr};
    context.turn = turn ? &*turn : nullptr;
    // Ends the handling of interruptions a command began once Uninitialize has returned.
    struct InterruptionHandlingEnd {
        ~InterruptionHandlingEnd() { EndInterruptionHandling(); }
    } interruptionHandlingEnd;
    std::unique_ptr<ExpertSession> session;
    if (line.command->expertUse == ExpertUse::kItems) {
        session = std::make_unique<ExpertSession>(expert.Get());
    }
    line.command->run(context);
}

// Adds the failure to the JSON document: exit status, message and the plug-in's status.
void RecordFailure(Json& document, int code, const std::string& message,
                   std::optional<HRESULT> status) {
    if (!document.is_object()) {
        document = Json::object();
    }
    Json error = {{"exitStatus", code}, {"message", message}};
    if (status) {
        const std::string name = StatusName(*status);
        error["status"] = name.empty() ? Json(nullptr) : Json(name);
        error["code"] = StatusText(*status);
    }
    document["error"] = std::move(error);
}

// The exit code of a run that ended with `code`, unless a signal interrupted it.
int ExitCodeUnlessInterrupted(int code) {
    const int signalNumber = RecordedInterruption();
    return signalNumber != 0 ? ExitCodeAfterSignal(signalNumber) : code;
}

}  // namespace

}  // namespace kest::cfg

// NOLINTNEXTLINE(bugprone-exception-escape): only allocation failures escape, ending kestcfg
int main(int argc, char** argv) {
    using namespace kest::cfg;
    UseTextLocale();
    const bool json = AsksForJson(argc, argv);
    DocumentOutput output(json);
    Json document = Json::object();
    int code = kExitSuccess;
    std::string helpTopic = "kestcfg";
    try {
        const CommandLine line = ParseCommandLine(argc, argv);
        if (line.command != nullptr) {
            helpTopic += " " + line.command->name;
        }
        if (line.help) {
            output.Write(*line.help);
            return kExitSuccess;
        }
        RunCommandLine(line, document, std::cout);
    } catch (const CommandFailure& failure) {
        std::cout.flush();
        code = failure.Code();
        std::string message = failure.what();
        std::string hint = "Try '" + helpTopic + " --help' for more information.";
        if (const size_t split = message.find("\nTry '"); split != std::string::npos) {
            hint = message.substr(split + 1);
            message.erase(split);
        }
        if (!message.empty()) {
            std::cerr << "kestcfg: " << PrintableText(message) << "\n";
        }
        if (code == kExitUsageError) {
            std::cerr << hint << "\n";
        }
        RecordFailure(document, code, message, failure.Status());
    } catch (const std::exception& failure) {
        std::cout.flush();
        code = kExitFailure;
        std::cerr << "kestcfg: " << PrintableText(failure.what()) << "\n";
        RecordFailure(document, code, failure.what(), std::nullopt);
    }
    code = ExitCodeUnlessInterrupted(code);
    if (json) {
        output.Write(JsonText(document) + "\n");
    }
    return code;
}
