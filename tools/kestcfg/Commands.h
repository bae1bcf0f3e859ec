// kestcfg's commands: each one drives the expert through its host interfaces and prints the
// result as text or JSON.
#pragma once

#include <cstddef>
#include <ostream>
#include <string>
#include <vector>

#include "uxsys/Expert.h"

struct CommandContext {
    IuxSysExpert3* expert;
    const std::vector<std::string>& arguments;
    bool json;
    std::ostream& out;
};

struct CommandDescription {
    std::string name;
    std::string synopsis;  // the command with its arguments, as the usage text shows it
    std::string summary;
    size_t minArguments;
    size_t maxArguments;
    // Runs the command; throws CommandFailure to end with a message and an exit code.
    void (*run)(CommandContext& context);
};

// Every command, in the order the usage text lists them.
const std::vector<CommandDescription>& AllCommands();

// The command called `name`, or null.
const CommandDescription* FindCommand(const std::string& name);
