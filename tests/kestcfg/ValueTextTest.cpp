// Parsing command-line values by property type, and showing them to people and scripts.
#include <gtest/gtest.h>

#include <ctime>
#include <optional>
#include <ostream>
#include <string>

#include "PropertyCatalogue.h"
#include "ValueText.h"
#include "hostkit/HostText.h"
#include "hostkit/TimestampText.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

struct ParseCase {
    std::string text;
    uint32_t type;
    std::optional<std::string> shown;  // ValueForPeople of the result; nothing: rejected
};

void PrintTo(const ParseCase& c, std::ostream* out) {
    *out << TypeCodeName(c.type) << " from \"" << c.text << "\"";
}

class ParseValueTest : public testing::TestWithParam<ParseCase> {};

TEST_P(ParseValueTest, ParsesByTypeOrRejects) {
    const ParseCase& c = GetParam();
    const std::optional<PropertyValue> value = ParseValue(c.text, c.type);
    ASSERT_EQ(c.shown.has_value(), value.has_value());
    if (value) {
        EXPECT_EQ(c.type, TypeCodeOf(*value));
        EXPECT_EQ(*c.shown, ValueForPeople(*value, NumberStyle::kDecimal));
    }
}

INSTANTIATE_TEST_SUITE_P(
    Values, ParseValueTest,
    testing::Values(
        ParseCase{"On", UX_PROPERTY_TYPE_BOOL, "true"},
        ParseCase{"0", UX_PROPERTY_TYPE_BOOL, "false"},
        ParseCase{"maybe", UX_PROPERTY_TYPE_BOOL, std::nullopt},
        ParseCase{"-2147483648", UX_PROPERTY_TYPE_LONG, "-2147483648"},
        ParseCase{"2147483648", UX_PROPERTY_TYPE_LONG, std::nullopt},
        ParseCase{"0x1F", UX_PROPERTY_TYPE_ULONG, "31"},
        ParseCase{"4294967295", UX_PROPERTY_TYPE_ULONG, "4294967295"},
        ParseCase{"4294967296", UX_PROPERTY_TYPE_ULONG, std::nullopt},
        ParseCase{"-1", UX_PROPERTY_TYPE_ULONG, std::nullopt},
        ParseCase{" 5", UX_PROPERTY_TYPE_ULONG, std::nullopt},
        ParseCase{"5ms", UX_PROPERTY_TYPE_ULONG, std::nullopt},
        ParseCase{"0x", UX_PROPERTY_TYPE_ULONG, std::nullopt},
        ParseCase{"2.5", UX_PROPERTY_TYPE_DOUBLE, "2.5"},
        ParseCase{"inf", UX_PROPERTY_TYPE_DOUBLE, std::nullopt},
        ParseCase{"{999D9AA4-5475-4CA7-A560-93C51B5BFCEB}", UX_PROPERTY_TYPE_GUID,
                  "999d9aa4-5475-4ca7-a560-93c51b5bfceb"},
        ParseCase{"999d9aa4-5475-4ca7-a560-93c51b5bfce", UX_PROPERTY_TYPE_GUID, std::nullopt},
        ParseCase{"Bay 4 \xC3\xA9", UX_PROPERTY_TYPE_STRING, "Bay 4 \xC3\xA9"},
        ParseCase{"", UX_PROPERTY_TYPE_STRING, ""},
        ParseCase{"\xC3(", UX_PROPERTY_TYPE_STRING, std::nullopt},
        ParseCase{"\xED\xA0\x80", UX_PROPERTY_TYPE_STRING, std::nullopt},
        ParseCase{"2024-02-29T23:59:59Z", UX_PROPERTY_TYPE_TIMESTAMP, "2024-02-29T23:59:59Z"},
        ParseCase{"1969-12-31 23:59:59.25Z", UX_PROPERTY_TYPE_TIMESTAMP,
                  "1969-12-31T23:59:59.250Z"},
        ParseCase{"2023-02-29T00:00:00Z", UX_PROPERTY_TYPE_TIMESTAMP, std::nullopt},
        ParseCase{"2024-01-01T00:00:00", UX_PROPERTY_TYPE_TIMESTAMP, std::nullopt},
        ParseCase{"2024-01-01T12::00Z", UX_PROPERTY_TYPE_TIMESTAMP, std::nullopt},
        ParseCase{"2024-01-01T00:00:00.Z", UX_PROPERTY_TYPE_TIMESTAMP, std::nullopt}));

TEST(TimestampTextTest, CountsFrom1904AndShowsNoTimeAndRoundedMilliseconds) {
    EXPECT_EQ("1970-01-01T00:00:00Z", TimestampToIso8601({0, kSecondsFrom1904To1970}));
    EXPECT_EQ("1904-01-01T00:00:00.500Z", TimestampToIso8601({uint64_t{1} << 63, 0}));
    EXPECT_EQ("1970-01-01T00:00:01.000Z",
              TimestampToIso8601({~uint64_t{0}, kSecondsFrom1904To1970}));
    const std::optional<uxSysAttrTimestampUTC> parsed =
        TimestampFromIso8601("2030-01-02T03:04:05.123Z");
    ASSERT_TRUE(parsed.has_value());
    EXPECT_EQ(1893553445 + kSecondsFrom1904To1970, parsed->seconds);
    EXPECT_EQ("2030-01-02T03:04:05.123Z", TimestampToIso8601(*parsed));
    EXPECT_EQ("(no time)",
              ValueForPeople(PropertyValue(uxSysAttrTimestampUTC{0, 0}), NumberStyle::kDecimal));
    EXPECT_EQ("null", ValueAsJson(PropertyValue(uxSysAttrTimestampUTC{0, 0})).dump());
}

