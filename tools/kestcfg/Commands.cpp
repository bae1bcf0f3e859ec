#include "Commands.h"

const std::vector<CommandDescription>& AllCommands() {
    static const char kItemHelp[] = "the item: its name as 'kestcfg items' lists it, or chassis";
    static const std::vector<CommandDescription> commands = {
        {"info", "show the expert's identity", {}, ExpertUse::kIdentity, &RunInfo},
        {"items", "list the configurable items", {}, ExpertUse::kItems, &RunItems},
        {"describe",
         "explain every property of each item, or of ITEM: type, changeable, values, meaning",
         {{"ITEM", kItemHelp, false, false}},
         ExpertUse::kItems,
         &RunDescribe},
        {"get",
         "show the properties of every item, or of ITEM, or only the NAMEd ones",
         {{"ITEM", kItemHelp, false, false},
          {"NAME", "a property name or tag number", false, true}},
         ExpertUse::kItems,
         &RunGet},
        {"refresh",
         "read the named properties of ITEM afresh",
         {{"ITEM", kItemHelp, true, false}, {"TAG", "a property name or tag number", true, true}},
         ExpertUse::kItems,
         &RunRefresh},
        {"set",
         "validate and persist changed properties of ITEM, and report what was stored",
         {{"ITEM", kItemHelp, true, false},
          {"NAME=VALUE", "a property and its new value", true, true}},
         ExpertUse::kItems,
         &RunSet},
        {"firmware",
         "install the firmware image file IMAGE on ITEM, showing the update's progress",
         {{"ITEM", kItemHelp, true, false}, {"IMAGE", "the firmware image file", true, false}},
         ExpertUse::kItems,
         &RunFirmware},
        {"sim init",
         "create a demo controller under DIR (use DIR as the sysroot)",
         {{"DIR", "a new directory, or an empty one of your own", true, false}},
         ExpertUse::kNone,
         &RunSim},
    };
    return commands;
}
