// The options of changes that undo themselves unless confirmed: --confirm-within on set and
// apply, and the watcher's --watch on rollback.
#pragma once

#include <CLI/CLI.hpp>
#include <string>

#include "Commands.h"

namespace kest::cfg {

// The longest time a change may wait for its confirmation, in seconds.
constexpr long long kLongestConfirmWithin = 3600;

// Adds the options that belong to command `name` to `command`.
void AddConfirmOptions(const std::string& name, CLI::App& command, CommandOptions& options);

}  // namespace kest::cfg
