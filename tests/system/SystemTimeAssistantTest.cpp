#include "system/SystemTimeAssistant.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <chrono>

#include "common/StatusOf.h"
#include "property/CuxDynamicPropertyBag.h"
#include "system/SystemItemSysroot.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

using kest::test::StatusOf;

constexpr int64_t kEpoch = vq::dsc::AbsTime::kUnixEpochSeconds;

class SystemTimeAssistantTest : public ::testing::Test,
                                public kest::test::system::SystemItemSysroot {
  protected:
    SystemTimeAssistant assistant_;
};

TEST_F(SystemTimeAssistantTest, FindsBuiltInOffsetsOfStandardAndDaylightTexts) {
    const std::pair<const char*, int32_t> known[] = {
        {"PST8", -28800},          {"NPT-5:45", 20700},  {"CUT0GDT", 0},
        {"MART9:30MARDT", -34200}, {"TOT-13TDT", 46800}, {" Nst3:30ndt\t", -12600}};
    for (const auto& [text, offset] : known) {
        int32_t seconds = 99;
        EXPECT_EQ(S_OK, assistant_.FindLegacyOffset(text, seconds)) << text;
        EXPECT_EQ(offset, seconds) << text;
    }
    for (const char* text : {"America/Chicago", "PST 8", ""}) {
        int32_t seconds = 99;
        EXPECT_EQ(S_FALSE, assistant_.FindLegacyOffset(text, seconds)) << text;
        EXPECT_EQ(99, seconds) << text;
    }
}

TEST_F(SystemTimeAssistantTest, TranslatesThroughTheTableAndCountsUnknownOffsetsAsZero) {
    EXPECT_EQ(-63000, assistant_.GetLegacyOffsetDifference("UTC12", L"IST-5:30IDT"));
    EXPECT_EQ(0, assistant_.GetLegacyOffsetDifference("Europe/Berlin", L"Asia/Tokyo"));
    EXPECT_EQ("America/Chicago", assistant_.GetOlsonTimeZone());
    EXPECT_EQ("CST6CDT", assistant_.GetLegacyTimeZone());
    std::string olsonName = "untouched";
    EXPECT_EQ(S_OK, assistant_.LookupLegacyToOlson("PST8PDT", olsonName));
    EXPECT_EQ("America/Los_Angeles", olsonName);
    EXPECT_EQ(S_FALSE, assistant_.LookupLegacyToOlson("XYZ1", olsonName));
    EXPECT_EQ("America/Los_Angeles", olsonName);

    WriteState("[System]\nTimeZone = Europe/Paris\n");
    EXPECT_EQ("CUT0", assistant_.GetLegacyTimeZone()) << "a zone without a row";
    // An empty entry counts as missing; without a table every legacy text is unknown.
    sysroot_.WriteFile(kest::test::system::kTimeZoneTablePath, "[LegacyToOlson]\nPST8PDT =\n");
    EXPECT_EQ(S_FALSE, assistant_.LookupLegacyToOlson("PST8PDT", olsonName));
    EXPECT_EQ("America/Los_Angeles", olsonName);
    sysroot_.WriteFile(kest::test::system::kTimeZoneTablePath, "");
    WriteState(kest::test::system::SystemState());
    EXPECT_EQ("CUT0", assistant_.GetLegacyTimeZone());
    EXPECT_EQ(UX_E_VALUE_INVALID,
              assistant_.ValidateOlsonOrLegacyTimeZone("CST6CDT", false, nullptr));
}

