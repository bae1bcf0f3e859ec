// A temporary sysroot for the simulated controller library, with helpers for its state file and
// call log, and a table of calls of every library function over one state file.
#pragma once

#include <gtest/gtest.h>

#include <regex>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "common/TempSysroot.h"
#include "vq/targetcfg/TargetConfig.h"

namespace kest::test::sim {

namespace tc = vq::targetcfg;
using vq::targetcfg::IPAddress;
using vq::targetcfg::NarrowString;

constexpr char kStatePath[] = "/var/lib/vqtargetcfg/state.ini";
constexpr char kCallLogPath[] = "/var/lib/vqtargetcfg/calls.log";

inline IPAddress Address(const std::string& text) {
    IPAddress address;
    address.Parse(text);
    return address;
}

// A temporary sysroot with the simulated controller's files and a zone database.
class SimSysroot {
  public:
    SimSysroot() { sysroot_.WriteFile("/usr/share/zoneinfo/Europe/Berlin", "TZif2"); }
    void WriteState(const std::string& text) const { sysroot_.WriteFile(kStatePath, text); }
    std::string State() const { return sysroot_.ReadFile(kStatePath); }

    // The call-log lines with their leading "MS.mmm<TAB>" removed; each line's stamp is checked.
    std::vector<std::string> CallLog() const {
        static const std::regex stamp("^[0-9]+\\.[0-9]{3}\t");
        std::vector<std::string> lines;
        std::istringstream log(sysroot_.ReadFile(kCallLogPath));
        for (std::string line; std::getline(log, line);) {
            std::smatch match;
            EXPECT_TRUE(std::regex_search(line, match, stamp)) << line;
            lines.push_back(match.suffix());
        }
        return lines;
    }

    kest::test::TempSysroot sysroot_;
};

class SimTest : public ::testing::Test, public SimSysroot {};

// The outputs a call may write, with presets; Changed() names those that no longer hold them.
struct Outputs {
    NarrowString text{"preset"};
    tc::WideString wide{L"preset"};
    uint32_t number = 77;
    uint32_t second = 77;
    uint32_t third = 77;
    bool flag = true;
    bool other = false;
    IPAddress address = Address("1.2.3.4");
    IPAddress mask = Address("1.2.3.4");
    vq::dsc::Vector<NarrowString> names;
    vq::dsc::Vector<tc::IDeviceHandler*> devices;

    Outputs() { names.push_back(NarrowString("kept")); }

    // Each device received holds one reference, which goes here.
    ~Outputs() {
        for (tc::IDeviceHandler* device : devices) {
            EXPECT_EQ(device->AddRef(), 2u);
            EXPECT_EQ(device->Release(), 1u);
            EXPECT_EQ(device->Release(), 0u);
        }
    }

    // "name=value" for each changed output, separated by spaces; a device is
    // "device=type,interface,MAC,index".
    std::string Changed() const {
        std::ostringstream out;
        const std::wstring wideText = wide.str();
        const auto show = [&out](const char* name, const std::string& value, const char* preset) {
            if (value != preset) {
                out << ' ' << name << '=' << value;
            }
        };
        show("text", text.str(), "preset");
        show("wide", std::string(wideText.begin(), wideText.end()), "preset");
        show("address", address.ToString(), "1.2.3.4");
        show("mask", mask.ToString(), "1.2.3.4");
        show("number", std::to_string(number), "77");
        show("second", std::to_string(second), "77");
        show("third", std::to_string(third), "77");
        out << (flag ? "" : " flag=0") << (other ? " other=1" : "");
        for (size_t i = 0; names.size() != 1 && i < names.size(); ++i) {
            out << (i == 0 ? " names=" : ",") << names[i].str();
        }
        for (tc::IDeviceHandler* device : devices) {
            NarrowString name;
            NarrowString mac;
            EXPECT_EQ(device->GetInterfaceName(name), 0);
            EXPECT_EQ(device->GetMACAddress(mac), 0);
            out << " device=" << device->GetDeviceType() << ',' << name.str() << ',' << mac.str()
                << ',' << device->GetDeviceIndex();
        }
        return out.str().empty() ? "" : out.str().substr(1);
    }
};

// One call over kState: its status, the outputs it changed, its call-log line and the edits it
// made to the state file ("from|to|from|to...": each `from` text replaced by its `to` text).
struct CallRow {
    int32_t (*call)(Outputs&);
    int32_t status;
    const char* changed;
    const char* logLine;
    const char* edits = "";

