// kestcfg's commands: each one drives the expert through its host interfaces, or prepares files,
// and prints the result as text for people or as JSON for scripts.
#pragma once

#include <cstddef>
#include <ostream>
#include <string>
#include <vector>

#include "ControllerTurn.h"
#include "uxsys/Expert.h"

// What a command needs of the plug-in.
enum class ExpertUse {
    kNone,      // the plug-in is not loaded
    kIdentity,  // a fresh expert; Initialize is not called
    kItems,     // an expert between Initialize and Uninitialize
};

struct CommandContext {
    IuxSysExpert3* expert;  // null for commands that do not use the plug-in
    const std::vector<std::string>& arguments;
    bool json;
    std::ostream& out;
    std::ostream& err;  // warnings and notes
    // This kestcfg's turn at changing the controller; null for commands that do not take one.
    ControllerTurn* turn = nullptr;
};

struct CommandDescription {
    std::string name;
    std::string synopsis;  // the command with its arguments, as the usage text shows it
    std::string summary;
    size_t minArguments;
    size_t maxArguments;  // SIZE_MAX: no limit
    ExpertUse expertUse;
    // Runs the command; throws CommandFailure to end with a message and an exit code.
    void (*run)(CommandContext& context);
    // Whether the command changes the controller and therefore waits for its turn.
    bool takesTurn = false;
};

// Every command, in the order the usage text lists them.
const std::vector<CommandDescription>& AllCommands();

// The command called `name`, or null.
const CommandDescription* FindCommand(const std::string& name);

// The commands' bodies.
void RunInfo(CommandContext& context);
void RunItems(CommandContext& context);
void RunGet(CommandContext& context);
void RunRefresh(CommandContext& context);
void RunSet(CommandContext& context);
void RunFirmware(CommandContext& context);
void RunSim(CommandContext& context);
