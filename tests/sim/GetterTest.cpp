// Getters over a given state file: numbers in decimal and 0x form, absent keys, devices.
#include <gmock/gmock.h>
#include <unistd.h>

#include "SimFixture.h"

namespace kest::test::sim {
namespace {

namespace tc = vq::targetcfg;
using vq::dsc::Vector;

const char kState[] =
    "[System]\n"
    "DeviceDescription = KEST 9100\n"
    "TargetClass = kest-class\n"
    "HostName = kest-1\n"
    "TargetID = 0x1A2B\n"
    "SerialNumber = 4242\n"
    "UserComment = hello\n"
    "LanguageName = German\n"
    "SupportedLanguages = English,German,,Latin\n"
    "TimeZone = Europe/Berlin\n"
    "TimezoneOffset = -3600\n"
    "FullyQualifiedDNSName = kest-1.example.test\n"
    "[Network]\n"
    "PrimaryDeviceIndex = 0x7\n"
    "[Device10]\n"
    "Type = 2\n"
    "InterfaceName = can0\n"
    "[Device2]\n"
    "Type = 1\n"
    "InterfaceName = eth1\n"
    "Index = 7\n"
    "MACAddress = 00:80:2f:00:00:02\n"
    "Mode = 0x8\n"
    "SupportedModes = 0x0B\n"
    "RequestMode = 1\n"
    "SupportedRequestModes = 3\n"
    "IPAddress = 192.168.1.10\n"
    "SubnetMask = 255.255.255.0\n"
    "Gateway = 192.168.1.1\n"
    "DNSServer =\n"
    "SupportedMediaModes = 0x3F\n"
    "CurrentMediaMode = 4\n"
    "PreferredMediaMode = 0x10\n"
    "SupportedPollingModes = 7\n"
    "PollingMode = 2\n"
    "PollingInterval = 1000\n"
    "EtherCATMasterID = 3\n"
    "EtherCATFlag = 1\n"
    "AdapterUp = 1\n"
    "[Device0]\n"
    "Type = 1\n"
    "InterfaceName = eth0\n"
    "MACAddress = 00:80:2F:00:00:01\n";

TEST_F(SimTest, SystemGettersReadTheSystemSection) {
    WriteState(kState);
    const std::pair<int32_t (*)(NarrowString&), const char*> texts[] = {
        {tc::system::GetDeviceDescription, "KEST 9100"},
        {tc::system::GetTargetClass, "kest-class"},
        {tc::system::GetHostName, "kest-1"},
        {tc::system::GetLanguageName, "German"},
        {tc::system::GetTimeZone, "Europe/Berlin"},
        {tc::network::GetFullyQualifiedDNSName, "kest-1.example.test"},
    };
    NarrowString text("preset");
    for (const auto& [getter, expected] : texts) {
        ASSERT_EQ(getter(text), 0) << expected;
        EXPECT_EQ(text.str(), expected);
    }
    tc::WideString comment;
    ASSERT_EQ(tc::system::GetUserComment(comment), 0);
    EXPECT_EQ(comment.str(), L"hello");
    uint32_t number = 0;
    ASSERT_EQ(tc::system::GetTargetID(number), 0);
    EXPECT_EQ(number, 0x1A2Bu);
    ASSERT_EQ(tc::system::GetSerialNumber(number), 0);
    EXPECT_EQ(number, 4242u);
    EXPECT_EQ(tc::system::GetTimezoneOffset(), -3600);

    Vector<NarrowString> names;
    names.push_back(NarrowString("kept"));
    ASSERT_EQ(tc::system::GetSupportedLanguages(names), 0);
    std::vector<std::string> got;
    for (const NarrowString& name : names) {
        got.push_back(name.str());
    }
    EXPECT_EQ(got, (std::vector<std::string>{"kept", "English", "German", "", "Latin"}));

    // The file is read at every call, so an edit shows at once.
    WriteState("[System]\nHostName = edited\n");
    ASSERT_EQ(tc::system::GetHostName(text), 0);
    EXPECT_EQ(text.str(), "edited");
    EXPECT_EQ(CallLog().back(), "GetHostName\t0");
}

TEST_F(SimTest, EmptyControllerGivesEmptyTextsAndKeepsPresetNumbers) {
    NarrowString text("preset");
    ASSERT_EQ(tc::system::GetHostName(text), 0);
    EXPECT_EQ(text.str(), "");
    uint32_t number = 99;
    ASSERT_EQ(tc::system::GetTargetID(number), 0);
    ASSERT_EQ(tc::network::GetPrimaryDeviceIndex(number), 0);
    EXPECT_EQ(number, 99u);
    EXPECT_EQ(tc::system::GetTimezoneOffset(), 0);
    Vector<tc::IDeviceHandler*> devices;
    ASSERT_EQ(tc::GetDeviceHandlers(devices), 0);
    EXPECT_TRUE(devices.empty());
    EXPECT_FALSE(sysroot_.Exists(kStatePath));
}

TEST_F(SimTest, DeviceHandlersFollowTheSectionNumbers) {
    WriteState(kState);
    Vector<tc::IDeviceHandler*> devices;
    ASSERT_EQ(tc::GetDeviceHandlers(devices), 0);
    ASSERT_EQ(devices.size(), 3u);
    struct Expected {
        uint32_t type;
        const char* name;
        const char* mac;
        uint32_t index;
    };
    const Expected expected[] = {{1, "eth0", "00:80:2F:00:00:01", 0},
                                 {1, "eth1", "00:80:2f:00:00:02", 7},
                                 {2, "can0", "", 10}};
    for (size_t i = 0; i < devices.size(); ++i) {
        tc::IDeviceHandler* device = devices[i];
        EXPECT_EQ(device->GetDeviceType(), expected[i].type);
        NarrowString text;
        EXPECT_EQ(device->GetInterfaceName(text), 0);
        EXPECT_EQ(text.str(), expected[i].name);
        EXPECT_EQ(device->GetMACAddress(text), 0);
        EXPECT_EQ(text.str(), expected[i].mac);
        EXPECT_EQ(device->GetDeviceIndex(), expected[i].index);
        EXPECT_EQ(device->AddRef(), 2u);
        EXPECT_EQ(device->Release(), 1u);
        EXPECT_EQ(device->Release(), 0u);
    }
    EXPECT_EQ(CallLog(), std::vector<std::string>{"GetDeviceHandlers\t0"});
}

TEST_F(SimTest, NetworkGettersReadTheDeviceWithTheIndex) {
    WriteState(kState);
    uint32_t value = 0;
    ASSERT_EQ(tc::network::GetPrimaryDeviceIndex(value), 0);
    EXPECT_EQ(value, 7u);
    const std::pair<int32_t (*)(uint32_t, uint32_t&), uint32_t> numbers[] = {
        {tc::network::GetDeviceModeByIndex, 8},
        {tc::network::GetDeviceSupportedModesByIndex, 0x0B},
        {tc::network::GetDeviceTCPIPRequestModeByIndex, 1},
        {tc::network::GetDeviceSupportedTCPIPRequestModesByIndex, 3},
    };
    for (const auto& row : numbers) {
        uint32_t found = 0;
        EXPECT_EQ(row.first(7, found), 0);
        EXPECT_EQ(found, row.second);
        uint32_t preset = 0xFEED;
        EXPECT_EQ(row.first(0, preset), 0);
        EXPECT_EQ(preset, 0xFEEDu) << "absent keys leave the output unchanged";
        EXPECT_EQ(row.first(3, preset), -375563);
    }

    NarrowString mac;
    ASSERT_EQ(tc::network::GetMACAddressByIndex(7, mac), 0);
    EXPECT_EQ(mac.str(), "00:80:2f:00:00:02");

    IPAddress address;
    IPAddress mask;
    uint32_t count = 9;
    ASSERT_EQ(tc::network::GetIPAddressByIndex(7, 0, address, mask, &count), 0);
    EXPECT_EQ(address.ToString(), "192.168.1.10");
    EXPECT_EQ(mask.ToString(), "255.255.255.0");
    EXPECT_EQ(count, 1u);
    EXPECT_EQ(tc::network::GetIPAddressByIndex(7, 1, address, mask, nullptr), -375566);
    IPAddress untouched = Address("1.2.3.4");
    EXPECT_EQ(tc::network::GetIPAddressByIndex(0, 0, untouched, mask, &count), -375566);
    EXPECT_EQ(untouched.ToString(), "1.2.3.4");
    EXPECT_EQ(count, 0u);
    ASSERT_EQ(tc::network::GetGatewayAddressByIndex(7, address), 0);
    EXPECT_EQ(address.ToString(), "192.168.1.1");
    ASSERT_EQ(tc::network::GetDNSServerAddressByIndex(7, address), 0);
    EXPECT_TRUE(address.IsUnset()) << "an empty value is the unset address";

    uint32_t media = 0;
    uint32_t polling = 0;
    uint32_t interval = 0;
    ASSERT_EQ(tc::network::GetSupportedDeviceSettings(7, &media, nullptr), 0);
    EXPECT_EQ(media, 0x3Fu);
    ASSERT_EQ(tc::network::GetSupportedDeviceSettings(7, nullptr, &polling), 0);
    EXPECT_EQ(polling, 7u);
    ASSERT_EQ(tc::network::GetCurrentDeviceSettings(7, &media, &polling, &interval), 0);
    EXPECT_EQ(media, 4u);
    EXPECT_EQ(polling, 2u);
    EXPECT_EQ(interval, 1000u);
    ASSERT_EQ(tc::network::GetPreferredMediaMode(7, &media), 0);
    EXPECT_EQ(media, 0x10u);
    bool up = false;
    ASSERT_EQ(tc::network::GetAdapterState(7, up), 0);
    EXPECT_TRUE(up);

    EXPECT_THAT(CallLog(), ::testing::IsSupersetOf({"GetIPAddressByIndex\t0\t7\t0",
                                                    "GetIPAddressByIndex\t-375566\t7\t1",
                                                    "GetDeviceModeByIndex\t-375563\t3"}));
}

TEST_F(SimTest, EtherCATSettingsAreFoundByHardwareAddress) {
    WriteState(kState);
    uint32_t id = 0xFFFFFFFF;
    bool hasFlag = false;
    bool flag = false;
    ASSERT_EQ(tc::network::GetEtherCATSettings("00:80:2F:00:00:02", id, hasFlag, flag), 0);
    EXPECT_EQ(id, 3u);
    EXPECT_TRUE(hasFlag);
    EXPECT_TRUE(flag);

    id = 0xFFFFFFFF;
    flag = false;
    ASSERT_EQ(tc::network::GetEtherCATSettings("00:80:2F:00:00:01", id, hasFlag, flag), 0);
    EXPECT_EQ(id, 0xFFFFFFFFu) << "no master ID leaves the preset";
    EXPECT_FALSE(hasFlag);
    EXPECT_EQ(tc::network::GetEtherCATSettings("", id, hasFlag, flag), -375563);
    EXPECT_EQ(CallLog(), (std::vector<std::string>{
                             "GetEtherCATSettings\t0\t00:80:2F:00:00:02",
                             "GetEtherCATSettings\t0\t00:80:2F:00:00:01",
                             "GetEtherCATSettings\t-375563\t",
                         }));
}

TEST_F(SimTest, MalformedValuesFailWithoutTouchingOutputs) {
    const char* malformed[] = {"2x", "0x", "-", "0x100000000", "08 1", "-1"};
    for (const char* text : malformed) {
        WriteState(std::string("[Device0]\nMode = ") + text + "\n");
        uint32_t mode = 5;
        EXPECT_EQ(tc::network::GetDeviceModeByIndex(0, mode), -375501) << text;
        EXPECT_EQ(mode, 5u);
    }
    WriteState("[Device0]\nIPAddress = 300.1.1.1\n");
    IPAddress address;
    IPAddress mask;
    EXPECT_EQ(tc::network::GetIPAddressByIndex(0, 0, address, mask, nullptr), -375501);
}

class ValidateTimeZoneTest : public SimTest {
  protected:
    void SetUp() override { sysroot_.WriteFile("/usr/share/zoneinfo/Europe/Berlin", "TZif2"); }
};

TEST_F(ValidateTimeZoneTest, AcceptsOnlyFilesInsideTheSysrootDatabase) {
    EXPECT_EQ(tc::system::ValidateTimeZone("Europe/Berlin"), 0);
    sysroot_.WriteFile("/etc/secret", "x");
    const char* rejected[] = {"Europe/Paris",
                              "Europe",
                              "",
                              "/Europe/Berlin",
                              "Europe//Berlin",
                              "./Europe/Berlin",
                              "Europe/../Europe/Berlin",
                              "../../../etc/secret"};
    for (const char* name : rejected) {
        EXPECT_EQ(tc::system::ValidateTimeZone(name), -375523) << name;
    }
    EXPECT_EQ(tc::system::ValidateTimeZone(NarrowString("Europe/Berlin\0x", 15)), -375523);
    EXPECT_EQ(CallLog().front(), "ValidateTimeZone\t0\tEurope/Berlin");
}

TEST_F(SimTest, ValidateTimeZoneFallsBackToTheMachineDatabase) {
    if (access("/usr/share/zoneinfo/UTC", R_OK) != 0) {
        GTEST_SKIP() << "the machine has no zone database";
    }
    EXPECT_EQ(tc::system::ValidateTimeZone("UTC"), 0);
    EXPECT_EQ(tc::system::ValidateTimeZone("No/Such_Zone"), -375523);
}

}  // namespace
}  // namespace kest::test::sim
