// A simulated controller with one Ethernet adapter "eth0" (device index 0, the primary adapter,
// TCP/IP mode 2 with a static address) under a temporary sysroot, the adapter's handler, bags
// written from short row texts and captured traces.
#pragma once

#include <gtest/gtest.h>

#include <mutex>
#include <sstream>
#include <string>
#include <vector>

#include "common/ChassisTestTags.h"
#include "common/StateText.h"
#include "common/StatusOf.h"
#include "network/EthernetItemHandler.h"
#include "property/CuxDynamicPropertyBag.h"
#include "sim/SimFixture.h"
#include "support/TraceGate.h"

namespace kest::test::network {

// The adapter's state; each "Key = value" line of `overrides` replaces the line of that key or,
// for a new key, is added (a "[Faults]" section, too).
inline std::string AdapterState(const std::string& overrides = "") {
    std::string state =
        "[Network]\nPrimaryDeviceIndex = 0\n[Device0]\nType = 1\nInterfaceName = eth0\nIndex = 0\n"
        "MACAddress = 00:80:2F:12:34:56\nMode = 2\nSupportedModes = 0x0B\n"
        "RequestMode = 1\nSupportedRequestModes = 0x3\nIPAddress = 192.168.1.10\n"
        "SubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
        "DNSServer = 192.168.1.2\nSupportedMediaModes = 0x7F\n"
        "CurrentMediaMode = 4\nPreferredMediaMode = 4\nSupportedPollingModes = 3\n"
        "PollingMode = 1\nPollingInterval = 100\nInterfaceUp = 1\nAdapterUp = 1\n";
    return kest::test::WithOverrides(state, overrides);
}

// Writes `rows` into `bag`, each a blank-separated "name=value": names primary and flag are
// booleans (0/1), ip, mask, gw, dns, mac and name texts, the rest numbers; "-name" removes it.
inline void WriteRows(IuxSysPropertyBag* bag, const std::string& rows) {
    struct Row {
        const char* name;
        uint32_t tag;
        char kind;  // b boolean, u number, t text
    };
    // clang-format off
    static const Row kRows[] = {
        {"primary", tags::kPrimaryAdapter, 'b'}, {"flag", tags::kEtherCATFlag, 'b'},
        {"ip", tags::kIPAddress, 't'}, {"mask", tags::kSubnetMask, 't'},
        {"gw", tags::kGateway, 't'}, {"dns", tags::kDnsServer, 't'},
        {"mac", tags::kMacAddress, 't'}, {"name", tags::kItemName, 't'},
        {"mode", tags::kAdapterMode, 'u'}, {"modes", tags::kSupportedAdapterModes, 'u'},
        {"req", tags::kRequestMode, 'u'}, {"media", tags::kPreferredMediaMode, 'u'},
        {"id", tags::kEtherCATMasterId, 'u'}, {"polling", tags::kPollingMode, 'u'},
        {"pollmodes", tags::kSupportedPollingModes, 'u'}, {"interval", tags::kPollingInterval, 'u'}};
    // clang-format on
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

using kest::test::StatusOf;

class NetworkTest : public ::testing::Test, public kest::test::sim::SimSysroot {
  protected:
    void TearDown() override { SetTraceGate(0, nullptr); }

    void ClearCallLog() const { sysroot_.WriteFile(kest::test::sim::kCallLogPath, ""); }

    // The controller's one device.
    static CountedPtr<vq::targetcfg::IDeviceHandler> FirstDevice() {
        vq::dsc::Vector<vq::targetcfg::IDeviceHandler*> devices;
        vq::targetcfg::GetDeviceHandlers(devices);
        EXPECT_EQ(1u, devices.size());
        return CountedPtr<vq::targetcfg::IDeviceHandler>(devices.empty() ? nullptr : devices[0],
                                                         kAdoptReference);
    }

    // The Ethernet handler of the controller's first device.
    static CountedPtr<EthernetItemHandler> MakeHandler() {
        return MakeCounted<EthernetItemHandler>(L"eth0", L"Ethernet Adapter eth0",
                                                FirstDevice().Get());
    }

    // The logged calls whose names begin with `prefix`, one a line.
    std::string Calls(const std::string& prefix) const {
        std::string calls;
        for (const std::string& call : CallLog()) {
            calls += call.compare(0, prefix.size(), prefix) == 0 ? call + "\n" : "";
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
};

}  // namespace kest::test::network