// 2100-01-01 round-trips where time_t has 64 bits; where it has 32 bits (ARMv7 Linux) it is
// refused both ways rather than wrapped to 1901 or read as 1969.
TEST(TimestampTextTest, TimesBeyondTimeTAreRefusedNotWrapped) {
    const int64_t year2100 = 4102444800 + kSecondsFrom1904To1970;
    const std::optional<uxSysAttrTimestampUTC> parsed =
        TimestampFromIso8601("2100-01-01T00:00:00Z");
    if (sizeof(time_t) >= sizeof(int64_t)) {
        ASSERT_TRUE(parsed.has_value());
        EXPECT_EQ(year2100, parsed->seconds);
        EXPECT_EQ("2100-01-01T00:00:00Z", TimestampToIso8601({0, year2100}));
    } else {
        EXPECT_FALSE(parsed.has_value());
        EXPECT_EQ("", TimestampToIso8601({0, year2100}));
    }
}

TEST(ValueTextTest, MasksShowInHexadecimalAndJsonKeepsTypes) {
    EXPECT_EQ("0x0B", ValueForPeople(PropertyValue(uint32_t{11}), NumberStyle::kHexadecimal));
    EXPECT_EQ("0x150000",
              ValueForPeople(PropertyValue(uint32_t{0x150000}), NumberStyle::kHexadecimal));
    EXPECT_EQ("11", ValueAsJson(PropertyValue(uint32_t{11})).dump());
    EXPECT_EQ("-5", ValueAsJson(PropertyValue(int32_t{-5})).dump());
    EXPECT_EQ("true", ValueAsJson(PropertyValue(true)).dump());
    EXPECT_EQ("\"a\\\"b\\n\"", ValueAsJson(PropertyValue(std::wstring(L"a\"b\n"))).dump());
}

TEST(HostTextTest, PrintableTextEscapesControlCharactersOnly) {
    const std::pair<std::string, std::string> cases[] = {
        {"plain caf\xc3\xa9 \\ text", "plain caf\xc3\xa9 \\ text"},
        {"a\nb\tc\rd", "a\\nb\\tc\\rd"},
        {std::string("\x1b[2J\x00\x7f", 6), "\\x1B[2J\\x00\\x7F"},
        {"\xc2\x9b"
         "1m \xc2\xa0",
         "\\u009B1m \xc2\xa0"},
        {"\xc2", "\xc2"},
    };
    for (const auto& [text, shown] : cases) {
        EXPECT_EQ(shown, PrintableText(text)) << text;
    }
}

TEST(HostTextTest, Utf8AndWideTextConvertExactlyAndMalformedUtf8IsRefused) {
    const std::pair<std::string, std::wstring> same[] = {
        {"a\x7f", L"a\x7f"},
        {"\xc2\x80\xdf\xbf", L"\x80\x7ff"},
        {"\xe0\xa0\x80\xe2\x82\xac\xed\x9f\xbf\xee\x80\x80", L"\x800\x20ac\xd7ff\xe000"},
        {"\xf0\x90\x80\x80\xf0\x9f\x98\x80\xf4\x8f\xbf\xbf", L"\x10000\x1f600\x10ffff"},
    };
    for (const auto& [utf8, wide] : same) {
        EXPECT_EQ(utf8, Utf8FromWide(wide.data(), wide.size()));
        EXPECT_EQ(wide, WideFromUtf8(utf8)) << PrintableText(utf8);
    }
    const char* const refused[] = {
        "\xc0\xaf",     "\xc1\xbf",     "\xe0\x9f\xbf",         "\xf0\x8f\xbf\xbf",
        "\xed\xa0\x80", "\xed\xbf\xbf", "\xf4\x90\x80\x80",     "\xe2\x82",
        "\xe2\x28\xac", "\x80",         "\xf8\x88\x80\x80\x80",
    };
    for (const char* utf8 : refused) {
        EXPECT_EQ(std::nullopt, WideFromUtf8(utf8)) << PrintableText(utf8);
    }
    EXPECT_EQ(std::nullopt, WideFromUtf8(std::string("a\0b", 3)));
}

TEST(PropertyCatalogueTest, NamesAndNumbersBothFindTags) {
    EXPECT_EQ(0x0101F000u, TagFromWord("host-name"));
    EXPECT_EQ(0x0D107000u, TagFromWord("IP-Address"));
    EXPECT_EQ(0x0D11B000u, TagFromWord("polling-interval"));
    EXPECT_EQ(0x0ABCD000u, TagFromWord("0x0abcd000"));
    EXPECT_EQ(4096u, TagFromWord("4096"));
    for (const char* word : {"", "0x", "-1", "0x1FFFFFFFF", "4294967296", "no-such-name", "12a"}) {
        EXPECT_FALSE(TagFromWord(word).has_value()) << word;
    }
    EXPECT_EQ("0x0ABCD000", TagDisplayName(0x0ABCD000));
    EXPECT_EQ("web-service", TagDisplayName(0x21004000));
}

}  // namespace

}  // namespace kest::cfg
