#include "HostFirmwareImage.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <limits>

#include "ExitCodes.h"
#include "uxsys/StatusCodes.h"

HostFirmwareImage::HostFirmwareImage(const std::string& path) {
    // Non-blocking, so that a pipe given as the image cannot stall the open; close-on-exec, so
    // that the update tool does not inherit it.
    const int file = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (file < 0) {
        throw Failure("cannot open the firmware image " + path + ": " + std::strerror(errno));
    }
    struct stat status {};
    std::string problem;
    if (fstat(file, &status) != 0 || !S_ISREG(status.st_mode)) {
        problem = "cannot read the firmware image " + path + ": not a regular file";
    } else if (static_cast<uint64_t>(status.st_size) > std::numeric_limits<uint32_t>::max()) {
        problem = "the firmware image " + path + " is larger than 4 GiB less one byte";
    }
    uint8_t block[65536];
    while (problem.empty()) {
        const ssize_t count = read(file, block, sizeof block);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            problem = "cannot read the firmware image " + path + ": " + std::strerror(errno);
        } else if (count == 0) {
            break;
        } else {
            bytes_.insert(bytes_.end(), block, block + count);
        }
    }
    close(file);
    if (problem.empty() && bytes_.size() > std::numeric_limits<uint32_t>::max()) {
        problem = "the firmware image " + path + " is larger than 4 GiB less one byte";
    }
    if (!problem.empty()) {
        throw Failure(problem);
    }
}

HRESULT HostFirmwareImage::QueryInterface(const IID& iid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (iid == IID_IUnknown || iid == IID_IuxSysFirmwareImageSource) {
        AddRef();
        *object = static_cast<IuxSysFirmwareImageSource*>(this);
        return S_OK;
    }
    *object = nullptr;
    return E_NOINTERFACE;
}

uint32_t HostFirmwareImage::AddRef() {
    return ++references_;
}

uint32_t HostFirmwareImage::Release() {
    return --references_;
}

uint32_t HostFirmwareImage::GetImageSize() {
    return static_cast<uint32_t>(bytes_.size());
}

const uint8_t* HostFirmwareImage::GetImageBytes() {
    return bytes_.data();
}
