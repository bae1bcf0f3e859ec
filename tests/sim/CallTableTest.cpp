// Every call over one state file, and the cases the table cannot show: the empty controller,
// malformed values, escaped text, language codes and zone names.
#include <gmock/gmock.h>
#include <unistd.h>

#include <set>

#include "SimFixture.h"
#include "common/ChildProcess.h"

namespace kest::test::sim {
namespace {

TEST_F(SimTest, EachCallGivesItsStatusOutputsStateAndLogLine) {
    for (const CallRow& row : CallRows()) {
        SCOPED_TRACE(row.logLine);
        WriteState(kState);
        const size_t logged = CallLog().size();
        Outputs outputs;
        EXPECT_EQ(row.call(outputs), row.status);
        EXPECT_EQ(outputs.Changed(), row.changed);
        std::string state = kState;
        std::istringstream edits(row.edits);
        for (std::string from, to;
             std::getline(edits, from, '|') && std::getline(edits, to, '|');) {
            const size_t at = state.find(from);
            ASSERT_NE(at, std::string::npos) << from;
            state.replace(at, from.size(), to);
        }
        EXPECT_EQ(State(), state);
        const std::vector<std::string> log = CallLog();
        EXPECT_EQ(log.size(), logged + 1);
        EXPECT_EQ(log.back(), row.logLine);
        // The file is replaced by rename: no temporary file stays behind.
        const std::vector<std::string> entries =
            kest::test::EntriesOf(sysroot_.PathOf("/var/lib/vqtargetcfg"));
        EXPECT_EQ(std::set<std::string>(entries.begin(), entries.end()),
                  (std::set<std::string>{"state.ini", "state.lock", "calls.log"}));
    }
}

TEST_F(SimTest, EmptyControllerGivesEmptyTextsKeepsPresetsAndSettersCreateTheFile) {
    Outputs outputs;
    ASSERT_EQ(tc::system::GetHostName(outputs.text), 0);
    ASSERT_EQ(tc::system::GetTargetID(outputs.number), 0);
    ASSERT_EQ(tc::network::GetPrimaryDeviceIndex(outputs.second), 0);
    ASSERT_EQ(tc::GetDeviceHandlers(outputs.devices), 0);
    EXPECT_EQ(outputs.Changed(), "text=");
    EXPECT_EQ(tc::system::GetTimezoneOffset(), 0);
    EXPECT_FALSE(sysroot_.Exists(kStatePath));

    ASSERT_EQ(tc::system::SetHostName("first"), 0);
    ASSERT_EQ(tc::system::SetTimeZone("UTC"), 0);
    EXPECT_EQ(tc::network::SetPrimaryDeviceByIndex(0), -375563);
    EXPECT_EQ(State(), "[System]\nHostName=first\nTimeZone=UTC\n");
}

TEST_F(SimTest, MalformedValuesFailWithoutTouchingOutputs) {
    for (const char* text : {"2x", "0x", "-", "0x100000000", "08 1", "-1"}) {
        WriteState(std::string("[Device0]\nMode = ") + text + "\n");
        Outputs outputs;
        EXPECT_EQ(tc::network::GetDeviceModeByIndex(0, outputs.number), -375501) << text;
        EXPECT_EQ(outputs.Changed(), "");
    }
    WriteState("[Device0]\nIPAddress = 300.1.1.1\n");
    Outputs outputs;
    EXPECT_EQ(tc::network::GetIPAddressByIndex(0, 0, outputs.address, outputs.mask, nullptr),
              -375501);
}

TEST_F(SimTest, SetThenGetRoundTripsSpecialCharacters) {
    const std::string comment = "  two\r\nlines\\with\ttab  ";
    ASSERT_EQ(tc::system::SetUserComment(comment), 0);
    tc::WideString wide;
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

TEST_F(SimTest, ValidateTimeZoneAcceptsOnlyFilesInsideTheSysrootDatabase) {
    sysroot_.WriteFile("/etc/secret", "x");
    for (const char* name : {"Europe/Paris", "Europe", "", "/Europe/Berlin", "Europe//Berlin",
                             "./Europe/Berlin", "Europe/../Europe/Berlin", "../../../etc/secret"}) {
        EXPECT_EQ(tc::system::ValidateTimeZone(name), -375523) << name;
    }
    EXPECT_EQ(tc::system::ValidateTimeZone(NarrowString("Europe/Berlin\0x", 15)), -375523);
}

TEST(SimZones, ValidateTimeZoneFallsBackToTheMachineDatabase) {
    if (access("/usr/share/zoneinfo/UTC", R_OK) != 0) {
        GTEST_SKIP() << "the machine has no zone database";
    }
    const kest::test::TempSysroot sysroot;
    EXPECT_EQ(tc::system::ValidateTimeZone("UTC"), 0);
    EXPECT_EQ(tc::system::ValidateTimeZone("No/Such_Zone"), -375523);
}

}  // namespace
}  // namespace kest::test::sim
