// An exclusive advisory lock (flock) on a lock file, held for the object's lifetime: it orders a
// read-modify-write of a file across processes. The lock goes with the process, so a killed
// holder never blocks the next one.
// Thread safety: each lock opens its own file description, so it also orders threads of one
// process that each hold their own ExclusiveFileLock; one object belongs to one thread.
#pragma once

#include <string>

#include "support/FileDescriptor.h"

namespace vq {
namespace dsc {
namespace osdep {

class ExclusiveFileLock {
  public:
    // Opens or creates the lock file `path` (mode 0600, never through a symbolic link,
    // close-on-exec; it must be a regular file) and waits for its exclusive lock. A failure
    // raises vq::dsc::osdep::PosixError.
    explicit ExclusiveFileLock(const std::string& path);
    // Destroying it releases the lock.
    ExclusiveFileLock(const ExclusiveFileLock&) = delete;
    ExclusiveFileLock& operator=(const ExclusiveFileLock&) = delete;

  private:
    kest::FileDescriptor descriptor_;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