TEST_F(SystemTimeAssistantTest, PersistsATimeZoneOnlyWhenItChangesToAKnownName) {
    struct Case {
        uint32_t tag;
        const wchar_t* value;  // null: the tag is not in the bag
        HRESULT result;
        const char* setters;
    };
    const Case cases[] = {
        {tags::kLegacyTimeZone, L"PST8PDT", S_OK, "SetTimeZone\t0\tAmerica/Los_Angeles\n"},
        {tags::kLegacyTimeZone, L"CST6CDT", S_FALSE, ""},
        {tags::kLegacyTimeZone, L"", UX_E_VALUE_INVALID, ""},
        {tags::kLegacyTimeZone, nullptr, UX_E_PROPERTY_NOT_FOUND, ""},
        {tags::kOlsonTimeZone, L"Europe/Berlin", S_OK, "SetTimeZone\t0\tEurope/Berlin\n"},
        {tags::kOlsonTimeZone, L"America/Chicago", S_FALSE, ""},
        {tags::kOlsonTimeZone, L"", UX_E_VALUE_INVALID, ""},
        {tags::kOlsonTimeZone, nullptr, UX_E_PROPERTY_NOT_FOUND, ""},
    };
    for (const Case& c : cases) {
        const size_t name = &c - cases;
        WriteState(kest::test::system::SystemState());
        sysroot_.WriteFile(kest::test::sim::kCallLogPath, "");
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        if (c.value != nullptr) {
            bag->SetString(c.tag, c.value);
        }
        int32_t persistFlag = 5;
        EXPECT_EQ(c.result, assistant_.PersistSystemPropertyTimezone(c.tag, bag.Get(), persistFlag))
            << name;
        EXPECT_EQ(5, persistFlag) << name;
        EXPECT_EQ(c.setters, SetterCalls()) << name;
        EXPECT_TRUE(c.value != nullptr || CallLog().empty())
            << name << ": a failed read calls nothing";
    }
    // Other tags and null bags are refused.
    int32_t persistFlag = 0;
    EXPECT_EQ(E_FAIL, StatusOf([&] {
                  return assistant_.PersistSystemPropertyTimezone(
                      tags::kHostName, CreatePropertyBag().Get(), persistFlag);
              }));
    EXPECT_EQ(E_POINTER,
              assistant_.PersistSystemPropertyTimezone(tags::kOlsonTimeZone, nullptr, persistFlag));
}

using ClockTest = SystemTimeAssistantTest;

// The system clock takes Unix seconds and whole microseconds; a readable real-time clock node
// makes the hardware-clock tool copy it, without the drift file unless that is usable.
TEST_F(ClockTest, SetsTheSystemClockAndCopiesItToAHardwareClock) {
    struct Case {
        const char* node;  // null: no real-time clock
        bool adjtime;
        const char* arguments;
    };
    const Case cases[] = {
        {nullptr, true, ""},
        {"/dev/rtc", true, "--systohc\n"},
        {"/dev/rtc0", false, "--systohc --noadjfile --utc\n"},
        {"/dev/misc/rtc", true, "--systohc\n"},
        {"/dev/misc/rtc", false, "--systohc --noadjfile --utc\n"},
    };
    for (const Case& c : cases) {
        kest::test::system::SystemItemSysroot fresh;
        if (c.node != nullptr) {
            fresh.sysroot_.WriteFile(c.node, "");
        }
        if (c.adjtime) {
            fresh.sysroot_.WriteFile("/etc/adjtime", "0.0 0 0.0\n0\nUTC\n");
        }
        // Half a second plus a hair below one microsecond more: the hair is cut off.
        SystemTimeAssistant::SetCurrentSystemTime(
            vq::dsc::AbsTime{(uint64_t(1) << 63) + 18446744073709ull, kEpoch + 1700000000});
        EXPECT_EQ("1700000000 500000\n", fresh.Clock());
        EXPECT_EQ(c.arguments, fresh.sysroot_.ReadFile(kest::test::system::kHardwareClockLog));
        EXPECT_EQ(c.node != nullptr, SystemTimeAssistant::HasRealTimeClock());
    }
    SystemTimeAssistant::SetCurrentSystemTime(vq::dsc::AbsTime{0, kEpoch});
    EXPECT_EQ("0 0\n", Clock());
}

