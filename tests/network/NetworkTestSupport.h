// A simulated controller with one Ethernet adapter "eth0" (device index 0, the primary adapter,
// TCP/IP mode 2 with a static address) under a temporary sysroot, the adapter's handler, bags
// written from short row texts, the library's call log and captured traces.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <mutex>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "common/TempSysroot.h"
#include "network/EthernetItemHandler.h"
#include "property/CuxDynamicPropertyBag.h"
#include "support/TraceGate.h"
#include "vq/targetcfg/TargetConfig.h"

// The network item's tags, written out here as an independent check of the plug-in's.
namespace NetworkTag {
constexpr uint32_t kItemName = 0x0101D000;
constexpr uint32_t kAdapterMode = 0x0D102000;
constexpr uint32_t kSupportedAdapterModes = 0x0D103000;
constexpr uint32_t kMacAddress = 0x0D104000;
constexpr uint32_t kRequestMode = 0x0D105000;
constexpr uint32_t kIPAddress = 0x0D107000;
constexpr uint32_t kSubnetMask = 0x0D109000;
constexpr uint32_t kGateway = 0x0D10A000;
constexpr uint32_t kDnsServer = 0x0D10B000;
constexpr uint32_t kPreferredMediaMode = 0x0D10F000;
constexpr uint32_t kEtherCATMasterId = 0x0D118000;
constexpr uint32_t kSupportedPollingModes = 0x0D119000;
constexpr uint32_t kPollingMode = 0x0D11A000;
constexpr uint32_t kPollingInterval = 0x0D11B000;
constexpr uint32_t kPrimaryAdapter = 0x0D126000;
constexpr uint32_t kEtherCATFlag = 0x0D155000;
}  // namespace NetworkTag

namespace kest::test::network {

constexpr char kStatePath[] = "/var/lib/vqtargetcfg/state.ini";
constexpr char kCallLogPath[] = "/var/lib/vqtargetcfg/calls.log";

// The adapter's state; each "Key = value" line of `overrides` replaces the line of that key or,
// for a new key, is added (a "[Faults]" section, too).
inline std::string AdapterState(const std::string& overrides = "", int primaryIndex = 0) {
    std::string state = "[Network]\nPrimaryDeviceIndex = " + std::to_string(primaryIndex) +
                        "\n[Device0]\nType = 1\nInterfaceName = eth0\nIndex = 0\n"
                        "MACAddress = 00:80:2F:12:34:56\nMode = 2\nSupportedModes = 0x0B\n"
                        "RequestMode = 1\nSupportedRequestModes = 0x3\nIPAddress = 192.168.1.10\n"
                        "SubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
                        "DNSServer = 192.168.1.2\nSupportedMediaModes = 0x7F\n"
                        "CurrentMediaMode = 4\nPreferredMediaMode = 4\nSupportedPollingModes = 3\n"
                        "PollingMode = 1\nPollingInterval = 100\nInterfaceUp = 1\nAdapterUp = 1\n";
    std::istringstream lines(overrides);
    for (std::string line; std::getline(lines, line);) {
        const std::regex key("(^|\n)" + line.substr(0, line.find(' ')) + " = [^\n]*");
        state = std::regex_search(state, key) ? std::regex_replace(state, key, "$1" + line)
                                              : state + line + "\n";
    }
    return state;
}

// Writes `rows` into `bag`, each a blank-separated "name=value": names primary and flag are
// booleans (0/1), ip, mask, gw, dns, mac and name texts, the rest numbers; "-name" removes it.
inline void WriteRows(IuxSysPropertyBag* bag, const std::string& rows) {
    struct Row {
        const char* name;
        uint32_t tag;
        char kind;  // b boolean, u number, t text
    };
    static const Row kRows[] = {
        {"primary", NetworkTag::kPrimaryAdapter, 'b'},
        {"flag", NetworkTag::kEtherCATFlag, 'b'},
        {"ip", NetworkTag::kIPAddress, 't'},
        {"mask", NetworkTag::kSubnetMask, 't'},
        {"gw", NetworkTag::kGateway, 't'},
        {"dns", NetworkTag::kDnsServer, 't'},
        {"mac", NetworkTag::kMacAddress, 't'},
        {"name", NetworkTag::kItemName, 't'},
        {"mode", NetworkTag::kAdapterMode, 'u'},
        {"modes", NetworkTag::kSupportedAdapterModes, 'u'},
        {"req", NetworkTag::kRequestMode, 'u'},
        {"media", NetworkTag::kPreferredMediaMode, 'u'},
        {"id", NetworkTag::kEtherCATMasterId, 'u'},
        {"polling", NetworkTag::kPollingMode, 'u'},
        {"pollmodes", NetworkTag::kSupportedPollingModes, 'u'},
        {"interval", NetworkTag::kPollingInterval, 'u'},
    };
    std::istringstream tokens(rows);
    for (std::string token; tokens >> token;) {
        const bool remove = token[0] == '-';
        const std::string name = token.substr(remove ? 1 : 0, token.find('=') - (remove ? 1 : 0));
        const std::string value = remove ? "" : token.substr(token.find('=') + 1);
        const Row* row = nullptr;
        for (const Row& candidate : kRows) {
            row = name == candidate.name ? &candidate : row;
        }
        ASSERT_NE(nullptr, row) << token;
        if (remove) {
            bag->RemoveTag(row->tag);
        } else if (row->kind == 't') {
            ASSERT_EQ(S_OK,
                      bag->SetString(row->tag, std::wstring(value.begin(), value.end()).c_str()));
        } else if (row->kind == 'b') {
            ASSERT_EQ(S_OK, bag->SetBool(row->tag, std::stoi(value)));
        } else {
            ASSERT_EQ(S_OK, bag->SetULong(row->tag, std::stoul(value, nullptr, 0)));
        }
    }
}

inline CountedPtr<IuxSysPropertyBag4> MakeBag(const std::string& rows) {
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    WriteRows(bag.Get(), rows);
    return bag;
}

// The unsigned value of `tag`, or 0xDEADBEEF when the bag has none.
inline uint32_t ULongOf(IuxSysPropertyBag* bag, uint32_t tag) {
    uint32_t value = 0xDEADBEEF;
    return bag->GetULong(tag, &value) == S_OK ? value : 0xDEADBEEF;
}

inline std::wstring TextOf(IuxSysPropertyBag* bag, uint32_t tag) {
    CvqBStrHolder text;
    return bag->GetString(tag, text.Receive()) == S_OK ? text.Get() : L"<missing>";
}

struct LoggedCall {
    double milliseconds;  // CLOCK_MONOTONIC
    std::string call;     // name, status and inputs, tab-separated
};

class NetworkTest : public ::testing::Test {
  protected:
    void TearDown() override { SetTraceGate(0, nullptr); }

