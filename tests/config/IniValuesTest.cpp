#include <limits>
#include <string>

#include "IniTestSupport.h"

namespace kest::test::config {

namespace {

// A document holding the key "k" of section "s" with the given stored value.
IniTextPtr WithValue(const std::string& value) {
    IniTextPtr ini(IniText_Create());
    IniText_SetRaw(ini.get(), "s", "k", value.c_str(), 0);
    return ini;
}

TEST(IniValueTest, BooleansDoublesAndBlankValues) {
    bool flag = false;
    EXPECT_EQ(IniText_GetBoolean(WithValue("TRUE").get(), "s", "k", &flag), kIniFound);
    EXPECT_TRUE(flag);
    EXPECT_EQ(IniText_GetBoolean(WithValue("false").get(), "s", "k", &flag), kIniFound);
    EXPECT_FALSE(flag);
    EXPECT_EQ(IniText_GetBoolean(WithValue("1").get(), "s", "k", &flag), kIniNotBoolean);
    double number = 0;
    EXPECT_EQ(IniText_GetDouble(WithValue("+INF").get(), "s", "k", &number), kIniFound);
    EXPECT_EQ(number, std::numeric_limits<double>::infinity());
    EXPECT_EQ(IniText_GetDouble(WithValue("-inf").get(), "s", "k", &number), kIniFound);
    EXPECT_EQ(number, -std::numeric_limits<double>::infinity());
    EXPECT_EQ(IniText_GetDouble(WithValue("1.5x").get(), "s", "k", &number), kIniNotDouble);
    EXPECT_EQ(IniText_GetDouble(WithValue("1e999").get(), "s", "k", &number), kIniNotDouble);
    IniTextPtr ini = WithValue("");
    uint32_t unused = 0;
    EXPECT_EQ(IniText_GetUInt32(ini.get(), "s", "k", &unused), kIniNotFound);
    EXPECT_EQ(IniText_GetBoolean(ini.get(), "s", "k", &flag), kIniNotFound);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "");
    ASSERT_EQ(IniText_SetDouble(ini.get(), "s", "d", 0.1), kIniFound);
    EXPECT_EQ(ValueOf(ini.get(), "s", "d"), "1.00000000000000e-01");
}

TEST(IniValueTest, EscapesDecodeAsWrittenAndEncodedStringsRoundTrip) {
    const std::pair<std::string, std::string> cases[] = {{"a\\tb\\\\c\\\"d\\n", "a\tb\\c\"d\n"},
                                                         {"\\x41\\x4a\\x4A", "AJJ"},
                                                         {"\\q", "q"},
                                                         {"\\xZZ!", "\xEF!"},
                                                         {"end\\x4", "end\x3F"},
                                                         {"end\\", "end"}};
    for (const auto& [stored, decoded] : cases) {
        IniTextPtr ini = WithValue(stored);
        const char* value = nullptr;
        ASSERT_EQ(IniText_GetEscapedString(ini.get(), "s", "k", &value), kIniFound);
        EXPECT_EQ(std::string(value), decoded) << stored;
    }
    const std::string original = "tab\tline\nquote\"back\\slash\x01\x7F end";
    IniTextPtr ini(IniText_Create());
    ASSERT_EQ(IniText_SetString(ini.get(), "s", "k", original.c_str(), true), kIniFound);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "tab\\tline\\nquote\\\"back\\\\slash\\x01\\x7f end");
    const char* decoded = nullptr;
    ASSERT_EQ(IniText_GetEscapedString(ini.get(), "s", "k", &decoded), kIniFound);
    EXPECT_EQ(std::string(decoded), original);
    char buffer[4];
    EXPECT_EQ(IniText_GetStringIntoBuffer(ini.get(), "s", "k", buffer, sizeof buffer), kIniFound);
    EXPECT_STREQ(buffer, "tab");
}

}  // namespace

}  // namespace kest::test::config
