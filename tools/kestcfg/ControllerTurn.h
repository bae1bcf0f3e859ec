// The turn of one kestcfg at changing the controller: an exclusive lock on the file
// "/run/kest/kestcfg.lock" (under KEST_SYSROOT when it is set), so that commands that read the
// controller's settings and write them back do not interleave. It orders kestcfg processes among
// themselves only; other hosts of the plug-in do not take it.
#pragma once

#include <ostream>

#include "support/FileDescriptor.h"

namespace kest::cfg {

class ControllerTurn {
  public:
    // Waits for the turn, saying once on `err` that it waits for another kestcfg; with `noWait`
    // fails at once with kExitBusy instead. A lock file that cannot be opened is a failure.
    ControllerTurn(bool noWait, std::ostream& err);
    // Ends the turn.
    ~ControllerTurn();
    ControllerTurn(const ControllerTurn&) = delete;
    ControllerTurn& operator=(const ControllerTurn&) = delete;

    // Lets the next kestcfg go now.
    void End();

  private:
    kest::FileDescriptor descriptor_;
};

}  // namespace kest::cfg
