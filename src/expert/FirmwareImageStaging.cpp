#include "expert/FirmwareImageStaging.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <new>

#include "com/CountedPtr.h"
#include "expert/FileDescriptor.h"
#include "support/Exceptions.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "uxsys/Expert.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr mode_t kStagingFileMode = 0600;

HRESULT LinkImageFile(IuxSysFirmwareImageFile& imageFile, const std::string& stagingPath) {
    CvqBStrHolder imagePath;
    if (FAILED(imageFile.GetImageFilePath(imagePath.Receive())) || imagePath.Get() == nullptr) {
        TraceIfEnabled("Cannot get the firmware image file path", kTraceErrors);
        return E_FAIL;
    }
    const std::string source =
        vq::dsc::NarrowFromWide(imagePath.Get(), CvqBStrLength(imagePath.Get()));
    if (link(source.c_str(), stagingPath.c_str()) != 0) {
        const vq::dsc::osdep::PosixError failure;
        TraceIfEnabled(
            "Cannot link the firmware image file to " + stagingPath + ": " + failure.what(),
            kTraceErrors);
        return E_FAIL;
    }
    return S_OK;
}

// Opens the staging file for writing and empties it. The directory may be writable by anyone,
// so nothing but a regular file of our own is accepted: no symbolic link, no device or pipe, and
// no file that another name shares (writing would change that other file too).
FileDescriptor OpenEmptyStagingFile(const std::string& stagingPath) {
    FileDescriptor file(open(stagingPath.c_str(),
                             O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC,
                             kStagingFileMode));
    if (!file.IsOpen()) {
        throw vq::dsc::osdep::PosixError();
    }
    struct stat status {};
    if (fstat(file.Get(), &status) != 0) {
        throw vq::dsc::osdep::PosixError();
    }
    if (!S_ISREG(status.st_mode) || status.st_nlink != 1) {
        throw vq::dsc::osdep::PosixError("not a regular file with one name: " + stagingPath,
                                         EINVAL);
    }
    if (ftruncate(file.Get(), 0) != 0) {
        throw vq::dsc::osdep::PosixError();
    }
    return file;
}

void WriteAll(int descriptor, const uint8_t* bytes, uint32_t count) {
    size_t done = 0;
    while (done < count) {
        const ssize_t written = write(descriptor, bytes + done, count - done);
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            throw vq::dsc::osdep::PosixError(written < 0 ? errno : EIO);
        }
        done += static_cast<size_t>(written);
    }
}

HRESULT WriteImageBytes(IuxSysFirmwareImageSource& source, const std::string& stagingPath,
                        uint32_t announcedSize) {
    const uint8_t* bytes = source.GetImageBytes();
    const uint32_t count = source.GetImageSize();
    if (count != announcedSize) {
        return UX_E_FIRMWARE_STATUS_UNEXPECTED;
    }
    if (bytes == nullptr && count != 0) {
        return E_POINTER;
    }
    FileDescriptor file = OpenEmptyStagingFile(stagingPath);
    WriteAll(file.Get(), bytes, count);
    if (file.Close() != 0) {
        throw vq::dsc::osdep::PosixError();
    }
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
            return LinkImageFile(*imageFile, stagingPath);
        }
        // The host hands its image source over as IUnknown; its own slots follow those.
        return WriteImageBytes(*static_cast<IuxSysFirmwareImageSource*>(imageSource), stagingPath,
                               announcedSize);
    } catch (const std::bad_alloc&) {
        TraceIfEnabled("Error allocating memory", kTraceErrors);
        return E_OUTOFMEMORY;
    } catch (const std::exception& failure) {
        TraceIfEnabled(std::string("Cannot stage the firmware image: ") + failure.what(),
                       kTraceErrors);
        return E_FAIL;
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
