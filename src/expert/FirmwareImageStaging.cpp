#include "expert/FirmwareImageStaging.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <new>
#include <random>
#include <vector>

#include "com/CountedPtr.h"
#include "support/Exceptions.h"
#include "support/FileDescriptor.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "support/WholeTransfer.h"
#include "uxsys/Expert.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr mode_t kStagingFileMode = 0600;
constexpr int kNameAttempts = 100;
constexpr size_t kCopyBlockSize = size_t{64} * 1024;

// A name for a new temporary beside the staging file: ".NAME." and six random letters.
std::string TemporaryName(const std::string& finalName) {
    static constexpr char kLetters[] =
        "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
    std::random_device random;
    std::string name = "." + finalName + ".";
    for (int i = 0; i < 6; ++i) {
        name += kLetters[random() % (sizeof kLetters - 1)];
    }
    return name;
}

// The directory part of `path`, which names a file.
std::string DirectoryOf(const std::string& path) {
    const std::string::size_type slash = path.rfind('/');
    if (slash == std::string::npos || slash + 1 == path.size()) {
        throw vq::dsc::osdep::PosixError("not a file path: " + path, EINVAL);
    }
    return slash == 0 ? "/" : path.substr(0, slash);
}

// The staging file's directory, opened, and the staging file's name in it.
struct StagingPlace {
    explicit StagingPlace(const std::string& stagingPath)
        : directory(open(DirectoryOf(stagingPath).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)),
          name(stagingPath.substr(stagingPath.rfind('/') + 1)) {
        if (!directory.IsOpen()) {
            throw vq::dsc::osdep::PosixError();
        }
    }

    kest::FileDescriptor directory;
    std::string name;
};

// A file under a temporary name in the staging directory; removed again unless it is committed.
// The directory may be writable by anyone: every temporary is a new name, created exclusively
// (a planted file or link is never opened), and the staging file only ever changes by a rename.
class StagingTemporary {
  public:
    explicit StagingTemporary(const StagingPlace& place) : place_(place) {}
    ~StagingTemporary() {
        if (!name_.empty()) {
            unlinkat(place_.directory.Get(), name_.c_str(), 0);
        }
    }
    StagingTemporary(const StagingTemporary&) = delete;
    StagingTemporary& operator=(const StagingTemporary&) = delete;

    // Creates a new empty file of ours, mode 0600, and returns it open for writing.
    kest::FileDescriptor Create() {
        for (int attempt = 0; attempt < kNameAttempts; ++attempt) {
            const std::string name = TemporaryName(place_.name);
            kest::FileDescriptor file(openat(
                place_.directory.Get(), name.c_str(),
                O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_NOCTTY | O_CLOEXEC, kStagingFileMode));
            if (file.IsOpen()) {
                name_ = name;
                return file;
            }
            if (errno != EEXIST) {
                throw vq::dsc::osdep::PosixError();
            }
        }
        throw vq::dsc::osdep::PosixError(EEXIST);
    }

    // Gives the file that `source` names (following symbolic links) a temporary name. False,
    // with nothing created, when it cannot be linked from here: another file system or a refused
    // link; other failures raise PosixError.
    bool Link(const std::string& source) {
        for (int attempt = 0; attempt < kNameAttempts; ++attempt) {
            const std::string name = TemporaryName(place_.name);
            if (linkat(AT_FDCWD, source.c_str(), place_.directory.Get(), name.c_str(),
                       AT_SYMLINK_FOLLOW) == 0) {
                name_ = name;
                return true;
            }
            if (errno == EXDEV || errno == EPERM) {
                return false;
            }
            if (errno != EEXIST) {
                throw vq::dsc::osdep::PosixError();
            }
        }
        throw vq::dsc::osdep::PosixError(EEXIST);
    }

