// The pending change's files in the controller's run directory (under KEST_SYSROOT): the
// pending-rollback record, which holds the deadline and the settings a rollback restores, and
// the record of the last rollback. Each is replaced whole; the watcher holds a lock on the
// pending record while it lives.
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <optional>
#include <string>

#include "JsonOutput.h"
#include "support/FileDescriptor.h"

namespace kest::cfg {

// "/run/kest/pending-rollback.json" and "/run/kest/last-rollback.json" under the sysroot.
std::string PendingRollbackPath();
std::string LastRollbackPath();

// Writes `record` to `path` as a new file of mode 0600 (unique temporary, sync, rename, sync of
// the directory), in a directory that is ours or root's and that no one else may write.
void WriteRecord(const std::string& path, const Json& record);

// The record at `path`; nothing when there is none. An unreadable record is a failure.
std::optional<Json> ReadRecord(const std::string& path);

// The record held by an open descriptor.
Json ReadRecordFrom(int descriptor, const std::string& path);

// Opens `path` close-on-exec without following a symbolic link; nothing is open when it does
// not exist.
kest::FileDescriptor OpenRecord(const std::string& path);

// True while a process holds the lock on the file `descriptor` refers to.
bool HeldByAnother(int descriptor);

// True while `descriptor` and `path` name the same file.
bool StillAt(int descriptor, const std::string& path);

// A new identifier for a pending change.
std::string NewChangeId();

// Seconds since the epoch as "2030-01-02T03:04:05Z".
std::string UtcText(int64_t seconds);

}  // namespace kest::cfg
