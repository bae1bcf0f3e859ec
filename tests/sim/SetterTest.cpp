// Every setter's effect on the state file and its call-log line.
#include <functional>
#include <set>

#include "SimFixture.h"
#include "common/ChildProcess.h"

namespace kest::test::sim {
namespace {

namespace tc = vq::targetcfg;

const std::string kBaseState =
    "; simulated controller\n"
    "[System]\n"
    "HostName = old-host\n"
    "UserComment = old comment\n"
    "LanguageName = English\n"
    "TimeZone = Europe/Berlin\n"
    "\n"
    "[Network]\n"
    "PrimaryDeviceIndex = 0\n"
    "\n"
    "[Device0]\n"
    "Type = 1\n"
    "InterfaceName = eth0\n"
    "MACAddress = 00:80:2F:00:00:01\n"
    "Mode = 2\n"
    "RequestMode = 2\n"
    "IPAddress = 10.0.0.2\n"
    "SubnetMask = 255.255.255.0\n"
    "Gateway = 10.0.0.1\n"
    "DNSServer = 10.0.0.1\n"
    "PollingMode = 1\n"
    "PollingInterval = 0x10\n"
    "\n"
    "[Device1]\n"
    "Type = 1\n"
    "InterfaceName = eth1\n"
    "Index = 7\n"
    "MACAddress = 00:80:2F:00:00:02\n";

// The base state with each `from` text replaced by its `to` text.
std::string Edited(std::initializer_list<std::pair<std::string, std::string>> edits) {
    std::string state = kBaseState;
    for (const auto& edit : edits) {
        const size_t at = state.find(edit.first);
        EXPECT_NE(at, std::string::npos) << edit.first;
        state.replace(at, edit.first.size(), edit.second);
    }
    return state;
}

struct SetterCase {
    const char* label;
    std::function<int32_t()> call;
    int32_t status;
    std::string logLine;
    std::string state;
};

std::vector<SetterCase> SetterCases() {
    return {
        {"host name", [] { return tc::system::SetHostName("kest-7"); }, 0, "SetHostName\t0\tkest-7",
         Edited({{"HostName = old-host", "HostName=kest-7"}})},
        {"comment with escapes", [] { return tc::system::SetUserComment(" a\tb\nc\\ "); }, 0,
         "SetUserComment\t0\t a\\tb\\nc\\\\ ",
         Edited({{"UserComment = old comment", "UserComment=\\sa\\tb\\nc\\\\\\s"}})},
        {"language", [] { return tc::system::SetLanguageName("kr"); }, 0, "SetLanguageName\t0\tkr",
         Edited({{"LanguageName = English", "LanguageName=Korean"}})},
        {"unknown language", [] { return tc::system::SetLanguageName("EN"); }, -375523,
         "SetLanguageName\t-375523\tEN", kBaseState},
        {"time zone", [] { return tc::system::SetTimeZone("America/Chicago"); }, 0,
         "SetTimeZone\t0\tAmerica/Chicago",
         Edited({{"TimeZone = Europe/Berlin", "TimeZone=America/Chicago"}})},
        {"primary device", [] { return tc::network::SetPrimaryDeviceByIndex(7); }, 0,
         "SetPrimaryDeviceByIndex\t0\t7",
         Edited({{"PrimaryDeviceIndex = 0", "PrimaryDeviceIndex=7"}})},
        {"primary device unknown", [] { return tc::network::SetPrimaryDeviceByIndex(1); }, -375563,
         "SetPrimaryDeviceByIndex\t-375563\t1", kBaseState},
        {"IP configuration",
         [] {
             return tc::network::SetDeviceIPConfigByIndex(0, 0, 1, 0x20, Address("192.168.1.10"),
                                                          Address("255.255.0.0"), IPAddress(),
                                                          Address("192.168.1.1"));
         },
         0, "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t32\t192.168.1.10\t255.255.0.0\t\t192.168.1.1",
         Edited({{"Mode = 2", "Mode=32"},
                 {"RequestMode = 2", "RequestMode=1"},
                 {"IPAddress = 10.0.0.2", "IPAddress=192.168.1.10"},
                 {"SubnetMask = 255.255.255.0", "SubnetMask=255.255.0.0"},
                 {"Gateway = 10.0.0.1", "Gateway="},
                 {"DNSServer = 10.0.0.1", "DNSServer=192.168.1.1"}})},
        {"IP configuration in slot 1",
         [] {
             return tc::network::SetDeviceIPConfigByIndex(7, 1, 1, 2, IPAddress(), IPAddress(),
                                                          IPAddress(), IPAddress());
         },
         -375563, "SetDeviceIPConfigByIndex\t-375563\t7\t1\t1\t2\t\t\t\t", kBaseState},
        {"media mode and interval", [] { return tc::network::SetDeviceSettings(0, 4, 0, 250); }, 0,
         "SetDeviceSettings\t0\t0\t4\t0\t250",
         Edited({{"PollingInterval = 0x10\n",
                  "PollingInterval=250\nPreferredMediaMode=4\nCurrentMediaMode=4\n"}})},
        {"polling mode only", [] { return tc::network::SetDeviceSettings(7, 0, 2, 0); }, 0,
         "SetDeviceSettings\t0\t7\t0\t2\t0", kBaseState + "PollingMode=2\n"},
        {"EtherCAT", [] { return tc::network::SetEtherCATSettings(7, 255, true); }, 0,
         "SetEtherCATSettings\t0\t7\t255\t1",
         kBaseState + "EtherCATMasterID=255\nEtherCATFlag=1\n"},
        {"interface down", [] { return tc::network::SetNetworkInterfaceState("ETH1", false); }, 0,
         "SetNetworkInterfaceState\t0\tETH1\t0", kBaseState + "InterfaceUp=0\n"},
        {"unknown interface", [] { return tc::network::SetNetworkInterfaceState("eth9", true); },
         -375563, "SetNetworkInterfaceState\t-375563\teth9\t1", kBaseState},
    };
}

TEST(SimSetters, StateFileAndCallLog) {
    for (const SetterCase& row : SetterCases()) {
        SCOPED_TRACE(row.label);
        const SimSysroot sim;
        sim.WriteState(kBaseState);
        EXPECT_EQ(row.call(), row.status);
        EXPECT_EQ(sim.State(), row.state);
        EXPECT_EQ(sim.CallLog(), std::vector<std::string>{row.logLine});

        // The file is replaced by rename: no temporary file stays behind.
        const std::vector<std::string> entries =
            kest::test::EntriesOf(sim.sysroot_.PathOf("/var/lib/vqtargetcfg"));
        EXPECT_EQ(std::set<std::string>(entries.begin(), entries.end()),
                  (std::set<std::string>{"state.ini", "state.lock", "calls.log"}));
    }
}

TEST_F(SimTest, SettersCreateTheStateFileAndSectionsOnAnEmptyController) {
    ASSERT_EQ(tc::system::SetHostName("first"), 0);
    ASSERT_EQ(tc::system::SetTimeZone("UTC"), 0);
    EXPECT_EQ(State(), "[System]\nHostName=first\nTimeZone=UTC\n");
    ASSERT_EQ(tc::network::SetPrimaryDeviceByIndex(0), -375563);
    EXPECT_EQ(State(), "[System]\nHostName=first\nTimeZone=UTC\n");
}

TEST_F(SimTest, SetThenGetRoundTripsSpecialCharacters) {
    const std::string comment = "  two\r\nlines\\with\ttab  ";
    ASSERT_EQ(tc::system::SetUserComment(comment), 0);
    vq::targetcfg::WideString wide;
    ASSERT_EQ(tc::system::GetUserComment(wide), 0);
    EXPECT_EQ(wide.str(), std::wstring(comment.begin(), comment.end()));
}

TEST_F(SimTest, LanguageCodesMapToNamesIncludingAddedLanguages) {
    WriteState("[Languages]\nSpanish = es\nDeutsch = de\n");
    const std::pair<const char*, const char*> rows[] = {
        {"en", "English"}, {"de", "Deutsch"},  {"fr", "French"},  {"zh", "Chinese"},
        {"kr", "Korean"},  {"ja", "Japanese"}, {"es", "Spanish"},
    };
    for (const auto& row : rows) {
        ASSERT_EQ(tc::system::SetLanguageName(row.first), 0) << row.first;
        NarrowString name;
        ASSERT_EQ(tc::system::GetLanguageName(name), 0);
        EXPECT_EQ(name.str(), row.second);
    }
    const std::string before = State();
    for (const char* unknown : {"", "it", "e", "english"}) {
        EXPECT_EQ(tc::system::SetLanguageName(unknown), -375523) << unknown;
    }
    EXPECT_EQ(State(), before);
}

}  // namespace
}  // namespace kest::test::sim
