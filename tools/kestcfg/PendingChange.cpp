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
#include "WholeWrite.h"

namespace {

constexpr char kRunDirectory[] = "/run/kest";

std::string SystemError(const std::string& what, const std::string& path) {
    return what + " " + path + ": " + std::strerror(errno);
}

// Closes a descriptor on every path.
struct Descriptor {
    int value;
    ~Descriptor() {
        if (value >= 0) {
            close(value);
        }
    }
};

// Opens the run directory, refusing one that another user owns or may write.
int OpenRunDirectory() {
    const std::string path = ControllerPath(kRunDirectory);
    const int directory = open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    struct stat status {};
    if (directory < 0 || fstat(directory, &status) != 0) {
        const std::string message = SystemError("cannot open the run directory", path);
        if (directory >= 0) {
            close(directory);
        }
        throw Failure(message);
    }
    if ((status.st_uid != 0 && status.st_uid != geteuid()) || (status.st_mode & 022) != 0) {
        close(directory);
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
    const Descriptor directory{OpenRunDirectory()};
    const std::string text = JsonText(record, 2) + "\n";
    const std::string name = BaseName(path);
    std::string temporary;
    int file = -1;
    for (int attempt = 0; file < 0 && attempt < 100; ++attempt) {
        temporary = "." + name + "." + NewChangeId();
        file = openat(directory.value, temporary.c_str(),
                      O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600);
        if (file < 0 && errno != EEXIST) {
            break;
        }
    }
    if (file < 0) {
        throw Failure(SystemError("cannot create a temporary beside", path));
    }
    const Descriptor written{file};
    if (!WriteWhole(file, text)) {
        const std::string message = SystemError("cannot write", path);
        unlinkat(directory.value, temporary.c_str(), 0);
        throw Failure(message);
    }
    if (fsync(file) != 0 ||
        renameat(directory.value, temporary.c_str(), directory.value, name.c_str()) != 0) {
        const std::string message = SystemError("cannot save", path);
        unlinkat(directory.value, temporary.c_str(), 0);
        throw Failure(message);
    }
    fsync(directory.value);
}

int OpenRecord(const std::string& path) {
    const int file = open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
    if (file < 0 && errno != ENOENT) {
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
    const Descriptor file{OpenRecord(path)};
    if (file.value < 0) {
        return std::nullopt;
    }
    return ReadRecordFrom(file.value, path);
}

bool HeldByAnother(int descriptor) {
    const int probe = open(("/proc/self/fd/" + std::to_string(descriptor)).c_str(),
                           O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (probe < 0) {
        return false;
    }
    const bool held = flock(probe, LOCK_SH | LOCK_NB) != 0 && errno == EWOULDBLOCK;
    close(probe);
    return held;
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
