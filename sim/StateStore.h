// The simulated controller's files under one sysroot: "var/lib/vqtargetcfg/state.ini", the lock
// file beside it and the call log "calls.log". Failures throw StoreFailure.
// Thread safety: a StateStore and a FileLock belong to the call that made them; RunCall holds the
// process's call mutex and the FileLock around every Load and Save.
#pragma once

#include <optional>
#include <stdexcept>
#include <string>

#include "StateDocument.h"
#include "support/FileDescriptor.h"

namespace kest::sim {

// A file operation of the store failed; what() names the operation, the path and the reason.
class StoreFailure : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// The sysroot directory named by KEST_SYSROOT (read with secure_getenv at every call), without
// trailing slashes (so "/" gives the empty text); nothing when the variable is unset, empty or
// relative.
std::optional<std::string> CurrentSysroot();

class StateStore {
  public:
    explicit StateStore(const std::string& sysroot);

    // Creates the state directory and its parents when missing.
    void EnsureDirectory() const;
    // Reads state.ini; a missing file is an empty document.
    StateDocument Load() const;
    // Replaces state.ini atomically: a temporary file in the same directory is written, flushed
    // with fsync and renamed over it; then the directory is flushed.
    void Save(const StateDocument& document) const;
    // Appends `line` (with its line end) to calls.log in one write.
    void AppendCallLog(const std::string& line) const;

    std::string LockPath() const { return directory_ + "/state.lock"; }

  private:
    std::string StatePath() const { return directory_ + "/state.ini"; }
    std::string CallLogPath() const { return directory_ + "/calls.log"; }

    std::string directory_;
};

// An exclusive flock on a lock file (created when missing), held for the object's lifetime, so
// that processes sharing a sysroot do not interleave their read-modify-write cycles.
class FileLock {
  public:
    explicit FileLock(const std::string& path);
    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;

  private:
    kest::FileDescriptor fd_;
};

}  // namespace kest::sim