    // Fails unless the temporary is a regular file: a pipe or device would stall the tool.
    void RequireRegularFile() const {
        struct stat status {};
        if (fstatat(place_.directory.Get(), name_.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
            throw vq::dsc::osdep::PosixError();
        }
        if (!S_ISREG(status.st_mode)) {
            throw vq::dsc::osdep::PosixError("the firmware image is not a regular file", EINVAL);
        }
    }

    // Renames the temporary over the staging file and syncs the directory, so that the new name
    // survives a power cut. A reader of the old staging file keeps reading the old image.
    void Commit() {
        if (renameat(place_.directory.Get(), name_.c_str(), place_.directory.Get(),
                     place_.name.c_str()) != 0) {
            throw vq::dsc::osdep::PosixError();
        }
        name_.clear();
        if (fsync(place_.directory.Get()) != 0) {
            throw vq::dsc::osdep::PosixError();
        }
    }

  private:
    const StagingPlace& place_;
    std::string name_;
};

// Writes all `count` bytes; a failure raises PosixError.
void WriteAll(int descriptor, const uint8_t* bytes, size_t count) {
    if (!kest::WriteWhole(descriptor, bytes, count)) {
        throw vq::dsc::osdep::PosixError();
    }
}

// Syncs and closes a temporary that was written.
void Finish(kest::FileDescriptor& file) {
    if (fsync(file.Get()) != 0 || file.Close() != 0) {
        throw vq::dsc::osdep::PosixError();
    }
}

// Copies the regular file `source` into `temporary`'s new file.
void CopyImageFile(const std::string& source, StagingTemporary& temporary) {
    // Non-blocking, so that opening a pipe cannot stall; it is refused right after.
    kest::FileDescriptor input(open(source.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (!input.IsOpen()) {
        throw vq::dsc::osdep::PosixError();
    }
    struct stat status {};
    if (fstat(input.Get(), &status) != 0) {
        throw vq::dsc::osdep::PosixError();
    }
    if (!S_ISREG(status.st_mode)) {
        throw vq::dsc::osdep::PosixError("the firmware image is not a regular file", EINVAL);
    }
    kest::FileDescriptor output = temporary.Create();
    std::vector<uint8_t> block(kCopyBlockSize);
    for (;;) {
        const ssize_t count = read(input.Get(), block.data(), block.size());
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            throw vq::dsc::osdep::PosixError();
        }
        if (count == 0) {
            break;
        }
        WriteAll(output.Get(), block.data(), static_cast<size_t>(count));
    }
    Finish(output);
}

HRESULT StageImageFile(IuxSysFirmwareImageFile& imageFile, const std::string& stagingPath) {
    CvqBStrHolder imagePath;
    if (FAILED(imageFile.GetImageFilePath(imagePath.Receive())) || imagePath.Get() == nullptr) {
        TraceIfEnabled("Cannot get the firmware image file path", kTraceErrors);
        return E_FAIL;
    }
    const std::string source =
        vq::dsc::NarrowFromWide(imagePath.Get(), CvqBStrLength(imagePath.Get()));
    const StagingPlace place(stagingPath);
    StagingTemporary temporary(place);
    if (temporary.Link(source)) {
        temporary.RequireRegularFile();
    } else {
        CopyImageFile(source, temporary);
    }
    temporary.Commit();
    return S_OK;
}

HRESULT StageImageBytes(IuxSysFirmwareImageSource& source, const std::string& stagingPath,
                        uint32_t announcedSize) {
    const uint8_t* bytes = source.GetImageBytes();
    const uint32_t count = source.GetImageSize();
    if (count != announcedSize) {
        return UX_E_FIRMWARE_STATUS_UNEXPECTED;
    }
    if (bytes == nullptr && count != 0) {
        return E_POINTER;
    }
    const StagingPlace place(stagingPath);
    StagingTemporary temporary(place);
    kest::FileDescriptor file = temporary.Create();
    WriteAll(file.Get(), bytes, count);
    Finish(file);
    temporary.Commit();
    return S_OK;
}

}  // namespace

HRESULT StageFirmwareImage(IUnknown* imageSource, const std::string& stagingPath,
                           uint32_t announcedSize) noexcept {
    if (imageSource == nullptr) {
        return E_POINTER;
    }
    try {
        CountedPtr<IuxSysFirmwareImageFile> imageFile;
        imageSource->QueryInterface(IID_IuxSysFirmwareImageFile, imageFile.ReceiveVoid());
        if (imageFile) {
            return StageImageFile(*imageFile, stagingPath);
        }
        // The host hands its image source over as IUnknown; its own slots follow those.
        return StageImageBytes(*static_cast<IuxSysFirmwareImageSource*>(imageSource), stagingPath,
                               announcedSize);
    } catch (const std::bad_alloc&) {
        TraceIfEnabled("Error allocating memory", kTraceErrors);
        return E_OUTOFMEMORY;
    } catch (const std::exception& failure) {
        TraceIfEnabled(std::string("Cannot stage the firmware image at ") + stagingPath + ": " +
                           failure.what(),
                       kTraceErrors);
        return E_FAIL;
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
