// A libvqtargetcfg.so.1 that answers every call the plug-in makes from fixed values in memory,
// with no file or system access, so that a benchmark can tell the plug-in's own cost apart from
// the simulated library's. It describes the same controller as the benchmarks' state file: the
// system settings and one Ethernet adapter eth0 at index 0. Setters accept and store nothing.
#include <atomic>
#include <cstring>

#include "vq/targetcfg/TargetConfig.h"

namespace vq {
namespace targetcfg {
namespace {

constexpr uint32_t kDeviceIndex = 0;
constexpr char kInterfaceName[] = "eth0";
constexpr char kMacAddress[] = "00:80:2F:12:34:56";
constexpr const char* kKnownZones[] = {"Europe/Berlin", "America/Chicago", "America/Los_Angeles"};

IPAddress Address(uint8_t a, uint8_t b, uint8_t c, uint8_t d) {
    const uint8_t bytes[] = {a, b, c, d};
    return IPAddress(bytes, sizeof bytes, vq::dsc::osdep::IPFamily::IPv4);
}

// Runs `body`, turning an allocation failure into the library's status.
template <class Body>
int32_t Answer(Body body) noexcept {
    try {
        body();
        return status::kSuccess;
    } catch (...) {
        return status::kOutOfMemory;
    }
}

// The one device, eth0; counted like the library's own device objects.
class DeviceDouble final : public IDeviceHandler {
  public:
    uint32_t AddRef() override { return references_.fetch_add(1) + 1; }
    uint32_t Release() override {
        const uint32_t remaining = references_.fetch_sub(1) - 1;
        if (remaining == 0) {
            delete this;
        }
        return remaining;
    }
    uint32_t GetDeviceType() override { return kDeviceTypeEthernet; }
    int32_t GetInterfaceName(NarrowString& interfaceName) override {
        return Answer([&] { interfaceName = kInterfaceName; });
    }
    int32_t GetMACAddress(NarrowString& macAddress) override {
        return Answer([&] { macAddress = kMacAddress; });
    }
    uint32_t GetDeviceIndex() override { return kDeviceIndex; }

