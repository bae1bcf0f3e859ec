#include "support/SystemClock.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <unistd.h>

#include <cerrno>
#include <string>

#include "support/Exceptions.h"
#include "support/FileDescriptor.h"
#include "support/PathHelpers.h"
#include "support/Sysroot.h"
#include "support/WholeTransfer.h"

namespace kest {
namespace {

// The redirected clock file is readable by everyone; its directory is searchable by everyone.
constexpr mode_t kClockFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH;
constexpr mode_t kClockDirectoryMode = S_IRWXU | S_IRGRP | S_IXGRP | S_IROTH | S_IXOTH;

// A new temporary file, removed again unless it was renamed into place.
class TemporaryFile {
  public:
    explicit TemporaryFile(std::string pathTemplate) : path_(std::move(pathTemplate)) {
        descriptor_.Reset(mkostemp(&path_[0], O_CLOEXEC));
        if (!descriptor_.IsOpen()) {
            throw vq::dsc::osdep::PosixError();
        }
    }
    ~TemporaryFile() {
        descriptor_.Reset();
        if (!renamed_) {
            unlink(path_.c_str());
        }
    }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    void Write(const std::string& content) {
        if (!WriteWhole(descriptor_.Get(), content)) {
            throw vq::dsc::osdep::PosixError();
        }
    }

    // Makes the file readable by everyone, flushes it and moves it to `target` atomically.
    void ReplaceFile(const std::string& target) {
        if (fchmod(descriptor_.Get(), kClockFileMode) != 0 || fsync(descriptor_.Get()) != 0 ||
            descriptor_.Close() != 0) {
            throw vq::dsc::osdep::PosixError();
        }
        if (rename(path_.c_str(), target.c_str()) != 0) {
            throw vq::dsc::osdep::PosixError();
        }
        renamed_ = true;
    }

  private:
    std::string path_;
    FileDescriptor descriptor_;
    bool renamed_ = false;
};

void WriteRedirectedClock(int64_t seconds, int64_t microseconds) {
    const std::string target = paths::RedirectedSystemClockFile();
    const std::string directory = target.substr(0, target.rfind('/'));
    vq::dsc::osdep::CreateDirectories(directory, kClockDirectoryMode);
    TemporaryFile file(target + ".XXXXXX");
    file.Write(std::to_string(seconds) + " " + std::to_string(microseconds) + "\n");
    file.ReplaceFile(target);
}

}  // namespace

void SetSystemClock(int64_t seconds, int64_t microseconds) {
    if (microseconds < 0 || microseconds > 999999) {
        throw vq::dsc::exception::InvalidArgument();
    }
    // Where time_t has 32 bits, a time past January 2038 would wrap to 1901.
    if (static_cast<int64_t>(static_cast<time_t>(seconds)) != seconds) {
        throw vq::dsc::exception::OutOfRange();
    }
    if (HasSysroot()) {
        WriteRedirectedClock(seconds, microseconds);
        return;
    }
    timeval time{};
    time.tv_sec = static_cast<time_t>(seconds);
    time.tv_usec = static_cast<suseconds_t>(microseconds);
    if (settimeofday(&time, nullptr) != 0) {
        throw vq::dsc::osdep::PosixError();
    }
}

}  // namespace kest
