#include "trace/TraceLog.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "support/FileDescriptor.h"
#include "support/WholeTransfer.h"
#include "trace/FreeSpace.h"

namespace kest::trace {

const char* const kAbortMessage =
    "** Available disk space is below the desired threshold. Aborting tracing. **";

namespace {

constexpr mode_t kLogFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH;

// Opens the log for appending without following a symbolic link. The log directory may be
// writable by everyone: the file is created exclusively, and an existing one is kept only when
// it is a regular file with one link, or else a planted link would make this process append to a
// file of someone else's choosing. Returns the descriptor, -1 when the attempt costs only the
// line, or kRefused when the file belongs to another user (file output then stays off).
constexpr int kRefused = -2;

int OpenLogFile(const std::string& path) {
    constexpr int kFlags = O_WRONLY | O_APPEND | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
    constexpr int kAttempts = 3;  // an existing file may vanish before it is opened
    kest::FileDescriptor file;
    for (int attempt = 0; !file.IsOpen() && attempt < kAttempts; ++attempt) {
        int descriptor;
        do {
            descriptor = open(path.c_str(), kFlags | O_CREAT | O_EXCL, kLogFileMode);
        } while (descriptor < 0 && errno == EINTR);
        file.Reset(descriptor);
        if (file.IsOpen() || errno != EEXIST) {
            break;
        }
        do {
            descriptor = open(path.c_str(), kFlags);
        } while (descriptor < 0 && errno == EINTR);
        file.Reset(descriptor);
    }
    if (!file.IsOpen()) {
        return -1;
    }
    struct stat status;
    if (fstat(file.Get(), &status) != 0 || !S_ISREG(status.st_mode) || status.st_nlink != 1) {
        return -1;
    }
    if (status.st_uid != geteuid()) {
        return kRefused;
    }
    return file.Release();
}

// Writes the record (whole lines) with one call, so that appends of other processes cannot
// split it; a failed write costs only the record.
void WriteRecord(int descriptor, const std::string& record) {
    static_cast<void>(kest::WriteWhole(descriptor, record));
}

}  // namespace

bool TraceLog::SetLocation(std::string directory, const std::string& fileName) {
    if (directory.empty()) {
        return false;
    }
    if (directory.back() != '/' && directory.back() != '\\') {
        directory += '/';
    }
    std::string path = directory + fileName;
    if (directory.size() > kMaxLogPathLength || path.size() > kMaxLogPathLength) {
        return false;
    }
    path_ = std::move(path);
    directory_ = path_.substr(0, path_.rfind('/') + 1);
    return true;
}

bool TraceLog::SpaceIsShort(uint32_t threshold) const {
    uint64_t freeBytes = 0;
    return CurrentFreeSpaceMeasure()(directory_.empty() ? "." : directory_.c_str(), nullptr,
                                     &freeBytes) != 0 ||
           freeBytes < threshold;
}

const char* TraceLog::Append(const char* line, uint32_t threshold) {
    if (path_.empty()) {
        return line;
    }
    if (!descriptor_.IsOpen() && !aborted_) {
        if (threshold != 0 && SpaceIsShort(threshold)) {
            aborted_ = true;
        } else {
            Open();
        }
    }
    if (!descriptor_.IsOpen()) {
        return line;
    }
    if (threshold != 0 && SpaceIsShort(threshold)) {
        aborted_ = true;
        line = kAbortMessage;
    }
    WriteRecord(descriptor_.Get(), std::string(line) + '\n');
    if (aborted_) {
        Close();
    }
    return line;
}

void TraceLog::AppendTwoLines(const char* first, const char* second) {
    if (path_.empty()) {
        return;
    }
    if (!descriptor_.IsOpen() && !aborted_) {
        Open();
    }
    if (!descriptor_.IsOpen()) {
        return;
    }
    std::string record(first);
    record += '\n';
    record += second;
    record += '\n';
    WriteRecord(descriptor_.Get(), record);
}

void TraceLog::Open() {
    const int descriptor = OpenLogFile(path_);
    if (descriptor == kRefused) {
        aborted_ = true;
    } else {
        descriptor_.Reset(descriptor);
    }
}

void TraceLog::Close() {
    descriptor_.Reset();
}

}  // namespace kest::trace