  private:
    ~DeviceDouble() = default;
    std::atomic<uint32_t> references_{1};
};

}  // namespace

int32_t GetDeviceHandlers(vq::dsc::Vector<IDeviceHandler*>& deviceHandlers) {
    return Answer([&] {
        deviceHandlers.reserve(deviceHandlers.size() + 1);
        deviceHandlers.push_back(new DeviceDouble());
    });
}

namespace system {

int32_t GetDeviceDescription(NarrowString& description) {
    return Answer([&] { description = "KEST 9100"; });
}
int32_t GetTargetClass(NarrowString& targetClass) {
    return Answer([&] { targetClass = "KEST"; });
}
int32_t GetHostName(NarrowString& hostName) {
    return Answer([&] { hostName = "kest-1"; });
}
int32_t GetTargetID(uint32_t& targetId) {
    targetId = 7;
    return status::kSuccess;
}
int32_t GetSerialNumber(uint32_t& serialNumber) {
    serialNumber = 0x00123456;
    return status::kSuccess;
}
int32_t GetUserComment(WideString& comment) {
    return Answer([&] { comment = L"bench controller"; });
}
int32_t GetLanguageName(NarrowString& languageName) {
    return Answer([&] { languageName = "English"; });
}
int32_t GetSupportedLanguages(vq::dsc::Vector<NarrowString>& languageNames) {
    return Answer([&] {
        languageNames.push_back(NarrowString("English"));
        languageNames.push_back(NarrowString("German"));
    });
}
int32_t GetTimeZone(NarrowString& timeZone) {
    return Answer([&] { timeZone = "Europe/Berlin"; });
}
int32_t GetTimezoneOffset() {
    return 3600;
}
int32_t SetHostName(NarrowString /*hostName*/) {
    return status::kSuccess;
}
int32_t SetUserComment(NarrowString /*comment*/) {
    return status::kSuccess;
}
int32_t SetLanguageName(NarrowString /*localeCode*/) {
    return status::kSuccess;
}
int32_t SetTimeZone(NarrowString /*timeZone*/) {
    return status::kSuccess;
}
int32_t ValidateTimeZone(NarrowString timeZone) {
    for (const char* zone : kKnownZones) {
        if (std::strcmp(zone, timeZone.c_str()) == 0) {
            return status::kSuccess;
        }
    }
    return status::kValueInvalid;
}

}  // namespace system

namespace network {

int32_t GetFullyQualifiedDNSName(NarrowString& name) {
    return Answer([&] { name = "kest-1.bench"; });
}
int32_t GetMACAddressByIndex(uint32_t /*index*/, NarrowString& macAddress) {
    return Answer([&] { macAddress = kMacAddress; });
}
int32_t GetPrimaryDeviceIndex(uint32_t& index) {
    index = kDeviceIndex;
    return status::kSuccess;
}
int32_t SetPrimaryDeviceByIndex(uint32_t /*index*/) {
    return status::kSuccess;
}
int32_t GetDeviceModeByIndex(uint32_t /*index*/, uint32_t& mode) {
    mode = 2;
    return status::kSuccess;
}
int32_t GetDeviceSupportedModesByIndex(uint32_t /*index*/, uint32_t& modes) {
    modes = 3;
    return status::kSuccess;
}
int32_t GetDeviceTCPIPRequestModeByIndex(uint32_t /*index*/, uint32_t& requestMode) {
    requestMode = 1;
    return status::kSuccess;
}
int32_t GetDeviceSupportedTCPIPRequestModesByIndex(uint32_t /*index*/, uint32_t& requestModes) {
    requestModes = 3;
    return status::kSuccess;
}
int32_t GetIPAddressByIndex(uint32_t /*index*/, uint32_t addressSlot, IPAddress& address,
                            IPAddress& subnetMask, uint32_t* addressCount) {
    if (addressCount != nullptr) {
        *addressCount = 1;
    }
    if (addressSlot != 0) {
        return status::kNoAddress;
    }
    address = Address(192, 168, 1, 10);
    subnetMask = Address(255, 255, 255, 0);
    return status::kSuccess;
}
int32_t GetGatewayAddressByIndex(uint32_t /*index*/, IPAddress& gateway) {
    gateway = Address(192, 168, 1, 1);
    return status::kSuccess;
}
int32_t GetDNSServerAddressByIndex(uint32_t /*index*/, IPAddress& dnsServer) {
    dnsServer = Address(192, 168, 1, 2);
    return status::kSuccess;
}
int32_t SetDeviceIPConfigByIndex(uint32_t /*index*/, uint32_t /*addressSlot*/,
                                 uint32_t /*requestMode*/, uint32_t /*mode*/,
                                 const IPAddress& /*address*/, const IPAddress& /*subnetMask*/,
                                 const IPAddress& /*gateway*/, const IPAddress& /*dnsServer*/) {
    return status::kSuccess;
}
int32_t GetSupportedDeviceSettings(uint32_t /*index*/, uint32_t* mediaModes,
                                   uint32_t* pollingModes) {
    if (mediaModes != nullptr) {
        *mediaModes = 0x1F;
    }
    if (pollingModes != nullptr) {
        *pollingModes = 3;
    }
    return status::kSuccess;
}
int32_t GetCurrentDeviceSettings(uint32_t /*index*/, uint32_t* mediaMode, uint32_t* pollingMode,
                                 uint32_t* pollingInterval) {
    if (mediaMode != nullptr) {
        *mediaMode = 4;
    }
    if (pollingMode != nullptr) {
        *pollingMode = 1;
    }
    if (pollingInterval != nullptr) {
        *pollingInterval = 100;
    }
    return status::kSuccess;
}
int32_t GetPreferredMediaMode(uint32_t /*index*/, uint32_t* mediaMode) {
    if (mediaMode != nullptr) {
        *mediaMode = 4;
    }
    return status::kSuccess;
}
int32_t SetDeviceSettings(uint32_t /*index*/, uint32_t /*mediaMode*/, uint32_t /*pollingMode*/,
                          uint32_t /*pollingInterval*/) {
    return status::kSuccess;
}
int32_t GetEtherCATSettings(NarrowString /*macAddress*/, uint32_t& /*masterId*/, bool& hasFlag,
                            bool& /*flag*/) {
    hasFlag = false;
    return status::kSuccess;
}
int32_t SetEtherCATSettings(uint32_t /*index*/, uint32_t /*masterId*/, bool /*flag*/) {
    return status::kSuccess;
}
int32_t SetNetworkInterfaceState(NarrowString /*interfaceName*/, bool /*up*/) {
    return status::kSuccess;
}
int32_t GetAdapterState(uint32_t /*index*/, bool& up) {
    up = true;
    return status::kSuccess;
}

}  // namespace network
}  // namespace targetcfg
}  // namespace vq
