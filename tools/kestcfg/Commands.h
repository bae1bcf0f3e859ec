// kestcfg's commands: each one drives the expert through its host interfaces, or prepares files,
// and prints the result as text for people or into one JSON document for scripts.
#pragma once

#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "ControllerTurn.h"
#include "JsonOutput.h"
#include "uxsys/Expert.h"

namespace kest::cfg {

// What a command needs of the plug-in.
enum class ExpertUse {
    kNone,      // the plug-in is not loaded
    kSysroot,   // the plug-in is not loaded; the controller's files are read under the sysroot
    kIdentity,  // a fresh expert; Initialize is not called
    kItems,     // an expert between Initialize and Uninitialize
};

// The options that apply to every command, and those of single commands.
struct CommandOptions {
    std::string sysroot;  // empty: KEST_SYSROOT is left as it is
    std::string plugin;   // empty: the plug-in next to the program
    bool json = false;
    bool simulator = false;  // load the installed simulated controller library
    bool noWait = false;     // fail at once when another kestcfg holds the controller
    bool check = false;      // apply: validate and show the difference only
    bool diff = false;       // apply: show each difference with its old and new value
    std::optional<long long> confirmWithin;  // set, apply: seconds until an unconfirmed rollback
    std::string watch;  // rollback: the pending change whose deadline this process awaits
};

struct CommandContext {
    IuxSysExpert3* expert;  // null for commands that do not use the plug-in
    const std::vector<std::string>& arguments;
    const CommandOptions& options;
    Json& document;     // the --json result; written once the plug-in is unloaded
    std::ostream& out;  // text for people; unused with --json
    std::ostream& err;  // warnings and notes
    // This kestcfg's turn at changing the controller; null for commands that do not take one.
    ControllerTurn* turn = nullptr;
};

// A positional argument of a command, as its help shows it.
struct ArgumentDescription {
    const char* name;
    const char* help;
    bool required;
    bool repeated;  // takes every remaining argument
};

struct CommandDescription {
    std::string name;  // "sim init" for a command of a command group
    std::string summary;
    std::vector<ArgumentDescription> arguments;
    ExpertUse expertUse;
    // Runs the command; throws CommandFailure to end with a message and an exit code.
    void (*run)(CommandContext& context);
    // Whether the command changes the controller and therefore waits for its turn.
    bool takesTurn = false;
};

// Every command, in the order the usage text lists them.
const std::vector<CommandDescription>& AllCommands();

// The commands' bodies.
void RunInfo(CommandContext& context);
void RunItems(CommandContext& context);
void RunDescribe(CommandContext& context);
void RunGet(CommandContext& context);
void RunRefresh(CommandContext& context);
void RunSet(CommandContext& context);
void RunExport(CommandContext& context);
void RunApply(CommandContext& context);
void RunFirmware(CommandContext& context);
void RunFirmwareStatus(CommandContext& context);
void RunSim(CommandContext& context);
void RunConfirm(CommandContext& context);
void RunPending(CommandContext& context);
void RunRollback(CommandContext& context);

}  // namespace kest::cfg
