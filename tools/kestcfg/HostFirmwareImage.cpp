#include "HostFirmwareImage.h"

#include <cerrno>
#include <cstring>
#include <fstream>
#include <iterator>
#include <limits>

#include "ExitCodes.h"
#include "uxsys/StatusCodes.h"

HostFirmwareImage::HostFirmwareImage(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw Failure("cannot open the firmware image " + path + ": " + std::strerror(errno));
    }
    bytes_.assign(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
    if (file.bad()) {
        throw Failure("cannot read the firmware image " + path);
    }
    if (bytes_.size() > std::numeric_limits<uint32_t>::max()) {
        throw Failure("the firmware image " + path + " is larger than 4 GiB less one byte");
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
