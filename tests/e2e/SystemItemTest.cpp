// The system item as a host sees it: the time zone set in either notation, the clock following
// the legacy zone, the web-service switch shared with other processes, and the rejections a host
// shows for bad values.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr uint32_t kHostNameTag = 0x0101F000;
constexpr uint32_t kCommentTag = 0x0103D000;
constexpr uint32_t kLocaleTag = 0x0D11D000;
constexpr uint32_t kCurrentTimeTag = 0x0D11F000;
constexpr uint32_t kLegacyTimeZoneTag = 0x0D120000;
constexpr uint32_t kOlsonTimeZoneTag = 0x0D14E000;
constexpr uint32_t kWebServiceTag = 0x21004000;
constexpr int64_t kUnixEpochIn1904Seconds = 2082844800;
constexpr char kSettingsPath[] = "/etc/korvane/share/vqkest.ini";

// The time-zone table the plug-in ships, from the source tree.
std::string ShippedTimeZoneTable() {
    std::ifstream table(KEST_SOURCE_DATA_DIR "/timezone.ini", std::ios::binary);
    std::ostringstream content;
    content << table.rdbuf();
    return content.str();
}

class SystemItemTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(std::string(kSystemState) + "DeviceDescription = KEST 9100\n");
        sysroot.WriteFile("/usr/share/vqsysapi/timezone.ini", ShippedTimeZoneTable());
        for (const char* zone : {"Europe/Berlin", "America/Chicago", "America/Los_Angeles"}) {
            sysroot.WriteFile(std::string("/usr/share/zoneinfo/") + zone, "TZif");
        }
        sysroot.MakeDirectory("/etc/korvane/share");
        ExpertHostTest::SetUp();
    }

    // The system item's current properties.
    InterfaceRef<IuxSysPropertyBag> Properties() {
        InterfaceRef<IuxSysPropertyBag> bag;
        EXPECT_EQ(S_OK, expert->GetPropertiesOfItem(kSystemItemName, bag.Receive()));
        return bag;
    }

    std::wstring Text(uint32_t tag) {
        CvqBStr text = nullptr;
        EXPECT_EQ(S_OK, Properties()->GetString(tag, &text)) << std::hex << tag;
        return TakeWideHostString(text);
    }

    bool Bool(uint32_t tag) {
        int32_t value = -1;
        EXPECT_EQ(S_OK, Properties()->GetBool(tag, &value)) << std::hex << tag;
        return value != 0;
    }

    // A bag of changes: a copy of the current properties (nothing modified) with `write` applied.
    template <class Write>
    InterfaceRef<IuxSysPropertyBag2> Changes(Write&& write) {
        InterfaceRef<IuxSysPropertyBag> copy;
        EXPECT_EQ(S_OK, Properties()->Clone(copy.Receive()));
        InterfaceRef<IuxSysPropertyBag2> changes;
        EXPECT_EQ(S_OK, copy->QueryInterface(IID_IuxSysPropertyBag2,
                                             reinterpret_cast<void**>(changes.Receive())));
        write(changes.Get());
        return changes;
    }

    struct Outcome {
        HRESULT validation;
        std::wstring message;
        std::vector<uint32_t> validated;
        HRESULT persistence = S_OK;
        int32_t restartRequired = -1;
    };

    // Validates the changes and, when they pass, persists them, as a host does.
    Outcome Apply(const InterfaceRef<IuxSysPropertyBag2>& changes) {
        Outcome outcome;
        InterfaceRef<IuxSysEnumPropertyTag> validated;
        CvqBStr message = nullptr;
        outcome.validation = expert->ValidatePropertyChanges(kSystemItemName, changes.Get(),
                                                             validated.Receive(), &message);
        outcome.message = TakeWideHostString(message);
        uint32_t tag = 0;
        while (validated && validated->Next(1, &tag, nullptr) == S_OK) {
            outcome.validated.push_back(tag);
        }
        if (outcome.validation == S_OK) {
            outcome.persistence = expert->PersistPropertyChanges(kSystemItemName, changes.Get(),
                                                                 &outcome.restartRequired);
        }
        return outcome;
    }

    std::string ControllerState() const { return sysroot.ReadFile(kControllerStatePath); }
};

TEST_F(SystemItemTest, SetsTheTimeZoneInEitherNotation) {
    Outcome outcome = Apply(Changes([](IuxSysPropertyBag2* changes) {
        changes->SetString(kOlsonTimeZoneTag, L"America/Chicago");
    }));
    EXPECT_EQ(S_OK, outcome.validation);
    EXPECT_EQ(S_OK, outcome.persistence);
    EXPECT_EQ(0, outcome.restartRequired);
    EXPECT_EQ(L"America/Chicago", Text(kOlsonTimeZoneTag));
    EXPECT_EQ(L"CST6CDT", Text(kLegacyTimeZoneTag));

    outcome = Apply(Changes(
        [](IuxSysPropertyBag2* changes) { changes->SetString(kLegacyTimeZoneTag, L"PST8PDT"); }));
    EXPECT_EQ(S_OK, outcome.validation);
    EXPECT_EQ(S_OK, outcome.persistence);
    EXPECT_EQ(L"America/Los_Angeles", Text(kOlsonTimeZoneTag));
    EXPECT_EQ(L"PST8PDT", Text(kLegacyTimeZoneTag));
}