    std::string Name() const {
        const std::string line = logLine;
        return line.substr(0, line.find('\t'));
    }
};

inline const std::string kState =
    "; simulated controller\n"
    "[System]\nDeviceDescription = KEST 9100\nTargetClass = kest-class\nHostName = kest-1\n"
    "TargetID = 0x1A2B\nSerialNumber = 4242\nUserComment = hello\nLanguageName = German\n"
    "SupportedLanguages = English,German,,Latin\nTimeZone = Europe/Berlin\n"
    "TimezoneOffset = -3600\nFullyQualifiedDNSName = kest-1.example.test\n"
    "\n"
    "[Network]\nPrimaryDeviceIndex = 0x7\n"
    "[Device10]\nType = 2\nInterfaceName = can0\nMode = 0\n"
    "[Device2]\nType = 1\nInterfaceName = eth1\nIndex = 7\nMACAddress = 00:80:2f:00:00:02\n"
    "Mode = 0x8\nSupportedModes = 0x0B\nRequestMode = 1\nSupportedRequestModes = 3\n"
    "IPAddress = 192.168.1.10\nSubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
    "DNSServer =\nSupportedMediaModes = 0x3F\nCurrentMediaMode = 4\n"
    "PreferredMediaMode = 0x10\nSupportedPollingModes = 7\nPollingMode = 2\n"
    "PollingInterval = 1000\nEtherCATMasterID = 3\nEtherCATFlag = 0\nAdapterUp = 1\n"
    "\n"
    "[Device0]\nType = 1\nInterfaceName = eth0\nMACAddress = 00:80:2F:00:00:01\n";

// Every library function at least once, rows of one function together.
inline const std::vector<CallRow>& CallRows() {
    namespace sys = tc::system;
    namespace net = tc::network;
    using O = Outputs;
    static const std::vector<CallRow> rows = {
        {[](O& o) { return tc::GetDeviceHandlers(o.devices); }, 0,
         "device=1,eth0,00:80:2F:00:00:01,0 device=1,eth1,00:80:2f:00:00:02,7 device=2,can0,,10",
         "GetDeviceHandlers\t0"},
        {[](O& o) { return sys::GetDeviceDescription(o.text); }, 0, "text=KEST 9100",
         "GetDeviceDescription\t0"},
        {[](O& o) { return sys::GetTargetClass(o.text); }, 0, "text=kest-class",
         "GetTargetClass\t0"},
        {[](O& o) { return sys::GetHostName(o.text); }, 0, "text=kest-1", "GetHostName\t0"},
        {[](O& o) { return sys::GetTargetID(o.number); }, 0, "number=6699", "GetTargetID\t0"},
        {[](O& o) { return sys::GetSerialNumber(o.number); }, 0, "number=4242",
         "GetSerialNumber\t0"},
        {[](O& o) { return sys::GetUserComment(o.wide); }, 0, "wide=hello", "GetUserComment\t0"},
        {[](O& o) { return sys::GetLanguageName(o.text); }, 0, "text=German", "GetLanguageName\t0"},
        {[](O& o) { return sys::GetSupportedLanguages(o.names); }, 0,
         "names=kept,English,German,,Latin", "GetSupportedLanguages\t0"},
        {[](O& o) { return sys::GetTimeZone(o.text); }, 0, "text=Europe/Berlin", "GetTimeZone\t0"},
        {[](O&) { return sys::GetTimezoneOffset(); }, -3600, "", "GetTimezoneOffset\t-3600"},
        {[](O&) { return sys::SetHostName("kest-7"); }, 0, "", "SetHostName\t0\tkest-7",
         "HostName = kest-1|HostName=kest-7"},
        {[](O&) { return sys::SetUserComment(" a\tb\nc\\ "); }, 0, "",
         "SetUserComment\t0\t a\\tb\\nc\\\\ ",
         "UserComment = hello|UserComment=\\sa\\tb\\nc\\\\\\s"},
        {[](O&) { return sys::SetLanguageName("kr"); }, 0, "", "SetLanguageName\t0\tkr",
         "LanguageName = German|LanguageName=Korean"},
        {[](O&) { return sys::SetLanguageName("EN"); }, -375523, "",
         "SetLanguageName\t-375523\tEN"},
        {[](O&) { return sys::SetTimeZone("America/Chicago"); }, 0, "",
         "SetTimeZone\t0\tAmerica/Chicago", "TimeZone = Europe/Berlin|TimeZone=America/Chicago"},
        {[](O&) { return sys::ValidateTimeZone("Europe/Berlin"); }, 0, "",
         "ValidateTimeZone\t0\tEurope/Berlin"},
        {[](O& o) { return net::GetFullyQualifiedDNSName(o.text); }, 0, "text=kest-1.example.test",
         "GetFullyQualifiedDNSName\t0"},
        {[](O& o) { return net::GetMACAddressByIndex(7, o.text); }, 0, "text=00:80:2f:00:00:02",
         "GetMACAddressByIndex\t0\t7"},
        {[](O& o) { return net::GetMACAddressByIndex(10, o.text); }, 0,
         "text=", "GetMACAddressByIndex\t0\t10"},
        {[](O& o) { return net::GetPrimaryDeviceIndex(o.number); }, 0, "number=7",
         "GetPrimaryDeviceIndex\t0"},
        {[](O&) { return net::SetPrimaryDeviceByIndex(10); }, 0, "",
         "SetPrimaryDeviceByIndex\t0\t10", "PrimaryDeviceIndex = 0x7|PrimaryDeviceIndex=10"},
        {[](O&) { return net::SetPrimaryDeviceByIndex(1); }, -375563, "",
         "SetPrimaryDeviceByIndex\t-375563\t1"},
        {[](O& o) { return net::GetDeviceModeByIndex(7, o.number); }, 0, "number=8",
         "GetDeviceModeByIndex\t0\t7"},
        {[](O& o) { return net::GetDeviceModeByIndex(10, o.number); }, 0, "number=0",
         "GetDeviceModeByIndex\t0\t10"},
        {[](O& o) { return net::GetDeviceModeByIndex(0, o.number); }, 0, "",
         "GetDeviceModeByIndex\t0\t0"},
        {[](O& o) { return net::GetDeviceModeByIndex(3, o.number); }, -375563, "",
         "GetDeviceModeByIndex\t-375563\t3"},
        {[](O& o) { return net::GetDeviceSupportedModesByIndex(7, o.number); }, 0, "number=11",
         "GetDeviceSupportedModesByIndex\t0\t7"},
        {[](O& o) { return net::GetDeviceSupportedModesByIndex(0, o.number); }, 0, "",
         "GetDeviceSupportedModesByIndex\t0\t0"},
        {[](O& o) { return net::GetDeviceSupportedModesByIndex(3, o.number); }, -375563, "",
         "GetDeviceSupportedModesByIndex\t-375563\t3"},
        {[](O& o) { return net::GetDeviceTCPIPRequestModeByIndex(7, o.number); }, 0, "number=1",
         "GetDeviceTCPIPRequestModeByIndex\t0\t7"},
        {[](O& o) { return net::GetDeviceTCPIPRequestModeByIndex(0, o.number); }, 0, "",
         "GetDeviceTCPIPRequestModeByIndex\t0\t0"},
        {[](O& o) { return net::GetDeviceTCPIPRequestModeByIndex(3, o.number); }, -375563, "",
         "GetDeviceTCPIPRequestModeByIndex\t-375563\t3"},
        {[](O& o) { return net::GetDeviceSupportedTCPIPRequestModesByIndex(7, o.number); }, 0,
         "number=3", "GetDeviceSupportedTCPIPRequestModesByIndex\t0\t7"},
        {[](O& o) { return net::GetDeviceSupportedTCPIPRequestModesByIndex(0, o.number); }, 0, "",
         "GetDeviceSupportedTCPIPRequestModesByIndex\t0\t0"},
        {[](O& o) { return net::GetDeviceSupportedTCPIPRequestModesByIndex(3, o.number); }, -375563,
         "", "GetDeviceSupportedTCPIPRequestModesByIndex\t-375563\t3"},
        {[](O& o) { return net::GetIPAddressByIndex(7, 0, o.address, o.mask, &o.number); }, 0,
         "address=192.168.1.10 mask=255.255.255.0 number=1", "GetIPAddressByIndex\t0\t7\t0"},
        {[](O& o) { return net::GetIPAddressByIndex(7, 1, o.address, o.mask, nullptr); }, -375566,
         "", "GetIPAddressByIndex\t-375566\t7\t1"},
        {[](O& o) { return net::GetIPAddressByIndex(0, 0, o.address, o.mask, &o.number); }, -375566,
         "number=0", "GetIPAddressByIndex\t-375566\t0\t0"},
        {[](O& o) { return net::GetGatewayAddressByIndex(7, o.address); }, 0, "address=192.168.1.1",
         "GetGatewayAddressByIndex\t0\t7"},
        {[](O& o) { return net::GetDNSServerAddressByIndex(7, o.address); }, 0,
         "address=", "GetDNSServerAddressByIndex\t0\t7"},
        {[](O&) {
             return net::SetDeviceIPConfigByIndex(7, 0, 2, 0x20, Address("192.168.2.20"),
                                                  Address("255.255.0.0"), IPAddress(),
                                                  Address("192.168.1.1"));
         },
         0, "",
         "SetDeviceIPConfigByIndex\t0\t7\t0\t2\t32\t192.168.2.20\t255.255.0.0\t\t192.168.1.1",
         "\nMode = 0x8|\nMode=32|RequestMode = 1|RequestMode=2|IPAddress = 192.168.1.10|"
         "IPAddress=192.168.2.20|SubnetMask = 255.255.255.0|SubnetMask=255.255.0.0|"
         "Gateway = 192.168.1.1|Gateway=|DNSServer =|DNSServer=192.168.1.1"},
        {[](O&) {
             return net::SetDeviceIPConfigByIndex(7, 1, 1, 2, IPAddress(), IPAddress(), IPAddress(),
                                                  IPAddress());
         },
         -375563, "", "SetDeviceIPConfigByIndex\t-375563\t7\t1\t1\t2\t\t\t\t"},
        {[](O& o) { return net::GetSupportedDeviceSettings(7, &o.number, nullptr); }, 0,
         "number=63", "GetSupportedDeviceSettings\t0\t7"},
        {[](O& o) { return net::GetSupportedDeviceSettings(7, nullptr, &o.second); }, 0, "second=7",
         "GetSupportedDeviceSettings\t0\t7"},
        {[](O& o) { return net::GetCurrentDeviceSettings(7, &o.number, &o.second, &o.third); }, 0,
         "number=4 second=2 third=1000", "GetCurrentDeviceSettings\t0\t7"},
        {[](O& o) { return net::GetPreferredMediaMode(7, &o.number); }, 0, "number=16",
         "GetPreferredMediaMode\t0\t7"},
        {[](O&) { return net::SetDeviceSettings(7, 0x20, 0, 250); }, 0, "",
         "SetDeviceSettings\t0\t7\t32\t0\t250",
         "CurrentMediaMode = 4|CurrentMediaMode=32|PreferredMediaMode = 0x10|"
         "PreferredMediaMode=32|PollingInterval = 1000|PollingInterval=250"},
        {[](O&) { return net::SetDeviceSettings(0, 4, 0, 0); }, 0, "",
         "SetDeviceSettings\t0\t0\t4\t0\t0",
         "00:00:01\n|00:00:01\nPreferredMediaMode=4\nCurrentMediaMode=4\n"},
        {[](O&) { return net::SetDeviceSettings(10, 0, 2, 0); }, 0, "",
         "SetDeviceSettings\t0\t10\t0\t2\t0", "Mode = 0\n|Mode = 0\nPollingMode=2\n"},
        {[](O& o) {
             return net::GetEtherCATSettings("00:80:2F:00:00:02", o.number, o.other, o.flag);
         },
         0, "number=3 flag=0 other=1", "GetEtherCATSettings\t0\t00:80:2F:00:00:02"},
        {[](O& o) {
             return net::GetEtherCATSettings("00:80:2F:00:00:01", o.number, o.flag, o.other);
         },
         0, "flag=0", "GetEtherCATSettings\t0\t00:80:2F:00:00:01"},
        {[](O& o) { return net::GetEtherCATSettings("", o.number, o.flag, o.other); }, -375563, "",
         "GetEtherCATSettings\t-375563\t"},
        {[](O&) { return net::SetEtherCATSettings(0, 255, true); }, 0, "",
         "SetEtherCATSettings\t0\t0\t255\t1",
         "00:00:01\n|00:00:01\nEtherCATMasterID=255\nEtherCATFlag=1\n"},
        {[](O&) { return net::SetNetworkInterfaceState("ETH1", false); }, 0, "",
         "SetNetworkInterfaceState\t0\tETH1\t0", "AdapterUp = 1\n|AdapterUp = 1\nInterfaceUp=0\n"},
        {[](O&) { return net::SetNetworkInterfaceState("eth9", true); }, -375563, "",
         "SetNetworkInterfaceState\t-375563\teth9\t1"},
        {[](O& o) { return net::GetAdapterState(7, o.other); }, 0, "other=1",
         "GetAdapterState\t0\t7"},
    };
    return rows;
}

}  // namespace kest::test::sim
