#include "PendingChange.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <random>

#include "ControllerPath.h"
#include "ExitCodes.h"
#include "support/WholeTransfer.h"

namespace kest::cfg {

namespace {

constexpr char kRunDirectory[] = "/run/kest";

std::string SystemError(const std::string& what, const std::string& path) {
    return what + " " + path + ": " + std::strerror(errno);
}

// Opens the run directory, refusing one that another user owns or may write.
kest::FileDescriptor OpenRunDirectory() {
    const std::string path = ControllerPath(kRunDirectory);
    kest::FileDescriptor directory(
        open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    struct stat status {};
    if (!directory.IsOpen() || fstat(directory.Get(), &status) != 0) {
        throw Failure(SystemError("cannot open the run directory", path));
    }
    if ((status.st_uid != 0 && status.st_uid != geteuid()) || (status.st_mode & 022) != 0) {
        throw Failure("the run directory " + path +
                      " belongs to another user or others may write it");
    }
    return directory;
}

std::string BaseName(const std::string& path) {
    return path.substr(path.rfind('/') + 1);
}

}  // namespace

std::string PendingRollbackPath() {
    return ControllerPath(std::string(kRunDirectory) + "/pending-rollback.json");
}

std::string LastRollbackPath() {
    return ControllerPath(std::string(kRunDirectory) + "/last-rollback.json");
}

void WriteRecord(const std::string& path, const Json& record) {
    const kest::FileDescriptor directory = OpenRunDirectory();
    const std::string text = JsonText(record, 2) + "\n";
    const std::string name = BaseName(path);
    std::string temporary;
    kest::FileDescriptor file;
    for (int attempt = 0; !file.IsOpen() && attempt < 100; ++attempt) {
        temporary = "." + name + "." + NewChangeId();
        file.Reset(openat(directory.Get(), temporary.c_str(),
                          O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
        if (!file.IsOpen() && errno != EEXIST) {
            break;
        }
    }
    if (!file.IsOpen()) {
        throw Failure(SystemError("cannot create a temporary beside", path));
    }
    if (!kest::WriteWhole(file.Get(), text)) {
        const std::string message = SystemError("cannot write", path);
        unlinkat(directory.Get(), temporary.c_str(), 0);
        throw Failure(message);
    }
    if (fsync(file.Get()) != 0 ||
        renameat(directory.Get(), temporary.c_str(), directory.Get(), name.c_str()) != 0) {
        const std::string message = SystemError("cannot save", path);
        unlinkat(directory.Get(), temporary.c_str(), 0);
        throw Failure(message);
    }
    fsync(directory.Get());
}

kest::FileDescriptor OpenRecord(const std::string& path) {
    kest::FileDescriptor file(open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    if (!file.IsOpen() && errno != ENOENT) {
        throw Failure(SystemError("cannot open", path));
    }
    return file;
}

Json ReadRecordFrom(int descriptor, const std::string& path) {
    std::string text;
    char block[4096];
    for (off_t offset = 0;;) {
        const ssize_t count = pread(descriptor, block, sizeof block, offset);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            throw Failure(SystemError("cannot read", path));
        }
        if (count == 0) {
            break;
        }
        text.append(block, static_cast<size_t>(count));
        offset += count;
    }
    try {
        return Json::parse(text);
    } catch (const Json::exception& error) {
        throw Failure("the record " + path + " is damaged: " + error.what());
    }
}

std::optional<Json> ReadRecord(const std::string& path) {
    const kest::FileDescriptor file = OpenRecord(path);
    if (!file.IsOpen()) {
        return std::nullopt;
    }
    return ReadRecordFrom(file.Get(), path);
}

bool HeldByAnother(int descriptor) {
    const kest::FileDescriptor probe(open(("/proc/self/fd/" + std::to_string(descriptor)).c_str(),
                                          O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    return probe.IsOpen() && flock(probe.Get(), LOCK_SH | LOCK_NB) != 0 && errno == EWOULDBLOCK;
}

bool StillAt(int descriptor, const std::string& path) {
    struct stat open {};
    struct stat named {};
    return fstat(descriptor, &open) == 0 && lstat(path.c_str(), &named) == 0 &&
           open.st_dev == named.st_dev && open.st_ino == named.st_ino;
}

std::string NewChangeId() {
    static std::mt19937_64 generator{std::random_device{}()};
    char text[40];
    snprintf(text, sizeof text, "%d-%016llx", static_cast<int>(getpid()),
             static_cast<unsigned long long>(generator()));
    return text;
}

std::string UtcText(int64_t seconds) {
    const time_t value = static_cast<time_t>(seconds);
    struct tm parts {};
    char text[32] = "?";
    if (gmtime_r(&value, &parts) != nullptr) {
        strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%SZ", &parts);
    }
    return text;
}

}  // namespace kest::cfg
