// vq::targetcfg::network: the [Network] section and the device sections of the state file.
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

#include "SimulatedCall.h"
#include "vq/targetcfg/Network.h"

namespace vq {
namespace targetcfg {
namespace network {
namespace {

using kest::sim::CallArguments;
using kest::sim::ControllerState;
using kest::sim::NoInputs;
using kest::sim::RunCall;

// Runs a call on the device with `index`: its log line has the index, then `moreInputs`; with no
// such device the result is status::kInvalidArgument, otherwise body(state, deviceSection).
template <class Inputs, class Body>
int32_t DeviceCall(const char* callName, uint32_t index, Inputs moreInputs, Body body) {
    return RunCall(
        callName,
        [&](CallArguments& arguments) {
            arguments.Unsigned(index);
            moreInputs(arguments);
        },
        [&](ControllerState& state) -> int32_t {
            const std::string device = state.FindDevice(index);
            if (device.empty()) {
                return status::kInvalidArgument;
            }
            return body(state, device);
        });
}

// A device getter of the number under `key`; the output stays unchanged when it is absent.
int32_t GetDeviceUnsigned(const char* callName, uint32_t index, const char* key, uint32_t& output) {
    return DeviceCall(callName, index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          uint32_t value = output;
                          state.GetUnsigned(device, key, value);
                          output = value;
                          return status::kSuccess;
                      });
}

// A device getter of the address under `key`; the output stays unchanged when it is absent.
int32_t GetDeviceAddress(const char* callName, uint32_t index, const char* key, IPAddress& output) {
    return DeviceCall(callName, index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          IPAddress value = output;
                          state.GetAddress(device, key, value);
                          output = value;
                          return status::kSuccess;
                      });
}

// A key of a device section and the output its number goes to (null: not wanted).
using OptionalOutput = std::pair<const char*, uint32_t*>;

// Reads the number of each key into its non-null output; an absent key leaves its output
// unchanged. The outputs are written only after every value was read.
int32_t ReadOptionalNumbers(const ControllerState& state, const std::string& device,
                            std::initializer_list<OptionalOutput> outputs) {
    std::vector<uint32_t> values;
    for (const OptionalOutput& output : outputs) {
        uint32_t value = output.second != nullptr ? *output.second : 0;
        if (output.second != nullptr) {
            state.GetUnsigned(device, output.first, value);
        }
        values.push_back(value);
    }
    const uint32_t* value = values.data();
    for (const OptionalOutput& output : outputs) {
        if (output.second != nullptr) {
            *output.second = *value;
        }
        ++value;
    }
    return status::kSuccess;
}

}  // namespace

int32_t GetFullyQualifiedDNSName(NarrowString& name) {
    return RunCall("GetFullyQualifiedDNSName", NoInputs, [&](ControllerState& state) {
        std::string text;
        state.GetText("System", "FullyQualifiedDNSName", text);
        name = text;
        return status::kSuccess;
    });
}

int32_t GetMACAddressByIndex(uint32_t index, NarrowString& macAddress) {
    return DeviceCall("GetMACAddressByIndex", index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          std::string text;
                          state.GetText(device, "MACAddress", text);
                          macAddress = text;
                          return status::kSuccess;
                      });
}

int32_t GetPrimaryDeviceIndex(uint32_t& index) {
    return RunCall("GetPrimaryDeviceIndex", NoInputs, [&](ControllerState& state) {
        uint32_t value = index;
        state.GetUnsigned("Network", "PrimaryDeviceIndex", value);
        index = value;
        return status::kSuccess;
    });
}

int32_t SetPrimaryDeviceByIndex(uint32_t index) {
    return DeviceCall("SetPrimaryDeviceByIndex", index, NoInputs,
                      [&](ControllerState& state, const std::string&) {
                          state.SetUnsigned("Network", "PrimaryDeviceIndex", index);
                          return status::kSuccess;
                      });
}

int32_t GetDeviceModeByIndex(uint32_t index, uint32_t& mode) {
    return GetDeviceUnsigned("GetDeviceModeByIndex", index, "Mode", mode);
}

int32_t GetDeviceSupportedModesByIndex(uint32_t index, uint32_t& modes) {
    return GetDeviceUnsigned("GetDeviceSupportedModesByIndex", index, "SupportedModes", modes);
}

int32_t GetDeviceTCPIPRequestModeByIndex(uint32_t index, uint32_t& requestMode) {
    return GetDeviceUnsigned("GetDeviceTCPIPRequestModeByIndex", index, "RequestMode", requestMode);
}

int32_t GetDeviceSupportedTCPIPRequestModesByIndex(uint32_t index, uint32_t& requestModes) {
    return GetDeviceUnsigned("GetDeviceSupportedTCPIPRequestModesByIndex", index,
                             "SupportedRequestModes", requestModes);
}

int32_t GetIPAddressByIndex(uint32_t index, uint32_t addressSlot, IPAddress& address,
                            IPAddress& subnetMask, uint32_t* addressCount) {
    return DeviceCall(
        "GetIPAddressByIndex", index,
        [&](CallArguments& arguments) { arguments.Unsigned(addressSlot); },
        [&](ControllerState& state, const std::string& device) {
            IPAddress stored;
            state.GetAddress(device, "IPAddress", stored);
            if (addressCount != nullptr) {
                *addressCount = stored.IsUnset() ? 0 : 1;
            }
            if (stored.IsUnset() || addressSlot != 0) {
                return status::kNoAddress;
            }
            IPAddress mask = subnetMask;
            state.GetAddress(device, "SubnetMask", mask);
            address = stored;
            subnetMask = mask;
            return status::kSuccess;
        });
}

