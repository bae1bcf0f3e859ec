// Validation and persistence of changes through the system item's handler.
#include <gtest/gtest.h>

#include <string>

#include "property/CuxDynamicPropertyBag.h"
#include "support/AbsTime.h"
#include "system/KestDeviceItemHandler.h"
#include "system/SystemItemSysroot.h"
#include "uxsys/HostString.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr int64_t kEpoch = vq::dsc::AbsTime::kUnixEpochSeconds;
constexpr uxSysAttrTimestampUTC k2023{0, kEpoch + 1700000000};

class SystemItemChangesTest : public ::testing::Test, public kest::test::system::SystemItemSysroot {
  protected:
    SystemItemChangesTest() {
        sysroot_.WriteFile("/usr/share/zoneinfo/Europe/Berlin", "TZif");
        // The hardware-clock tool also logs the web-service settings it finds.
        sysroot_.WriteFile("/dev/rtc", "");
        sysroot_.WriteScript("/sbin/hwclock",
                             "cat '" + sysroot_.PathOf("/etc/korvane/share/vqkest.ini") + "' >> '" +
                                 sysroot_.PathOf("/hwclock.log") + "' 2>/dev/null || true\n");
    }

    HRESULT Validate() {
        validated_.clear();
        return handler_->ValidatePropertyChanges(changes_.Get(), validated_, message_.Receive());
    }
    HRESULT Persist() {
        CountedPtr<vq::targetcfg::IDeviceHandler> device;
        bool adapterDisabled = false;
        return handler_->PersistPropertyChanges(changes_.Get(), persistFlag_, device,
                                                adapterDisabled);
    }

    CountedPtr<KestDeviceItemHandler> handler_ = MakeCounted<KestDeviceItemHandler>();
    CountedPtr<IuxSysPropertyBag4> changes_ = CreatePropertyBag();
    PropertyTagSet validated_;
    CvqBStrHolder message_;
    int32_t persistFlag_ = 0;
};

TEST_F(SystemItemChangesTest, AcceptsEverySettingOfTheItemAndIgnoresOthersAndUnmodified) {
    changes_->SetString(tags::kHostName, L"kest-02");
    changes_->SetString(tags::kComment, L"spare");
    changes_->SetString(tags::kLocaleCode, L"fr");
    changes_->SetTimestamp(tags::kCurrentTime, k2023);
    changes_->SetString(tags::kLegacyTimeZone, L"PST8PDT");
    changes_->SetString(tags::kOlsonTimeZone, L"Europe/Berlin");
    changes_->SetBool(tags::kWebServiceEnabled, 1);
    changes_->SetString(tags::kDeviceDescription, L"not a setting");
    EXPECT_EQ(S_OK, Validate());
    EXPECT_EQ(
        (PropertyTagSet{tags::kHostName, tags::kComment, tags::kLocaleCode, tags::kCurrentTime,
                        tags::kLegacyTimeZone, tags::kOlsonTimeZone, tags::kWebServiceEnabled}),
        validated_);
    EXPECT_EQ(nullptr, message_.Get());
    EXPECT_EQ("", SetterCalls()) << "validation changes nothing";

    // Nothing modified is nothing to do.
    sysroot_.WriteFile(kest::test::sim::kCallLogPath, "");
    changes_->ClearAllModified();
    EXPECT_EQ(S_FALSE, Validate());
    EXPECT_EQ(S_FALSE, Persist());
    EXPECT_EQ(E_POINTER, handler_->ValidatePropertyChanges(nullptr, validated_, nullptr));
    EXPECT_TRUE(CallLog().empty());
    EXPECT_TRUE(validated_.empty());
}

