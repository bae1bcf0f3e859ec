// The part of set and apply that makes a change undo itself unless confirmed: before the change
// is persisted, the items' settings are saved in the pending-rollback record; afterwards a
// watcher process restores them at the deadline unless kestcfg confirm ends it first.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "Commands.h"
#include "hostkit/PropertyValue.h"

namespace kest::cfg {

// The values a command is about to persist on one item.
struct ItemRequest {
    std::wstring item;
    std::vector<std::pair<uint32_t, kest::hostkit::PropertyValue>> values;
};

// Starts the watcher of a saved pending change when it goes out of scope, after the change was
// persisted (or failed part-way), and says how to confirm. Does nothing for a plain change.
class ConfirmWatch {
  public:
    ConfirmWatch() = default;
    ConfirmWatch(CommandContext* context, std::string id, int64_t deadline);
    ~ConfirmWatch();
    ConfirmWatch(const ConfirmWatch&) = delete;
    ConfirmWatch& operator=(const ConfirmWatch&) = delete;

  private:
    CommandContext* context_ = nullptr;
    std::string id_;
    int64_t deadline_ = 0;
};

// Called under the controller turn just before persisting. With --confirm-within: refuses what
// cannot be rolled back (usage error) and a second pending change (busy), and saves the current
// settings of the requested items with the deadline. Without it: warns when a requested item
// has a pending change, which its rollback will undo.
ConfirmWatch PrepareConfirmableChange(CommandContext& context,
                                      const std::vector<ItemRequest>& requests);

}  // namespace kest::cfg