int32_t GetGatewayAddressByIndex(uint32_t index, IPAddress& gateway) {
    return GetDeviceAddress("GetGatewayAddressByIndex", index, "Gateway", gateway);
}

int32_t GetDNSServerAddressByIndex(uint32_t index, IPAddress& dnsServer) {
    return GetDeviceAddress("GetDNSServerAddressByIndex", index, "DNSServer", dnsServer);
}

int32_t SetDeviceIPConfigByIndex(uint32_t index, uint32_t addressSlot, uint32_t requestMode,
                                 uint32_t mode, const IPAddress& address,
                                 const IPAddress& subnetMask, const IPAddress& gateway,
                                 const IPAddress& dnsServer) {
    return DeviceCall(
        "SetDeviceIPConfigByIndex", index,
        [&](CallArguments& arguments) {
            arguments.Unsigned(addressSlot)
                .Unsigned(requestMode)
                .Unsigned(mode)
                .Address(address)
                .Address(subnetMask)
                .Address(gateway)
                .Address(dnsServer);
        },
        [&](ControllerState& state, const std::string& device) {
            if (addressSlot != 0) {
                return status::kInvalidArgument;
            }
            state.SetUnsigned(device, "RequestMode", requestMode);
            state.SetUnsigned(device, "Mode", mode);
            state.SetAddress(device, "IPAddress", address);
            state.SetAddress(device, "SubnetMask", subnetMask);
            state.SetAddress(device, "Gateway", gateway);
            state.SetAddress(device, "DNSServer", dnsServer);
            return status::kSuccess;
        });
}

int32_t GetSupportedDeviceSettings(uint32_t index, uint32_t* mediaModes, uint32_t* pollingModes) {
    return DeviceCall("GetSupportedDeviceSettings", index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          return ReadOptionalNumbers(state, device,
                                                     {{"SupportedMediaModes", mediaModes},
                                                      {"SupportedPollingModes", pollingModes}});
                      });
}

int32_t GetCurrentDeviceSettings(uint32_t index, uint32_t* mediaMode, uint32_t* pollingMode,
                                 uint32_t* pollingInterval) {
    return DeviceCall("GetCurrentDeviceSettings", index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          return ReadOptionalNumbers(state, device,
                                                     {{"CurrentMediaMode", mediaMode},
                                                      {"PollingMode", pollingMode},
                                                      {"PollingInterval", pollingInterval}});
                      });
}

int32_t GetPreferredMediaMode(uint32_t index, uint32_t* mediaMode) {
    return DeviceCall(
        "GetPreferredMediaMode", index, NoInputs,
        [&](ControllerState& state, const std::string& device) {
            return ReadOptionalNumbers(state, device, {{"PreferredMediaMode", mediaMode}});
        });
}

int32_t SetDeviceSettings(uint32_t index, uint32_t mediaMode, uint32_t pollingMode,
                          uint32_t pollingInterval) {
    return DeviceCall(
        "SetDeviceSettings", index,
        [&](CallArguments& arguments) {
            arguments.Unsigned(mediaMode).Unsigned(pollingMode).Unsigned(pollingInterval);
        },
        [&](ControllerState& state, const std::string& device) {
            if (mediaMode != 0) {
                state.SetUnsigned(device, "PreferredMediaMode", mediaMode);
                state.SetUnsigned(device, "CurrentMediaMode", mediaMode);
            }
            if (pollingMode != 0) {
                state.SetUnsigned(device, "PollingMode", pollingMode);
            }
            if (pollingInterval != 0) {
                state.SetUnsigned(device, "PollingInterval", pollingInterval);
            }
            return status::kSuccess;
        });
}

int32_t GetEtherCATSettings(NarrowString macAddress, uint32_t& masterId, bool& hasFlag,
                            bool& flag) {
    return RunCall(
        "GetEtherCATSettings", [&](CallArguments& arguments) { arguments.Text(macAddress.str()); },
        [&](ControllerState& state) {
            const std::string device = state.FindDeviceWith("MACAddress", macAddress.str());
            if (device.empty()) {
                return status::kInvalidArgument;
            }
            uint32_t id = masterId;
            state.GetUnsigned(device, "EtherCATMasterID", id);
            bool value = flag;
            const bool present = state.GetFlag(device, "EtherCATFlag", value);
            masterId = id;
            hasFlag = present;
            flag = value;
            return status::kSuccess;
        });
}

int32_t SetEtherCATSettings(uint32_t index, uint32_t masterId, bool flag) {
    return DeviceCall(
        "SetEtherCATSettings", index,
        [&](CallArguments& arguments) { arguments.Unsigned(masterId).Flag(flag); },
        [&](ControllerState& state, const std::string& device) {
            state.SetUnsigned(device, "EtherCATMasterID", masterId);
            state.SetFlag(device, "EtherCATFlag", flag);
            return status::kSuccess;
        });
}

int32_t SetNetworkInterfaceState(NarrowString interfaceName, bool up) {
    return RunCall(
        "SetNetworkInterfaceState",
        [&](CallArguments& arguments) { arguments.Text(interfaceName.str()).Flag(up); },
        [&](ControllerState& state) {
            const std::string device = state.FindDeviceWith("InterfaceName", interfaceName.str());
            if (device.empty()) {
                return status::kInvalidArgument;
            }
            state.SetFlag(device, "InterfaceUp", up);
            return status::kSuccess;
        });
}

int32_t GetAdapterState(uint32_t index, bool& up) {
    return DeviceCall("GetAdapterState", index, NoInputs,
                      [&](ControllerState& state, const std::string& device) {
                          bool value = up;
                          state.GetFlag(device, "AdapterUp", value);
                          up = value;
                          return status::kSuccess;
                      });
}

}  // namespace network
}  // namespace targetcfg
}  // namespace vq
