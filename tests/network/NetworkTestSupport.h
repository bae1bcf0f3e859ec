// A simulated controller with one Ethernet adapter "eth0" (device index 0, the primary adapter,
// TCP/IP mode 2 with a static address) under a temporary sysroot, the adapter's handler, bags
// filled from short tables, and the library's call log.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <map>
#include <mutex>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "com/CountedPtr.h"
#include "common/TempSysroot.h"
#include "items/RefCountedThreadSafePolicy.h"
#include "network/EthernetItemHandler.h"
#include "property/CuxDynamicPropertyBag.h"
#include "support/TraceGate.h"
#include "vq/targetcfg/TargetConfig.h"

namespace network_test {

constexpr char kStatePath[] = "/var/lib/vqtargetcfg/state.ini";
constexpr char kCallLogPath[] = "/var/lib/vqtargetcfg/calls.log";

// The adapter as most tests start from it. `deviceOverrides` holds "Key = value" lines that
// replace the device's line with that key or, for a new key, are added.
inline std::string AdapterState(const std::string& deviceOverrides = "",
                                uint32_t primaryIndex = 0) {
    std::vector<std::string> lines = {
        "Type = 1",
        "InterfaceName = eth0",
        "Index = 0",
        "MACAddress = 00:80:2F:12:34:56",
        "Mode = 2",
        "SupportedModes = 0x0B",
        "RequestMode = 1",
        "SupportedRequestModes = 0x3",
        "IPAddress = 192.168.1.10",
        "SubnetMask = 255.255.255.0",
        "Gateway = 192.168.1.1",
        "DNSServer = 192.168.1.2",
        "SupportedMediaModes = 0x7F",
        "CurrentMediaMode = 4",
        "PreferredMediaMode = 4",
        "SupportedPollingModes = 0x3",
        "PollingMode = 1",
        "PollingInterval = 100",
        "InterfaceUp = 1",
        "AdapterUp = 1",
    };
    std::istringstream overrides(deviceOverrides);
    for (std::string line; std::getline(overrides, line);) {
        const std::string key = line.substr(0, line.find(' '));
        bool replaced = false;
        for (std::string& existing : lines) {
            if (existing.compare(0, key.size() + 1, key + " ") == 0) {
                existing = line;
                replaced = true;
            }
        }
        if (!replaced) {
            lines.push_back(line);
        }
    }
    std::string state =
        "[Network]\nPrimaryDeviceIndex = " + std::to_string(primaryIndex) + "\n[Device0]\n";
    for (const std::string& line : lines) {
        state += line + "\n";
    }
    return state;
}

// One value for a bag: a boolean, an unsigned number or a text.
struct BagValue {
    enum class Kind { kBool, kULong, kText } kind;
    uint32_t number = 0;
    std::wstring text;

    static BagValue Bool(bool value) { return {Kind::kBool, value ? 1u : 0u, {}}; }
    static BagValue ULong(uint32_t value) { return {Kind::kULong, value, {}}; }
    static BagValue Text(std::wstring value) { return {Kind::kText, 0, std::move(value)}; }
};
using BagRows = std::map<uint32_t, BagValue>;

// A new bag holding `rows`, every one of them modified.
inline CountedPtr<IuxSysPropertyBag4> MakeBag(const BagRows& rows) {
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    for (const auto& row : rows) {
        switch (row.second.kind) {
            case BagValue::Kind::kBool:
                EXPECT_EQ(S_OK, bag->SetBool(row.first, static_cast<int32_t>(row.second.number)));
                break;
            case BagValue::Kind::kULong:
                EXPECT_EQ(S_OK, bag->SetULong(row.first, row.second.number));
                break;
            case BagValue::Kind::kText:
                EXPECT_EQ(S_OK, bag->SetString(row.first, row.second.text.c_str()));
                break;
        }
    }
    return bag;
}

// The unsigned value of `tag`, or `missing` when the bag does not hold one.
inline uint32_t ULongOf(IuxSysPropertyBag* bag, uint32_t tag, uint32_t missing = 0xDEADBEEF) {
    uint32_t value = missing;
    return bag->GetULong(tag, &value) == S_OK ? value : missing;
}

// The text of `tag`, or "<missing>" when the bag does not hold one.
inline std::wstring TextOf(IuxSysPropertyBag* bag, uint32_t tag) {
    CvqBStrHolder text;
    if (bag->GetString(tag, text.Receive()) != S_OK) {
        return L"<missing>";
    }
    return std::wstring(text.Get(), CvqBStrLength(text.Get()));
}

// One line of the call log: its monotonic time and the line without it.
struct LoggedCall {
    double milliseconds;
    std::string call;
};

// Traces written while a test runs: text and whether the thread/time line followed.
struct TraceRecord {
    std::string text;
    bool stamped;
};

class NetworkTest : public ::testing::Test {
  protected:
    void TearDown() override { SetTraceGate(0, nullptr); }

    void WriteState(const std::string& state) const { sysroot_.WriteFile(kStatePath, state); }
    std::string State() const { return sysroot_.ReadFile(kStatePath); }

    // The Ethernet handler of the controller's first device.
    CountedPtr<EthernetItemHandler> MakeHandler() const {
        vq::dsc::Vector<vq::targetcfg::IDeviceHandler*> devices;
        vq::targetcfg::GetDeviceHandlers(devices);
        EXPECT_FALSE(devices.empty());
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

    // Forgets the calls logged so far.
    void ClearCallLog() const { sysroot_.WriteFile(kCallLogPath, ""); }

    // The logged calls in order.
    std::vector<LoggedCall> TimedCallLog() const {
        std::vector<LoggedCall> calls;
        std::istringstream log(sysroot_.ReadFile(kCallLogPath));
        for (std::string line; std::getline(log, line);) {
            const size_t tab = line.find('\t');
            calls.push_back(
                {std::strtod(line.substr(0, tab).c_str(), nullptr), line.substr(tab + 1)});
        }
        return calls;
    }

    // The logged calls without their times.
    std::vector<std::string> CallLog() const {
        std::vector<std::string> calls;
        for (const LoggedCall& call : TimedCallLog()) {
            calls.push_back(call.call);
        }
        return calls;
    }

    // The logged calls that change the controller (names beginning with "Set").
    std::vector<std::string> SetterLog() const {
        std::vector<std::string> calls;
        for (const std::string& call : CallLog()) {
            if (call.compare(0, 3, "Set") == 0) {
                calls.push_back(call);
            }
        }
        return calls;
    }

    // Captures traces under `mask` from now on.
    static void CaptureTraces(uint32_t mask) {
        Traces().clear();
        SetTraceGate(mask, [](char, const char* text, bool stamped) {
            std::lock_guard<std::mutex> lock(TraceMutex());
            Traces().push_back({text, stamped});
        });
    }
    // The captured traces; read them once the traced work has finished.
    static std::vector<TraceRecord>& Traces() {
        static std::vector<TraceRecord> traces;
        return traces;
    }
    static std::mutex& TraceMutex() {
        static std::mutex mutex;
        return mutex;
    }

    kest::test::TempSysroot sysroot_;
};

}  // namespace network_test
