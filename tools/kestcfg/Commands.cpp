#include "Commands.h"

#include <cstdint>

const std::vector<CommandDescription>& AllCommands() {
    static const std::vector<CommandDescription> commands = {
        {"info", "info", "show the expert's identity", 0, 0, ExpertUse::kIdentity, &RunInfo},
        {"items", "items", "list the configurable items", 0, 0, ExpertUse::kItems, &RunItems},
        {"get", "get [ITEM]", "show all properties of every item, or of ITEM", 0, 1,
         ExpertUse::kItems, &RunGet},
        {"refresh", "refresh ITEM TAG...", "read the named properties of ITEM afresh", 2, SIZE_MAX,
         ExpertUse::kItems, &RunRefresh},
        {"set", "set ITEM NAME=VALUE...", "validate and persist changed properties of ITEM", 2,
         SIZE_MAX, ExpertUse::kItems, &RunSet, true},
        {"firmware", "firmware ITEM IMAGE",
         "install the firmware image file IMAGE on ITEM, showing the update's progress", 2, 2,
         ExpertUse::kItems, &RunFirmware, true},
        {"sim", "sim init DIR", "create a demo controller under DIR (use DIR as the sysroot)", 2, 2,
         ExpertUse::kNone, &RunSim},
    };
    return commands;
}

const CommandDescription* FindCommand(const std::string& name) {
    for (const CommandDescription& command : AllCommands()) {
        if (command.name == name) {
            return &command;
        }
    }
    return nullptr;
}
