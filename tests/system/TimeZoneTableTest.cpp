// Checks the shipped time-zone table against the built-in legacy table.
#include <gtest/gtest.h>

#include <filesystem>
#include <iterator>
#include <map>
#include <set>
#include <string>

#include "config/IniTextPtr.h"
#include "system/SystemItemSysroot.h"
#include "system/SystemTimeAssistant.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// The keys and values of one section of the shipped table.
std::map<std::string, std::string> Section(IniText* table, const char* section) {
    std::map<std::string, std::string> entries;
    const int count = IniText_GetKeyCount(table, section);
    for (int i = 1; i <= count; ++i) {
        const char* key = nullptr;
        const char* value = nullptr;
        if (IniText_GetKeyByIndex(table, section, i, &key, &value) == kIniFound) {
            entries.emplace(key, value);
        }
    }
    return entries;
}

class TimeZoneTableTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_TRUE(table_);
        ASSERT_EQ(0, IniText_Load(table_.get(), KEST_SHIPPED_TIMEZONE_TABLE));
        legacyToOlson_ = Section(table_.get(), "LegacyToOlson");
        olsonToLegacy_ = Section(table_.get(), "OlsonToLegacy");
    }

    int32_t OffsetOf(const std::string& legacyText) {
        int32_t seconds = 0;
        EXPECT_EQ(S_OK, assistant_.FindLegacyOffset(legacyText, seconds)) << legacyText;
        return seconds;
    }

    kest::test::system::SystemItemSysroot sysroot_;
    SystemTimeAssistant assistant_;
    IniTextPtr table_{IniText_Create()};
    std::map<std::string, std::string> legacyToOlson_;
    std::map<std::string, std::string> olsonToLegacy_;
};

TEST_F(TimeZoneTableTest, MapsEveryLegacyTextThatSomeZoneShares) {
    // No zone of the time-zone data is 11:30 hours east of UTC.
    const std::set<std::string> withoutZone = {"NFT-11:30", "NFT-11:30NFDT"};
    for (const LegacyTimeZone& zone : BuiltInLegacyTimeZones()) {
        for (const std::string& text : {zone.standardText, zone.daylightText}) {
            EXPECT_EQ(withoutZone.count(text) == 0, legacyToOlson_.count(text) == 1) << text;
        }
    }
    EXPECT_EQ(84u, legacyToOlson_.size());
}

TEST_F(TimeZoneTableTest, EveryMappingKeepsTheOffset) {
    EXPECT_GT(olsonToLegacy_.size(), 500u);
    for (const auto& [olsonName, legacyText] : olsonToLegacy_) {
        OffsetOf(legacyText);
    }
    for (const auto& [legacyText, olsonName] : legacyToOlson_) {
        ASSERT_EQ(1u, olsonToLegacy_.count(olsonName)) << legacyText << " = " << olsonName;
        EXPECT_EQ(OffsetOf(legacyText), OffsetOf(olsonToLegacy_[olsonName]))
            << legacyText << " = " << olsonName;
    }
}

TEST_F(TimeZoneTableTest, KnownZonesHaveTheirLegacyTextsForTheAssistant) {
    // Olson names, each followed by its legacy text.
    const char* known[] = {"America/Chicago",  "CST6CDT",  "America/Los_Angeles", "PST8PDT",
                           "America/New_York", "EST5EDT",  "Europe/London",       "GMT0BST",
                           "Etc/UTC",          "CUT0",     "Asia/Tokyo",          "JST-9",
                           "Asia/Kolkata",     "IST-5:30", "Asia/Kathmandu",      "NPT-5:45",
                           "America/Phoenix",  "MST7",     "Australia/Sydney",    "EET-10EETDT"};
    for (size_t i = 0; i < std::size(known); i += 2) {
        EXPECT_EQ(known[i + 1], olsonToLegacy_[known[i]]) << known[i];
    }
    EXPECT_EQ(0u, olsonToLegacy_.count("Pacific/Kiritimati")) << "14 hours east has no row";

    // The assistant reads the shipped table.
    std::filesystem::copy_file(KEST_SHIPPED_TIMEZONE_TABLE,
                               sysroot_.sysroot_.PathOf(kest::test::system::kTimeZoneTablePath),
                               std::filesystem::copy_options::overwrite_existing);
    EXPECT_EQ("CST6CDT", assistant_.GetLegacyTimeZone());
    EXPECT_EQ(S_OK, assistant_.ValidateOlsonOrLegacyTimeZone("MART9:30", false, nullptr));
    EXPECT_EQ(UX_E_VALUE_INVALID,
              assistant_.ValidateOlsonOrLegacyTimeZone("NFT-11:30", false, nullptr));
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