// A tool that fails, dies or that others could change (group or others may write it or its
// directory, or it belongs to another user) fails the persist after the system time is set; the
// untrusted ones are not started.
TEST_F(ClockTest, HardwareClockFailuresAndUntrustedToolsFailThePersist) {
    sysroot_.WriteFile("/dev/rtc", "");
    const std::string tool = sysroot_.PathOf("/sbin/hwclock");
    const std::string directory = sysroot_.PathOf("/sbin");
    const std::string environment =
        "tr '\\0' ';' < /proc/$$/environ > '" + sysroot_.PathOf("/env") + "'";
    struct Case {
        const char* exit;
        const std::string& path;
        mode_t mode;
        uid_t owner;
        HRESULT result;
        bool ran;
    };
    const Case cases[] = {
        {"exit 0", tool, 0755, 0, S_OK, true},
        {environment.c_str(), tool, 0755, 0, S_OK, true},
        {"exit 3", tool, 0755, 0, E_FAIL, true},
        {"kill -9 $$", tool, 0755, 0, E_FAIL, true},
        {"exit 0", tool, 0644, 0, E_FAIL, false},
        {"exit 0", tool, 0775, 0, E_FAIL, false},
        {"exit 0", tool, 0757, 0, E_FAIL, false},
        {"exit 0", directory, 0777, 0, E_FAIL, false},
        {"exit 0", directory, 01777, 0, E_FAIL, false},
        {"exit 0", tool, 0755, 65534, E_FAIL, false},
    };
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    bag->SetTimestamp(tags::kCurrentTime, {0, kEpoch + 100});
    for (const Case& c : cases) {
        sysroot_.WriteScript("/sbin/hwclock",
                             "touch '" + sysroot_.PathOf("/ran") + "'\n" + c.exit + "\n");
        std::remove(sysroot_.PathOf("/ran").c_str());
        sysroot_.WriteFile(kest::test::system::kClockFile, "");
        chmod(directory.c_str(), 0755);
        chmod(c.path.c_str(), c.mode);
        ASSERT_EQ(0, chown(c.path.c_str(), c.owner, c.owner));
        const std::string name = c.path + " " + c.exit;
        EXPECT_EQ(c.result, assistant_.PersistSystemPropertyCurrentTime(bag.Get(), 0)) << name;
        EXPECT_EQ(c.ran, sysroot_.Exists("/ran")) << name << " " << std::oct << c.mode;
        EXPECT_EQ("100 0\n", Clock()) << name;
        ASSERT_EQ(0, chown(c.path.c_str(), 0, 0));
    }
    EXPECT_EQ("PATH=/usr/sbin:/usr/bin:/sbin:/bin;", sysroot_.ReadFile("/env"))
        << "the tool gets only the search path";
}

TEST_F(ClockTest, HardwareClockGetsATimeLimit) {
    sysroot_.WriteFile("/dev/rtc", "");
    sysroot_.WriteScript("/sbin/hwclock", "exec sleep 30\n");
    constexpr std::chrono::milliseconds kShortLimit{200};
    SystemTimeAssistant::SetHardwareClockTimeLimit(kShortLimit);
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    bag->SetTimestamp(tags::kCurrentTime, {0, kEpoch + 100});
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(E_FAIL, assistant_.PersistSystemPropertyCurrentTime(bag.Get(), 0));
    EXPECT_GE(std::chrono::steady_clock::now() - start, kShortLimit);
    SystemTimeAssistant::SetHardwareClockTimeLimit(std::chrono::seconds(60));
}

TEST_F(ClockTest, TimesTheClockCannotHoldAndMissingTimesFail) {
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND,
              StatusOf([&] { assistant_.PersistSystemPropertyCurrentTime(bag.Get(), 0); }));
    EXPECT_EQ(E_POINTER, assistant_.PersistSystemPropertyCurrentTime(nullptr, 0));
    const std::pair<uxSysAttrTimestampUTC, int32_t> unholdable[] = {
        {{uint64_t(1) << 63, kEpoch - 2}, 0}, {{0, kEpoch - 2}, 0}, {{0, INT64_MAX}, 1}};
    for (const auto& [time, offsetSeconds] : unholdable) {
        bag->SetTimestamp(tags::kCurrentTime, time);
        EXPECT_EQ(E_FAIL, assistant_.PersistSystemPropertyCurrentTime(bag.Get(), offsetSeconds))
            << time.seconds;
    }
    EXPECT_EQ("", Clock());
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
