#include "DeviceObject.h"

#include <new>
#include <utility>

namespace kest::sim {
namespace {

int32_t AssignText(vq::targetcfg::NarrowString& target, const std::string& text) noexcept {
    try {
        target = text;
        return vq::targetcfg::status::kSuccess;
    } catch (...) {
        return vq::targetcfg::status::kOutOfMemory;
    }
}

}  // namespace

DeviceObject::DeviceObject(uint32_t type, std::string interfaceName, std::string macAddress,
                           uint32_t index)
    : type_(type),
      interfaceName_(std::move(interfaceName)),
      macAddress_(std::move(macAddress)),
      index_(index) {}

uint32_t DeviceObject::AddRef() {
    return references_.fetch_add(1, std::memory_order_relaxed) + 1;
}

uint32_t DeviceObject::Release() {
    const uint32_t remaining = references_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (remaining == 0) {
        delete this;
    }
    return remaining;
}

int32_t DeviceObject::GetInterfaceName(vq::targetcfg::NarrowString& interfaceName) {
    return AssignText(interfaceName, interfaceName_);
}

int32_t DeviceObject::GetMACAddress(vq::targetcfg::NarrowString& macAddress) {
    return AssignText(macAddress, macAddress_);
}

}  // namespace kest::sim