TEST_F(SystemItemTest, ClockFollowsTheLegacyZoneHoweverItIsSpelled) {
    // From Europe/Berlin (an Olson name: no built-in offset) to eight hours west of UTC.
    for (const wchar_t* spelling : {L"PST8PDT", L"pst8pdt", L" PST8PDT "}) {
        WriteControllerState(std::string(kSystemState) + "DeviceDescription = KEST 9100\n");
        const Outcome outcome = Apply(Changes([&](IuxSysPropertyBag2* changes) {
            changes->SetString(kLegacyTimeZoneTag, spelling);
            changes->SetTimestamp(kCurrentTimeTag, {0, kUnixEpochIn1904Seconds + 1700000000});
        }));
        EXPECT_EQ(S_OK, outcome.persistence);
        EXPECT_EQ("1700028800 0\n", sysroot.ReadFile("/run/kest/system-clock"));
        EXPECT_EQ(L"America/Los_Angeles", Text(kOlsonTimeZoneTag));
    }
}

// Another process switches the web service on and adds its own section: the host that read the
// switch before shows the change, and its own save keeps that section.
TEST_F(SystemItemTest, SeesAndKeepsWhatAnotherProcessSaved) {
    EXPECT_FALSE(Bool(kWebServiceTag));
    const pid_t other = fork();
    if (other == 0) {
        sysroot.WriteFile("/etc/korvane/share/other.new",
                          "[Other]\nKey = x\n[WebService]\nEnable = 1\n");
        _exit(std::rename(sysroot.PathOf("/etc/korvane/share/other.new").c_str(),
                          sysroot.PathOf(kSettingsPath).c_str()));
    }
    int status = -1;
    ASSERT_EQ(other, waitpid(other, &status, 0));
    ASSERT_EQ(0, status);
    EXPECT_TRUE(Bool(kWebServiceTag));
    Outcome outcome =
        Apply(Changes([](IuxSysPropertyBag2* changes) { changes->SetBool(kWebServiceTag, 0); }));
    EXPECT_EQ(S_OK, outcome.persistence);
    EXPECT_EQ("[Other]\nKey = x\n\n[WebService]\nEnable = 0\n\n", sysroot.ReadFile(kSettingsPath));
}

// A settings file that cannot be read (a FIFO here) hangs neither a get nor a set, and is left
// in place: the set fails.
TEST_F(SystemItemTest, ASettingsFileThatCannotBeReadIsLeftAlone) {
    const std::string path = sysroot.PathOf(kSettingsPath);
    ASSERT_EQ(0, mkfifo(path.c_str(), 0600));
    EXPECT_FALSE(Bool(kWebServiceTag));
    Outcome outcome =
        Apply(Changes([](IuxSysPropertyBag2* changes) { changes->SetBool(kWebServiceTag, 1); }));
    EXPECT_EQ(E_FAIL, outcome.persistence);
    struct stat fifo;
    ASSERT_EQ(0, lstat(path.c_str(), &fifo));
    EXPECT_TRUE(S_ISFIFO(fifo.st_mode));
}

TEST_F(SystemItemTest, RejectsBadValuesWithTheirMessages) {
    struct Case {
        uint32_t tag;
        const wchar_t* value;
        HRESULT status;
        const wchar_t* message;
    };
    const Case cases[] = {
        {kHostNameTag, L"kest_2", UX_E_HOSTNAME_INVALID,
         L"Hostname must contain only alphanumeric characters and hyphens."},
        {kCommentTag, L"ccccccccccccccccccccccccccccccccccccccccccccccccccccccccccccccccc",
         UX_E_VALUE_INVALID, L"Comment length cannot exceed 64 characters."},
        {kLocaleTag, L"e", UX_E_VALUE_INVALID, L"Locale not supported."},
        {kLegacyTimeZoneTag, L"NFT-11:30", UX_E_VALUE_INVALID, L"Timezone not supported."},
        {kHostNameTag, L"kest-2\nreboot", UX_E_HOSTNAME_INVALID,
         L"Hostname must contain only alphanumeric characters and hyphens."},
        {kOlsonTimeZoneTag, L"../x", UX_E_VALUE_INVALID, L"Timezone not supported."},
        {kCommentTag, L"rack\r4", UX_E_VALUE_INVALID,
         L"Comment cannot contain control characters."},
    };
    // A zone file that a name leading out of the zone directory would find.
    sysroot.WriteFile("/usr/share/x", "TZif");
    for (const Case& c : cases) {
        const Outcome outcome = Apply(
            Changes([&](IuxSysPropertyBag2* changes) { changes->SetString(c.tag, c.value); }));
        EXPECT_EQ(c.status, outcome.validation) << std::hex << c.tag;
        EXPECT_EQ(c.message, outcome.message) << std::hex << c.tag;
        EXPECT_TRUE(outcome.validated.empty());

        // A host that persists without validating first gets the same status.
        const InterfaceRef<IuxSysPropertyBag2> changes =
            Changes([&](IuxSysPropertyBag2* bag) { bag->SetString(c.tag, c.value); });
        int32_t restart = -1;
        EXPECT_EQ(c.status,
                  expert->PersistPropertyChanges(kSystemItemName, changes.Get(), &restart))
            << std::hex << c.tag;
    }
    EXPECT_EQ(std::string::npos, sysroot.ReadFile(kControllerCallLogPath).find("\tSet"))
        << "nothing reached the controller";
    const Outcome old = Apply(Changes([](IuxSysPropertyBag2* changes) {
        changes->SetTimestamp(kCurrentTimeTag, {0, kUnixEpochIn1904Seconds - 1});
    }));
    EXPECT_EQ(UX_E_VALUE_INVALID, old.validation);
    EXPECT_EQ(L"Timestamps older than 1970 are not supported.", old.message);
    EXPECT_EQ(L"kest-1", Text(kHostNameTag)) << "nothing was persisted";
}

}  // namespace
}  // namespace kest::test::e2e
