#include "HostFirmwareImage.h"

#include <fcntl.h>
#include <limits.h>
#include <stdlib.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <limits>

#include "ExitCodes.h"
#include "hostkit/HostText.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

// What a file that is not regular is, for the error message.
std::string KindOf(mode_t mode) {
    if (S_ISDIR(mode)) {
        return "a directory";
    }
    if (S_ISFIFO(mode)) {
        return "a FIFO";
    }
    if (S_ISCHR(mode) || S_ISBLK(mode)) {
        return "a device";
    }
    if (S_ISSOCK(mode)) {
        return "a socket";
    }
    return "not a regular file";
}

}  // namespace

HostFirmwareImage::HostFirmwareImage(const std::string& path) {
    descriptor_.Reset(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (!descriptor_.IsOpen()) {
        throw UsageError("cannot open the firmware image " + path + ": " + std::strerror(errno));
    }
    struct stat status {};
    if (fstat(descriptor_.Get(), &status) != 0) {
        const std::string reason = std::strerror(errno);
        throw UsageError("cannot examine the firmware image " + path + ": " + reason);
    }
    std::string problem;
    if (!S_ISREG(status.st_mode)) {
        problem = "is " + KindOf(status.st_mode) + ", not a regular file";
    } else if (status.st_size == 0) {
        problem = "is empty";
    } else if (static_cast<unsigned long long>(status.st_size) >
               std::numeric_limits<uint32_t>::max()) {
        problem = "is larger than 4 GiB less one byte";
    }
    char absolute[PATH_MAX];
    if (problem.empty() && realpath(path.c_str(), absolute) == nullptr) {
        problem = std::string("cannot be resolved: ") + std::strerror(errno);
    }
    if (!problem.empty()) {
        throw UsageError("the firmware image " + path + " " + problem);
    }
    path_ = absolute;
    size_ = static_cast<uint32_t>(status.st_size);
}

HostFirmwareImage::~HostFirmwareImage() {
    if (mapped_ != nullptr) {
        munmap(mapped_, size_);
    }
}

HRESULT HostFirmwareImage::QueryInterface(const IID& iid, void** object) {
    if (object == nullptr) {
        return E_POINTER;
    }
    if (iid == IID_IUnknown || iid == IID_IuxSysFirmwareImageSource ||
        iid == IID_IuxSysFirmwareImageFile) {
        AddRef();
        *object = static_cast<IuxSysFirmwareImageFile*>(this);
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
    return size_;
}

const uint8_t* HostFirmwareImage::GetImageBytes() {
    if (mapped_ == nullptr) {
        void* bytes = mmap(nullptr, size_, PROT_READ, MAP_PRIVATE, descriptor_.Get(), 0);
        mapped_ = bytes == MAP_FAILED ? nullptr : bytes;
    }
    return static_cast<const uint8_t*>(mapped_);
}

HRESULT HostFirmwareImage::GetImageFilePath(CvqBStr* path) {
    if (path == nullptr) {
        return E_POINTER;
    }
    const std::optional<std::wstring> wide = WideFromUtf8(path_);
    if (!wide) {
        return E_FAIL;
    }
    *path = CvqBStrAllocLen(wide->data(), wide->size());
    return *path != nullptr ? S_OK : E_OUTOFMEMORY;
}

}  // namespace kest::cfg