    void WriteState(const std::string& state) const { sysroot_.WriteFile(kStatePath, state); }
    void ClearCallLog() const { sysroot_.WriteFile(kCallLogPath, ""); }

    // The Ethernet handler of the controller's first device.
    static CountedPtr<EthernetItemHandler> MakeHandler() {
        vq::dsc::Vector<vq::targetcfg::IDeviceHandler*> devices;
        vq::targetcfg::GetDeviceHandlers(devices);
        CountedPtr<EthernetItemHandler> handler;
        if (!devices.empty()) {
            handler =
                MakeCounted<EthernetItemHandler>(L"eth0", L"Ethernet Adapter eth0", devices[0]);
        }
        for (vq::targetcfg::IDeviceHandler* device : devices) {
            device->Release();
        }
        return handler;
    }

    std::vector<LoggedCall> TimedCallLog() const {
        std::vector<LoggedCall> calls;
        std::istringstream log(sysroot_.ReadFile(kCallLogPath));
        for (std::string line; std::getline(log, line);) {
            const size_t tab = line.find('\t');
            calls.push_back({std::strtod(line.c_str(), nullptr), line.substr(tab + 1)});
        }
        return calls;
    }

    // The logged calls whose names begin with `prefix` ("" for all), without their times.
    std::vector<std::string> CallLog(const std::string& prefix = "") const {
        std::vector<std::string> calls;
        for (const LoggedCall& call : TimedCallLog()) {
            if (call.call.compare(0, prefix.size(), prefix) == 0) {
                calls.push_back(call.call);
            }
        }
        return calls;
    }

    // Captures traces under `mask` from now on, the stamped ones marked with a final " +".
    static void CaptureTraces(uint32_t mask) {
        Traces().clear();
        SetTraceGate(mask, [](char, const char* text, bool stamped) {
            static std::mutex mutex;
            std::lock_guard<std::mutex> lock(mutex);
            Traces().push_back(std::string(text) + (stamped ? " +" : ""));
        });
    }
    static std::vector<std::string>& Traces() {
        static std::vector<std::string> traces;
        return traces;
    }

    kest::test::TempSysroot sysroot_;
};

}  // namespace kest::test::network