TEST_F(SystemItemChangesTest, StopsAtTheFirstRejectionWithItsStatusAndMessage) {
    struct Case {
        const char* name;
        uint32_t tag;
        const wchar_t* text;  // null: the value below is set instead
        const wchar_t* message;
        HRESULT status = UX_E_VALUE_INVALID;
    };
    const wchar_t* zone = L"Timezone not supported.";
    const Case cases[] = {
        {"legacy zone", tags::kLegacyTimeZone, L"XYZ1", zone},
        {"Olson zone", tags::kOlsonTimeZone, L"Mars/Olympus", L"(none)"},
        {"Olson zone leading out", tags::kOlsonTimeZone, L"../x", zone},
        {"Olson zone from the root", tags::kOlsonTimeZone, L"/usr/share/x", zone},
        {"Olson zone with a line break", tags::kOlsonTimeZone, L"Europe/Berlin\n", zone},
        {"legacy zone with a parent part", tags::kLegacyTimeZone, L"PST8PDT/..", zone},
        {"time before 1970", tags::kCurrentTime, nullptr,
         L"Timestamps older than 1970 are not supported."},
        {"web switch of another type", tags::kWebServiceEnabled, L"1", L"(none)",
         UX_E_PROPERTY_TYPE_MISMATCH},
    };
    // Names that lead out of the zone directory would find a zone file there.
    sysroot_.WriteFile("/usr/share/x", "TZif");
    for (const Case& c : cases) {
        changes_ = CreatePropertyBag();
        changes_->SetString(tags::kHostName, L"kest-02");
        if (c.text != nullptr) {
            changes_->SetString(c.tag, c.text);
        } else {
            changes_->SetTimestamp(c.tag, {0, kEpoch - 1});
        }
        changes_->SetBool(0x7FFFF000, 1);
        EXPECT_EQ(c.status, Validate()) << c.name;
        EXPECT_EQ(c.message, std::wstring(message_.Get() ? message_.Get() : L"(none)")) << c.name;
        EXPECT_EQ(PropertyTagSet{tags::kHostName}, validated_) << c.name;
        EXPECT_EQ(c.status, handler_->ValidatePropertyChanges(changes_.Get(), validated_, nullptr))
            << c.name << " without message slot";
    }
}

