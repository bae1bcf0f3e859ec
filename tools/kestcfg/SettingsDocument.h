// The settings document that export writes and apply reads, for the commands that use both.
#pragma once

#include <string>
#include <vector>

#include "Commands.h"

namespace kest::cfg {

// The changeable settings of `items` as {"items": {ITEM: {NAME: VALUE...}...}}.
Json ExportSettings(IuxSysExpert3* expert, const std::vector<std::wstring>& items);

// Makes the controller's settings match `desired` as apply does; `path` names the document in
// messages. Throws CommandFailure as apply ends.
void ApplySettings(CommandContext& context, const Json& desired, const std::string& path);

}  // namespace kest::cfg
