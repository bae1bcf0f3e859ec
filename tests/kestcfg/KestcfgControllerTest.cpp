// kestcfg against a demo controller: items, describe, get, refresh and set, their output for
// people and as JSON, and their exit codes.
#include <gtest/gtest.h>

#include <algorithm>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

namespace {

const char kChassis[] = "VQ KEST Chassis";
using KestcfgControllerTest = DemoControllerTest;

// The controller library's logged calls in `log` that change the controller, without times.
std::vector<std::string> ControllerChanges(const std::string& log) {
    std::vector<std::string> calls;
    std::istringstream lines(log);
    for (std::string line; std::getline(lines, line);) {
        const std::string call = line.substr(line.find('\t') + 1);
        if (call.compare(0, 3, "Set") == 0) {
            calls.push_back(call);
        }
    }
    return calls;
}

// True when `text` has a table row: the tag, the name, the type and the value, blank-separated.
bool HasRow(const std::string& text, const std::string& tag, const std::string& name,
            const std::string& type, const std::string& value) {
    return std::regex_search(text,
                             std::regex(tag + " +" + name + " +" + type + " +" + value + "\n"));
}

TEST_F(KestcfgControllerTest, GetShowsTheControllersValuesFormattedByType) {
    EXPECT_EQ("VQ KEST Chassis\neth0\n", RunKestcfg({"items"}).out);
    EXPECT_EQ("items/0=\"VQ KEST Chassis\"\nitems/1=\"eth0\"\n",
              FlattenJson(RunKestcfg({"--json", "items"}).out));
    const RunResult result = RunKestcfg({"get"});
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ(0u, result.out.find("VQ KEST Chassis\n  TAG "));
    EXPECT_NE(std::string::npos, result.out.find("\n\neth0\n  TAG "));
    const std::vector<std::vector<std::string>> rows = {
        {"0x0101F000", "host-name", "text", "kest-demo"},
        {"0x0102F000", "firmware-version", "text", "22\\.5\\.0"},
        {"0x21004000", "web-service", "boolean", "false"},
        {"0x01003000", "fixed-01003", "unsigned", "0x1092"},
        {"0x0D102000", "adapter-mode", "unsigned", "0x02 tcpip"},
        {"0x0D103000", "supported-adapter-modes", "unsigned", "0x0B disabled,tcpip,ethercat"},
        {"0x0D10F000", "preferred-media-mode", "unsigned", "0x01 auto"},
        {"0x0D11B000", "polling-interval", "unsigned", "100"},
    };
    for (const std::vector<std::string>& row : rows) {
        EXPECT_TRUE(HasRow(result.out, row[0], row[1], row[2], row[3])) << row[1];
    }
    // The chassis shows its whole catalogue: the heading, the base rows and its own rows, the
    // host name once.
    const RunResult chassis = RunKestcfg({"get", kChassis});
    EXPECT_EQ(33, std::count(chassis.out.begin(), chassis.out.end(), '\n')) << chassis.out;
    const RunResult adapter = RunKestcfg({"get", "ETH0"});
    EXPECT_EQ(0u, adapter.out.find("TAG "));
    EXPECT_TRUE(HasRow(adapter.out, "0x0D10A000", "gateway", "text", "192\\.168\\.10\\.1"));
    EXPECT_EQ(std::string::npos, adapter.out.find("VQ KEST Chassis")) << adapter.out;

    const RunResult refreshed = RunKestcfg({"refresh", kChassis, "current-time", "0x0D114000"});
    ASSERT_EQ(0, refreshed.exitCode) << refreshed.err;
    EXPECT_TRUE(HasRow(refreshed.out, "0x0D11F000", "current-time", "timestamp",
                       "[0-9]{4}-[0-9]{2}-[0-9]{2}T[0-9]{2}:[0-9]{2}:[0-9]{2}(\\.[0-9]{3})?Z"))
        << refreshed.out;
    EXPECT_TRUE(HasRow(refreshed.out, "0x0D114000", "dns-name", "text", "kest-demo\\.local"));
    EXPECT_EQ(3, std::count(refreshed.out.begin(), refreshed.out.end(), '\n')) << "those two";
    const RunResult partly = RunKestcfg({"--json", "refresh", "eth0", "gateway", "0x0ABCD000"});
    EXPECT_EQ(0, partly.exitCode) << partly.err;
    EXPECT_EQ(
        "item=\"eth0\"\nproperties/gateway/tag=\"0x0D10A000\"\n"
        "properties/gateway/type=\"text\"\nproperties/gateway/value=\"192.168.10.1\"\n"
        "missing/0=\"0x0ABCD000\"\n",
        FlattenJson(partly.out));
    EXPECT_NE(std::string::npos, partly.err.find("eth0 did not provide 0x0ABCD000"));
}

// Each run in turn, on one controller; a set is shown by the next read.
TEST_F(KestcfgControllerTest, CommandsShowTheirResultAndExitStatus) {
    ExpectRuns({
        {{"get", "eth7"}, 3, "UX_E_ITEM_NOT_FOUND (0x80040375)"},
        {{"describe", "eth7"}, 2, "eth7"},
        {{"refresh", "eth0", "0x0ABCD000"}, 3, "UX_E_PROPERTY_NOT_FOUND (0x80040371)"},
        {{"refresh", "eth0", "no-such-property"}, 2, "unknown property no-such-property"},
        {{"set", "eth0", "polling-interval=250"}, 0, "eth0: polling-interval set to 250\n"},
        {{"get", "eth0", "polling-interval"}, 0, "polling-interval  unsigned  250\n"},
        {{"set", kChassis, "web-service=on"},
         0,
         "VQ KEST Chassis: web-service set to true\n"
         "The change takes full effect after the controller restarts.\n"},
        // Modes by name or number; polling needs an interval in the same change.
        {{"set", "eth0", "polling-mode=off"}, 0, "eth0: polling-mode set to 0x01 off\n"},
        {{"get", "eth0", "polling-mode"}, 0, "polling-mode  unsigned  0x01 off\n"},
        {{"set", "eth0", "polling-mode=2", "polling-interval=40"}, 0, "set to 0x02 polling\n"},
        {{"get", "eth0", "polling-mode"}, 0, "polling-mode  unsigned  0x02 polling\n"},
        {{"set", "eth0", "polling-mode=0x01"}, 0, "eth0: polling-mode set to 0x01 off\n"},
        {{"set", "eth0", "polling-mode=POLLING", "polling-interval=40"}, 0, "0x02 polling\n"},
        {{"get", "eth0", "polling-mode"}, 0, "polling-mode  unsigned  0x02 polling\n"},
        {{"--json", "get", "eth0", "adapter-mode"}, 0, "adapter-mode/value=2\n"},
    });
    EXPECT_NE(std::string::npos, State().find("PollingInterval=40"));

    const RunResult renamed =
        RunKestcfg({"--json", "set", kChassis, "host-name=line-4", "0x0103D000=Bay 4, Line 4"});
    EXPECT_EQ(0, renamed.exitCode) << renamed.err;
    EXPECT_EQ(
        "item=\"VQ KEST Chassis\"\naccepted=true\nchanges/host-name/requested=\"line-4\"\n"
        "changes/host-name/stored=\"line-4\"\nchanges/host-name/result=\"stored\"\n"
        "changes/comment/requested=\"Bay 4, Line 4\"\nchanges/comment/stored=\"Bay 4, Line 4\"\n"
        "changes/comment/result=\"stored\"\nrestartRequired=true\n",
        FlattenJson(renamed.out));
    EXPECT_NE(std::string::npos, State().find("HostName=line-4"));
    EXPECT_NE(std::string::npos, State().find("UserComment=Bay 4, Line 4"));

    // With tracing written to standard output, each JSON is still one document.
    sysroot_.WriteFile("/etc/korvane/share/vqsysdiag.ini",
                       "[AllComponents]\nSeverity = 255\nTarget = 2\nLowDiskThreshold = 0\n");
    ExpectRuns({
        {{"--json", "items"}, 0, "items/1=\"eth0\"\n"},
        {{"--json", "describe", "eth0"}, 0, "items/0/properties/0/name=\"fixed-0101c\"\n"},
        {{"--json", "export"}, 0, "items/eth0/polling-interval=40\n"},
        {{"--json", "get", "chassis", "comment"}, 0, "/value=\"Bay 4, Line 4\"\n"},
        {{"--json", "refresh", "eth0", "gateway"}, 0, "gateway/value=\"192.168.10.1\"\n"},
        {{"--json", "set", "eth0", "polling-interval=200"}, 0, "interval/result=\"stored\"\n"},
        {{"--json", "set", "eth0", "polling-interval=0"}, 1, "error/exitStatus=1\n"},
        {{"--json", "get", "eth7"}, 3, "error/exitStatus=3\n"},
        {{"--json", "get", "eth0", "no-such-name"}, 2, "error/exitStatus=2\n"},
    });
    const RunResult traced = RunKestcfg({"--json", "get"});
    EXPECT_NE(std::string::npos, traced.err.find("CuxNetConfigExpert::Initialize()"));
    const std::string flat = FlattenJson(traced.out);
    for (const char* part :
         {"items/0/item=\"VQ KEST Chassis\"\n", "items/0/properties/host-name/tag=\"0x0101F000\"\n",
          "items/0/properties/host-name/type=\"text\"\n",
          "items/0/properties/host-name/value=\"line-4\"\n",
          "items/0/properties/web-service/value=true\n",
          "items/0/properties/time-zone-offset/value=60\n", "items/1/item=\"eth0\"\n",
          "items/1/properties/polling-interval/value=200\n",
          "items/1/properties/supported-adapter-modes/value=11\n",
          "items/1/properties/primary-adapter/value=true\n"}) {
        EXPECT_NE(std::string::npos, flat.find(part)) << part << flat;
    }
    EXPECT_EQ(std::string::npos, flat.find("\nitems/2/")) << "two items only";
}

TEST_F(KestcfgControllerTest, AnUnreadableItemIsReportedAndAChangeCanStillRepairIt) {
    // A current language the chassis does not know makes its properties unreadable.
    sysroot_.WriteFile(kStatePath, std::regex_replace(State(), std::regex("LanguageName = English"),
                                                      "LanguageName = Klingon"));
    const RunResult unreadable = RunKestcfg({"--json", "get"});
    EXPECT_EQ(3, unreadable.exitCode);
    const std::string flat = FlattenJson(unreadable.out);
    EXPECT_NE(std::string::npos,
              flat.find("items/0/error/status=\"E_FAIL\"\nitems/0/error/code=\"0x80004005\""))
        << flat;
    EXPECT_NE(std::string::npos, flat.find("items/1/item=\"eth0\"")) << "the adapter is shown";
    // The chassis judges only the changed properties.
    const RunResult repaired = RunKestcfg({"set", kChassis, "locale=de"});
    EXPECT_EQ(0, repaired.exitCode) << repaired.err;
    EXPECT_NE(std::string::npos, repaired.err.find("warning: cannot read the current properties"));
    EXPECT_NE(std::string::npos, State().find("LanguageName=German"));
    EXPECT_EQ(0, RunKestcfg({"get", kChassis}).exitCode);
}

// The accepted pair is stored and followed by the interface restart before kestcfg ends.
TEST_F(KestcfgControllerTest, AddressAndMaskAreStoredAndTheInterfaceRestartsBeforeKestcfgEnds) {
    const RunResult result =
        RunKestcfg({"set", "eth0", "ip-address=192.168.10.30", "subnet-mask=255.255.0.0"});
    ASSERT_EQ(0, result.exitCode) << result.err;
    EXPECT_EQ("eth0: ip-address set to 192.168.10.30\neth0: subnet-mask set to 255.255.0.0\n",
              result.out);
    EXPECT_NE(std::string::npos, State().find("IPAddress=192.168.10.30\nSubnetMask=255.255.0.0\n"))
        << State();
    const std::vector<std::string> expected = {
        "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t192.168.10.30\t255.255.0.0\t192.168.10.1\t"
        "192.168.10.1",
        "SetNetworkInterfaceState\t0\teth0\t0",
        "SetNetworkInterfaceState\t0\teth0\t1",
    };
    const std::vector<std::string> calls = ControllerChanges(Calls());
    ASSERT_LE(expected.size(), calls.size());
    EXPECT_EQ(expected, std::vector<std::string>(calls.begin(), calls.begin() + 3));
}

TEST_F(KestcfgControllerTest, SetStoresTextAsTypedWhateverTheEnvironmentsLocale) {
    for (const char* locale : {"LANG=C", "LC_ALL=C.UTF-8", "LC_CTYPE=en_US.ISO-8859-1"}) {
        SCOPED_TRACE(locale);
        const std::string root = "KEST_SYSROOT=" + sysroot_.Root();
        char* environment[] = {const_cast<char*>(root.c_str()), const_cast<char*>(locale), nullptr};
        const RunResult set = RunKestcfg({"set", "chassis", "comment=café 北京"}, environment);
        EXPECT_EQ(0, set.exitCode) << set.err;
        EXPECT_EQ("VQ KEST Chassis: comment set to café 北京\n", set.out);
        EXPECT_NE(std::string::npos, State().find("UserComment=café 北京\n"));
        sysroot_.WriteFile(kStatePath, std::regex_replace(State(), std::regex("UserComment=.*\n"),
                                                          "UserComment=old\n"));
    }
}

// Status 5: what was stored is reported as stored, the rest as not stored.
TEST_F(KestcfgControllerTest, AChangeStoredOnlyInPartEndsWithStatus5) {
    sysroot_.WriteScript("/sbin/hwclock", "exit 1\n");
    const RunResult people = RunKestcfg({"set", "chassis", "comment=kept", "current-time=now"});
    EXPECT_EQ(5, people.exitCode);
    EXPECT_EQ("VQ KEST Chassis: comment set to kept\n", people.out);
    EXPECT_NE(std::string::npos,
              people.err.find("kestcfg: VQ KEST Chassis: current-time was not stored"))
        << people.err;
    EXPECT_NE(std::string::npos, people.err.find("failed part-way with E_FAIL")) << people.err;
    EXPECT_EQ(std::string::npos, people.err.find("comment")) << people.err;
    EXPECT_NE(std::string::npos, State().find("UserComment=kept\n"));
    const std::string flat = FlattenJson(
        RunKestcfg({"--json", "set", "chassis", "comment=again", "current-time=now"}).out);
    for (const char* expected :
         {"changes/comment/result=\"stored\"\n", "changes/current-time/result=\"not stored\"\n",
          "error/exitStatus=5\n", "error/status=\"E_FAIL\"\n"}) {
        EXPECT_NE(std::string::npos, flat.find(expected)) << expected << flat;
    }
    // The controller keeps its TCP/IP mode when asked to switch to another TCP/IP mode.
    sysroot_.WriteFile(kStatePath, std::regex_replace(State(), std::regex("SupportedModes = 0x0B"),
                                                      "SupportedModes = 0x6B"));
    ExpectRuns({{{"set", "eth0", "adapter-mode=0x20"},
                 5,
                 "kestcfg: eth0: adapter-mode was not stored (it is still 0x02 tcpip; asked for "
                 "0x20)\n"}});
}

// Plug-in messages are shown as given; the unit tests of the items check each rule.
TEST_F(KestcfgControllerTest, RejectedValuesShowThePluginsMessageAndStatusAndChangeNothing) {
    const std::string before = State();
    ExpectRuns({
        {{"set", "eth0", "polling-interval=20000"},
         1,
         "kestcfg: eth0 rejected the change with UX_E_VALUE_INVALID (0x8004037F): Polling "
         "interval must be between 1 and 10000 ms."},
        // Judged with the current address and mask.
        {{"set", "eth0", "gateway=10.0.0.1"},
         1,
         "kestcfg: eth0 rejected the change with UX_E_ADDRESS_COMBINATION_INVALID (0x80040380): "
         "The IP address and gateway must be on the same subnet."},
        {{"set", "eth0", "subnet-mask=255.0.255.0"},
         1,
         "kestcfg: eth0 rejected the change with UX_E_SUBNET_MASK_INVALID (0x80040473)\n"},
        {{"set", kChassis, "serial-number=00000001", "comment=ok"},
         1,
         "kestcfg: VQ KEST Chassis does not accept changes to serial-number; nothing was changed"},
    });
    EXPECT_EQ(before, State());
    EXPECT_EQ(std::vector<std::string>{}, ControllerChanges(Calls()));
    const RunResult json = RunKestcfg({"--json", "set", "eth0", "polling-interval=0"});
    EXPECT_EQ(1, json.exitCode);
    EXPECT_EQ(
        "item=\"eth0\"\naccepted=false\nmessage=\"Polling interval must be between 1 and 10000 "
        "ms.\"\nerror/exitStatus=1\nerror/message=\"eth0 rejected the change with "
        "UX_E_VALUE_INVALID (0x8004037F): Polling interval must be between 1 and 10000 ms.\"\n"
        "error/status=\"UX_E_VALUE_INVALID\"\nerror/code=\"0x8004037F\"\n",
        FlattenJson(json.out));
}

TEST_F(KestcfgControllerTest, DescribeCoversEveryPropertyThatGetShows) {
    const RunResult described = RunKestcfg({"--json", "describe"});
    ASSERT_EQ(0, described.exitCode) << described.err;
    const std::string description = FlattenJson(described.out);
    const std::string shown = FlattenJson(RunKestcfg({"--json", "get"}).out);
    const std::regex property("items/([0-9])/properties/([a-z0-9-]+)/tag=");
    size_t count = 0;
    for (auto it = std::sregex_iterator(shown.begin(), shown.end(), property);
         it != std::sregex_iterator(); ++it, ++count) {
        const std::string name = "items/" + (*it)[1].str() + "/properties/[0-9]+/name=\"";
        EXPECT_TRUE(std::regex_search(description, std::regex(name + (*it)[2].str() + "\"")))
            << (*it)[0];
    }
    EXPECT_GT(count, 50u);
    const char* const hostName =
        "items/0/properties/3/name=\"host-name\"\nitems/0/properties/3/tag=\"0x0101F000\"\n"
        "items/0/properties/3/type=\"text\"\nitems/0/properties/3/changeable=true\n"
        "items/0/properties/3/restartRequired=true\n";
    for (const char* fact :
         {hostName, "/name=\"current-time\"\n", "/values/0=\"one of en,de,fr,zh,kr,ja\"",
          "/values/0=\"0x01 disabled\"\n", "/values/2=\"0x08 ethercat\"\n"}) {
        EXPECT_NE(std::string::npos, description.find(fact)) << fact << description;
    }
    const RunResult people = RunKestcfg({"describe", "chassis"});
    EXPECT_EQ(0u, people.out.find("VQ KEST Chassis\n  NAME ")) << people.out;
    EXPECT_NE(std::string::npos, people.out.find("web-service ")) << people.out;
}

TEST_F(KestcfgControllerTest, ControlCharactersAreEscapedInTablesAndKeptInJson) {
    // The controller reports text that kestcfg did not write: the device description.
    sysroot_.WriteFile(kStatePath,
                       std::regex_replace(State(), std::regex("DeviceDescription = KEST 9100"),
                                          "DeviceDescription = red\x1b[31m\x07 \xc2\x9b!"));
    const RunResult table = RunKestcfg({"get", "chassis", "description"});
    EXPECT_TRUE(HasRow(table.out, "0x01006000", "description", "text",
                       "VQ red\\\\x1B\\[31m\\\\x07 \\\\u009B!"))
        << table.out;
    EXPECT_EQ(std::string::npos, table.out.find('\x1b'));
    EXPECT_NE(std::string::npos,
              FlattenJson(RunKestcfg({"get", "chassis", "description", "--json"}).out)
                  .find("value=\"VQ red\\u001b[31m\\u0007 \xc2\x9b!\""));
}

// Command-line mistakes end with status 2 before anything is changed; a mistake in the words
// before the command's own arguments also names the help to read, in JSON as well.
TEST_F(KestcfgControllerTest, CommandLineMistakesAreUsageErrorsThatChangeNothing) {
    const auto hint = [](const std::string& topic) {
        return "\nTry '" + topic + " --help' for more information.\n";
    };
    const std::string confirmed = "--confirm-within";
    const std::vector<std::pair<std::vector<std::string>, std::string>> mistakes = {
        {{}, hint("kestcfg")},
        {{"frobnicate"}, hint("kestcfg")},
        {{"--frobnicate", "info"}, hint("kestcfg info")},
        {{"--plugin"}, hint("kestcfg")},
        {{"--plugin="}, hint("kestcfg")},
        {{"info", "extra"}, hint("kestcfg info")},
        {{"--sysroot", "/nonexistent/sysroot", "info"}, hint("kestcfg info")},
        {{"--sysroot", KESTCFG_PATH, "info"}, hint("kestcfg info")},
        {{"get", "--frobnicate"}, hint("kestcfg get")},
        {{"refresh", "eth0"}, hint("kestcfg refresh")},
        {{"set", "eth0"}, hint("kestcfg set")},
        {{"sim"}, hint("kestcfg sim")},
        {{"sim", "init"}, hint("kestcfg sim init")},
        {{"sim", "start", "/tmp/x"}, hint("kestcfg sim")},
        {{"sim", "init", ""}, hint("kestcfg sim init")},
        {{"set", "eth0", "polling-interval"}, "expected NAME=VALUE, got polling-interval"},
        {{"set", "eth0", "=5"}, "expected NAME=VALUE, got =5"},
        {{"set", "eth0", "no-such-property=5"}, "unknown property no-such-property"},
        {{"set", "eth0", "polling-interval=abc"}, "bad value for polling-interval"},
        {{"set", "eth0", "0x0ABCD000=1"}, ""},
        {{"set", "eth0", "polling-interval=5", "0x0D11B000=6"}, "given twice"},
        {{"set", "eth0", "polling-mode=sometimes"}, "a mode name (off, polling) or number"},
        {{"set", "eth0", "polling-interval=250", confirmed}, ""},
        {{"set", "eth0", "polling-interval=250", confirmed, "0"}, ""},
        {{"set", "eth0", "polling-interval=250", confirmed, "-5"}, ""},
        {{"set", "eth0", "polling-interval=250", confirmed, "3601"}, ""},
        {{"set", "eth0", "polling-interval=250", confirmed, "soon"}, ""},
        {{"set", "chassis", "current-time=now", confirmed, "60"}, "cannot be rolled back"},
        {{"set", "eth0", "primary-adapter=true", confirmed, "60"}, "primary-adapter"},
    };
    const std::string before = State();
    for (const auto& [arguments, part] : mistakes) {
        SCOPED_TRACE(testing::PrintToString(arguments));
        const RunResult result = RunKestcfg(arguments);
        EXPECT_EQ(2, result.exitCode) << result.err;
        EXPECT_EQ("", result.out);
        EXPECT_EQ(0u, result.err.rfind("kestcfg: ", 0)) << result.err;
        EXPECT_NE(std::string::npos, result.err.find(part)) << result.err;
        if (part.rfind("\nTry", 0) == 0) {
            std::vector<std::string> withJson = arguments;
            withJson.push_back("--json");
            const std::string flat = FlattenJson(RunKestcfg(withJson).out);
            EXPECT_EQ(0u, flat.find("error/exitStatus=2\nerror/message=\"")) << flat;
        }
    }
    EXPECT_EQ(before, State());
    EXPECT_FALSE(sysroot_.Exists("/run/kest/pending-rollback.json"));
}

}  // namespace

}  // namespace kest::test::cfg
