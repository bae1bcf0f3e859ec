// What every call shares: [Faults], the missing sysroot, serialisation across processes, and
// the library file's soname.
#include <dlfcn.h>
#include <elf.h>
#include <fcntl.h>
#include <link.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <functional>

#include "SimFixture.h"
#include "common/ChildProcess.h"

namespace kest::test::sim {
namespace {

namespace tc = vq::targetcfg;

struct NamedCall {
    const char* name;
    std::function<int32_t()> call;
};

// Every call of the library with outputs that outlive the calls.
struct AllCalls {
    NarrowString text{"preset"};
    tc::WideString wide;
    uint32_t number = 77;
    bool flag = true;
    IPAddress address;
    vq::dsc::Vector<NarrowString> names;
    vq::dsc::Vector<tc::IDeviceHandler*> devices;

    std::vector<NamedCall> List() {
        namespace sys = tc::system;
        namespace net = tc::network;
        return {
            {"GetDeviceHandlers", [this] { return tc::GetDeviceHandlers(devices); }},
            {"GetDeviceDescription", [this] { return sys::GetDeviceDescription(text); }},
            {"GetTargetClass", [this] { return sys::GetTargetClass(text); }},
            {"GetHostName", [this] { return sys::GetHostName(text); }},
            {"GetTargetID", [this] { return sys::GetTargetID(number); }},
            {"GetSerialNumber", [this] { return sys::GetSerialNumber(number); }},
            {"GetUserComment", [this] { return sys::GetUserComment(wide); }},
            {"GetLanguageName", [this] { return sys::GetLanguageName(text); }},
            {"GetSupportedLanguages", [this] { return sys::GetSupportedLanguages(names); }},
            {"GetTimeZone", [this] { return sys::GetTimeZone(text); }},
            {"GetTimezoneOffset", [] { return sys::GetTimezoneOffset(); }},
            {"SetHostName", [] { return sys::SetHostName("h"); }},
            {"SetUserComment", [] { return sys::SetUserComment("c"); }},
            {"SetLanguageName", [] { return sys::SetLanguageName("en"); }},
            {"SetTimeZone", [] { return sys::SetTimeZone("UTC"); }},
            {"ValidateTimeZone", [] { return sys::ValidateTimeZone("UTC"); }},
            {"GetFullyQualifiedDNSName", [this] { return net::GetFullyQualifiedDNSName(text); }},
            {"GetMACAddressByIndex", [this] { return net::GetMACAddressByIndex(0, text); }},
            {"GetPrimaryDeviceIndex", [this] { return net::GetPrimaryDeviceIndex(number); }},
            {"SetPrimaryDeviceByIndex", [] { return net::SetPrimaryDeviceByIndex(0); }},
            {"GetDeviceModeByIndex", [this] { return net::GetDeviceModeByIndex(0, number); }},
            {"GetDeviceSupportedModesByIndex",
             [this] { return net::GetDeviceSupportedModesByIndex(0, number); }},
            {"GetDeviceTCPIPRequestModeByIndex",
             [this] { return net::GetDeviceTCPIPRequestModeByIndex(0, number); }},
            {"GetDeviceSupportedTCPIPRequestModesByIndex",
             [this] { return net::GetDeviceSupportedTCPIPRequestModesByIndex(0, number); }},
            {"GetIPAddressByIndex",
             [this] { return net::GetIPAddressByIndex(0, 0, address, address, &number); }},
            {"GetGatewayAddressByIndex",
             [this] { return net::GetGatewayAddressByIndex(0, address); }},
            {"GetDNSServerAddressByIndex",
             [this] { return net::GetDNSServerAddressByIndex(0, address); }},
            {"SetDeviceIPConfigByIndex",
             [this] {
                 return net::SetDeviceIPConfigByIndex(0, 0, 1, 2, address, address, address,
                                                      address);
             }},
            {"GetSupportedDeviceSettings",
             [this] { return net::GetSupportedDeviceSettings(0, &number, &number); }},
            {"GetCurrentDeviceSettings",
             [this] { return net::GetCurrentDeviceSettings(0, &number, &number, &number); }},
            {"GetPreferredMediaMode", [this] { return net::GetPreferredMediaMode(0, &number); }},
            {"SetDeviceSettings", [] { return net::SetDeviceSettings(0, 1, 1, 1); }},
            {"GetEtherCATSettings",
             [this] { return net::GetEtherCATSettings("00:11", number, flag, flag); }},
            {"SetEtherCATSettings", [] { return net::SetEtherCATSettings(0, 1, true); }},
            {"SetNetworkInterfaceState", [] { return net::SetNetworkInterfaceState("eth0", 0); }},
            {"GetAdapterState", [this] { return net::GetAdapterState(0, flag); }},
        };
    }
};

const char kDeviceState[] =
    "[System]\nHostName = kept\n[Device0]\nType = 1\nInterfaceName = eth0\n"
    "MACAddress = 00:11\nMode = 2\nIPAddress = 10.0.0.2\n";

TEST_F(SimTest, FaultsReturnTheirStatusAndDoNothingElse) {
    AllCalls calls;
    const std::pair<const char*, int32_t> faults[] = {
        {"-375623", -375623}, {"-0x5BAE7", -375527}, {"0", 0}};
    for (const NamedCall& entry : calls.List()) {
        SCOPED_TRACE(entry.name);
        for (const auto& fault : faults) {
            const std::string state =
                std::string(kDeviceState) + "[Faults]\n" + entry.name + " = " + fault.first + "\n";
            WriteState(state);
            calls.text = "preset";
            calls.number = 77;
            EXPECT_EQ(entry.call(), fault.second);
            EXPECT_EQ(State(), state);
            EXPECT_EQ(calls.text.str(), "preset");
            EXPECT_EQ(calls.number, 77u);
            EXPECT_EQ(calls.devices.size(), 0u);
            const std::string line = CallLog().back() + "\t";
            EXPECT_EQ(line.substr(0, line.find('\t', line.find('\t') + 1)),
                      std::string(entry.name) + "\t" + std::to_string(fault.second));
        }
        // The fault belongs to its call alone.
        WriteState(std::string(kDeviceState) + "[Faults]\n" + entry.name + " = -1\n");
        for (const NamedCall& other : calls.List()) {
            if (std::string(other.name) != entry.name) {
                EXPECT_NE(other.call(), -1) << other.name;
            }
        }
        for (tc::IDeviceHandler* device : calls.devices) {
            device->Release();
        }
        calls.devices = {};
    }
}

TEST_F(SimTest, WithoutSysrootEveryCallFailsWithOneLineOnStandardError) {
    AllCalls calls;
    for (const char* value : {static_cast<const char*>(nullptr), "", "relative/root"}) {
        if (value == nullptr) {
            unsetenv("KEST_SYSROOT");
        } else {
            setenv("KEST_SYSROOT", value, 1);
        }
        for (const NamedCall& entry : calls.List()) {
            const kest::test::StreamCapture capture(2, sysroot_.PathOf("/stderr"));
            EXPECT_EQ(entry.call(), -375501) << entry.name;
            const std::string text = capture.Text();
            EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1) << entry.name << text;
            EXPECT_NE(text.find(entry.name), std::string::npos) << text;
        }
    }
    EXPECT_EQ(calls.text.str(), "preset");
    EXPECT_EQ(calls.devices.size(), 0u);
    EXPECT_FALSE(sysroot_.Exists("/var"));
}

TEST_F(SimTest, ConcurrentProcessesDoNotLoseUpdates) {
    // Each child writes one key of every device once; a lost update would lose a key for good.
    constexpr uint32_t kDevices = 30;
    std::string state;
    for (uint32_t i = 0; i < kDevices; ++i) {
        state += "[Device" + std::to_string(i) + "]\nMACAddress = m" + std::to_string(i) + "\n";
    }
    WriteState(state);
    pid_t children[2];
    for (int child = 0; child < 2; ++child) {
        children[child] = fork();
        ASSERT_GE(children[child], 0);
        if (children[child] == 0) {
            int failures = 0;
            for (uint32_t i = 0; i < kDevices; ++i) {
                failures += (child == 0 ? tc::network::SetEtherCATSettings(i, i, true)
                                        : tc::network::SetDeviceSettings(i, 0, 2, 100 + i)) != 0;
            }
            _exit(failures);
        }
    }
    for (const pid_t child : children) {
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    }
    for (uint32_t i = 0; i < kDevices; ++i) {
        uint32_t id = 0xFFFFFFFF;
        bool hasFlag = false;
        bool flag = false;
        ASSERT_EQ(tc::network::GetEtherCATSettings("m" + std::to_string(i), id, hasFlag, flag), 0);
        EXPECT_EQ(id, i);
        uint32_t interval = 0;
        ASSERT_EQ(tc::network::GetCurrentDeviceSettings(i, nullptr, nullptr, &interval), 0);
        EXPECT_EQ(interval, 100 + i);
    }
    EXPECT_EQ(CallLog().size(), 4 * kDevices);
}

int FindSoname(dl_phdr_info* info, size_t, void* result) {
    const std::string path = info->dlpi_name;
    if (path.find("libvqtargetcfg") == std::string::npos) {
        return 0;
    }
    const char* strings = nullptr;
    const ElfW(Dyn)* soname = nullptr;
    for (int i = 0; i < info->dlpi_phnum; ++i) {
        if (info->dlpi_phdr[i].p_type != PT_DYNAMIC) {
            continue;
        }
        auto* dynamic =
            reinterpret_cast<const ElfW(Dyn)*>(info->dlpi_addr + info->dlpi_phdr[i].p_vaddr);
        for (; dynamic->d_tag != DT_NULL; ++dynamic) {
            if (dynamic->d_tag == DT_STRTAB) {
                // The loader may or may not have relocated the entry in place.
                ElfW(Addr) address = dynamic->d_un.d_ptr;
                if (address < info->dlpi_addr) {
                    address += info->dlpi_addr;
                }
                strings = reinterpret_cast<const char*>(address);
            } else if (dynamic->d_tag == DT_SONAME) {
                soname = dynamic;
            }
        }
    }
    if (strings != nullptr && soname != nullptr) {
        *static_cast<std::string*>(result) = path + " " + (strings + soname->d_un.d_val);
    }
    return 1;
}

TEST(SimLibrary, IsLoadedUnderItsSoname) {
    std::string found;
    dl_iterate_phdr(FindSoname, &found);
    const std::string suffix = "/libvqtargetcfg.so.1 libvqtargetcfg.so.1";
    ASSERT_GE(found.size(), suffix.size()) << found;
    EXPECT_EQ(found.substr(found.size() - suffix.size()), suffix);
}

}  // namespace
}  // namespace kest::test::sim