// Every change also sets the clock to 2023, last; a new legacy zone corrects it by the difference
// of the legacy offsets, and a failing change stops before it.
TEST_F(SystemItemChangesTest, PersistsInTagOrderAndFlagsRestartingChanges) {
    struct Case {
        const char* name;
        const char* state;  // overrides
        uint32_t tag;
        const wchar_t* text;
        uint32_t secondTag;  // 0: none
        const wchar_t* secondText;
        const char* setters;
        int32_t persistFlag;
        const char* clock;
        HRESULT result = S_OK;
    };
    const char* set = "1700000000 0\n";
    const char* losAngeles = "SetTimeZone\t0\tAmerica/Los_Angeles\n";
    const uint32_t legacy = tags::kLegacyTimeZone;
    const Case cases[] = {
        {"host name and comment", "", tags::kComment, L"spare", tags::kHostName, L"kest-02",
         "SetHostName\t0\tkest-02\nSetUserComment\t0\tspare\n", 1, set},
        {"comment only", "", tags::kComment, L"spare", 0, L"", "SetUserComment\t0\tspare\n", 0,
         set},
        {"locale", "", tags::kLocaleCode, L"fr", 0, L"", "SetLanguageName\t0\tfr\n", 1, set},
        {"failing locale after host name", "[Faults]\nSetLanguageName = -375523", tags::kHostName,
         L"kest-02", tags::kLocaleCode, L"fr",
         "SetHostName\t0\tkest-02\nSetLanguageName\t-375523\tfr\n", 1, "", UX_E_VALUE_INVALID},
        // Persisting without validating first: a rejected value stops everything.
        {"host name with a line break", "", tags::kHostName, L"kest\n02; reboot", 0, L"", "", 0, "",
         UX_E_HOSTNAME_INVALID},
        {"Olson zone leading out", "", tags::kOlsonTimeZone, L"../x", 0, L"", "", 0, "",
         UX_E_VALUE_INVALID},
        {"control character in a comment after a good host name", "", tags::kHostName, L"kest-02",
         tags::kComment, L"rack\x7f", "", 0, "", UX_E_VALUE_INVALID},
        {"unsupported locale", "", tags::kLocaleCode, L"xx", 0, L"", "", 0, "", UX_E_VALUE_INVALID},
        {"Olson zone", "", tags::kOlsonTimeZone, L"Europe/Berlin", 0, L"",
         "SetTimeZone\t0\tEurope/Berlin\n", 0, set},
        {"unchanged legacy zone", "", legacy, L"CST6CDT", 0, L"", "", 0, "1700021600 0\n"},
        {"Olson to legacy", "", legacy, L"PST8PDT", 0, L"", losAngeles, 0, "1700028800 0\n"},
        {"legacy to legacy", "TimeZone = EST5EDT", legacy, L"PST8PDT", 0, L"", losAngeles, 0,
         "1700010800 0\n"},
        {"legacy eastwards", "TimeZone = PST8PDT", legacy, L"EST5EDT", 0, L"",
         "SetTimeZone\t0\tAmerica/New_York\n", 0, "1699989200 0\n"},
        // Spellings the time-zone table accepts get the same correction.
        {"lower case", "", legacy, L"pst8pdt", 0, L"", losAngeles, 0, "1700028800 0\n"},
        {"blanks", "", legacy, L" PST8PDT  ", 0, L"", losAngeles, 0, "1700028800 0\n"},
        {"mixed", "TimeZone = EST5EDT", legacy, L"  Pst8Pdt ", 0, L"", losAngeles, 0,
         "1700010800 0\n"},
        {"unknown legacy zone", "", legacy, L"XYZ1", 0, L"", "", 0, "", UX_E_VALUE_INVALID},
    };
    sysroot_.WriteFile("/usr/share/x", "TZif");
    for (const Case& c : cases) {
        WriteState(kest::test::system::SystemState(c.state));
        sysroot_.WriteFile(kest::test::sim::kCallLogPath, "");
        sysroot_.WriteFile(kest::test::system::kClockFile, "");
        changes_ = CreatePropertyBag();
        changes_->SetTimestamp(tags::kCurrentTime, k2023);
        changes_->SetString(c.tag, c.text);
        if (c.secondTag != 0) {
            changes_->SetString(c.secondTag, c.secondText);
        }
        persistFlag_ = 0;
        EXPECT_EQ(c.result, Persist()) << c.name;
        EXPECT_EQ(c.setters, SetterCalls()) << c.name;
        EXPECT_EQ(c.persistFlag, persistFlag_) << c.name;
        EXPECT_EQ(c.clock, Clock()) << c.name;
    }
}

// The switch is rewritten even when unchanged, and saved before the clock is set last.
TEST_F(SystemItemChangesTest, SavesTheWebServiceSwitchThenSetsTheClock) {
    sysroot_.WriteFile(kest::test::system::kWebServicePath, "; old\n[WebService]\nEnable = 0\n");
    handler_ = MakeCounted<KestDeviceItemHandler>();
    changes_->SetBool(tags::kWebServiceEnabled, 0);
    EXPECT_EQ(S_OK, Persist());
    EXPECT_EQ(1, persistFlag_);
    EXPECT_EQ("[WebService]\nEnable = 0\n\n",
              sysroot_.ReadFile(kest::test::system::kWebServicePath));

    changes_->SetTimestamp(tags::kCurrentTime, k2023);
    changes_->SetBool(tags::kWebServiceEnabled, 1);
    persistFlag_ = 0;
    EXPECT_EQ(S_OK, Persist());
    EXPECT_EQ("1700000000 0\n", Clock()) << "no legacy zone change, no correction";
    EXPECT_EQ("[WebService]\nEnable = 1\n\n",
              sysroot_.ReadFile(kest::test::system::kHardwareClockLog))
        << "the switch was saved when the hardware clock was written";
    EXPECT_EQ(1, persistFlag_);
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
