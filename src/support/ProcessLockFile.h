// A lock file that marks one holder across processes: an exclusive flock on a file in a
// directory that only root or the effective user can write; the file holds the holder's process
// id. The lock belongs to the open file description, so two openings in one process exclude each
// other too, and a program started with the descriptor keeps the lock until it ends.
// Thread safety: none of its own; threads that share one object serialise their calls.
#pragma once

#include <sys/types.h>

#include <string>
#include <utility>

#include "support/FileDescriptor.h"

namespace vq {
namespace dsc {
namespace osdep {

class ProcessLockFile {
  public:
    // Holds nothing. Destroying or moving over a held lock releases this process's hold; the
    // lock moves with the object and cannot be copied.
    ProcessLockFile() noexcept = default;

    // Opens the lock file `path` (created with mode 0600, its directory with 0755 when missing)
    // and takes the lock without waiting; the result holds nothing when another holds it, and
    // records this process otherwise. A directory that someone else may write, a file that is no
    // regular file of the effective user, or a failing open raises PosixError.
    static ProcessLockFile TryTake(const std::string& path);

    bool IsHeld() const noexcept { return descriptor_.IsOpen(); }
    // The descriptor that carries the lock; -1 when nothing is held.
    int Descriptor() const noexcept { return descriptor_.Get(); }

    // Writes `holder` to the file as the process that holds the lock.
    void RecordHolder(pid_t holder) noexcept;
    // Closes this process's descriptor: the lock is free unless a started program kept a copy.
    void Release() noexcept;

  private:
    explicit ProcessLockFile(kest::FileDescriptor descriptor) noexcept
        : descriptor_(std::move(descriptor)) {}

    kest::FileDescriptor descriptor_;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
