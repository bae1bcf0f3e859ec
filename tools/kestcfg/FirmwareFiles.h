// The files through which a firmware update on the controller can be followed from any process:
// the update tool's status file and the update lock, both resolved under KEST_SYSROOT.
#pragma once

#include <sys/types.h>
#include <optional>
#include <string>

namespace kest::cfg {

// The first non-blank character of the tool's status file; nothing when there is none.
std::optional<char> StatusFileCode();

// What a status-file character means ("stage 3 of 5", "failed (code d)", ...).
std::string StatusCodeMeaning(char code);

struct UpdateLock {
    bool present = false;      // the lock file exists
    bool held = false;         // a process holds the lock: an update runs
    std::optional<pid_t> pid;  // the process id the lock file holds
};

// The update lock's state, found without taking the lock.
UpdateLock ReadUpdateLock();

}  // namespace kest::cfg
