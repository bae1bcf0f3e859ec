#include <cmath>
#include <limits>
#include <string>

#include "IniTestSupport.h"

using kest::test::TempSysroot;

namespace {

// A document holding one key "k" in section "s" with the given stored value.
IniTextPtr WithValue(const std::string& value) {
    IniTextPtr ini = NewIniText();
    IniText_SetRaw(ini.get(), "s", "k", value.c_str(), 0);
    return ini;
}

struct IntegerCase {
    std::string text;
    int unsignedResult;
    uint32_t unsignedValue;
    int signedResult;
    int32_t signedValue;
};

class IniIntegerTest : public ::testing::TestWithParam<IntegerCase> {};

TEST_P(IniIntegerTest, ParsesWithinThirtyTwoBits) {
    const IntegerCase& param = GetParam();
    IniTextPtr ini = WithValue(param.text);
    uint32_t unsignedValue = 0xDEADBEEF;
    int32_t signedValue = 0x5EED;
    EXPECT_EQ(IniText_GetUInt32(ini.get(), "s", "k", &unsignedValue), param.unsignedResult);
    EXPECT_EQ(IniText_GetInt32(ini.get(), "s", "k", &signedValue), param.signedResult);
    EXPECT_EQ(unsignedValue, param.unsignedResult == 1 ? param.unsignedValue : 0xDEADBEEF);
    EXPECT_EQ(signedValue, param.signedResult == 1 ? param.signedValue : 0x5EED);
}

INSTANTIATE_TEST_SUITE_P(
    Bounds, IniIntegerTest,
    ::testing::Values(IntegerCase{"42", 1, 42, 1, 42}, IntegerCase{"+7", 1, 7, 1, 7},
                      IntegerCase{"4294967295", 1, 4294967295u, kIniNotInt32, 0},
                      IntegerCase{"4294967296", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"99999999999999999999", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"2147483647", 1, 2147483647u, 1, 2147483647},
                      IntegerCase{"2147483648", 1, 2147483648u, kIniNotInt32, 0},
                      IntegerCase{"-2147483648", kIniNotUInt32, 0, 1, INT32_MIN},
                      IntegerCase{"-2147483649", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"-1", kIniNotUInt32, 0, 1, -1},
                      IntegerCase{"-0", kIniNotUInt32, 0, 1, 0},
                      IntegerCase{"+ 7", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"--7", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"12a", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"0x10", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"1 2", kIniNotUInt32, 0, kIniNotInt32, 0},
                      IntegerCase{"+", kIniNotUInt32, 0, kIniNotInt32, 0}));

TEST(IniValueTest, BlankValuesAreNotFoundForConvertingGetters) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=\nq=\"  \"\n",
                                   kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes);
    for (const char* key : {"k", "q", "missing"}) {
        uint32_t u = 0;
        int32_t i = 0;
        bool b = false;
        double d = 0;
        EXPECT_EQ(IniText_GetUInt32(ini.get(), "s", key, &u), kIniNotFound) << key;
        EXPECT_EQ(IniText_GetInt32(ini.get(), "s", key, &i), kIniNotFound) << key;
        EXPECT_EQ(IniText_GetBoolean(ini.get(), "s", key, &b), kIniNotFound) << key;
        EXPECT_EQ(IniText_GetDouble(ini.get(), "s", key, &d), kIniNotFound) << key;
    }
    EXPECT_EQ(ValueOf(ini.get(), "s", "q"), "  ");
    uint32_t u = 0;
    EXPECT_EQ(IniText_GetUInt32(WithValue(" 42 ").get(), "s", "k", &u), kIniFound);
    EXPECT_EQ(u, 42u);
}

TEST(IniValueTest, BooleansAreTrueOrFalseInAnyCase) {
    for (const auto& [text, expected] :
         {std::pair<const char*, bool>{"True", true}, {"TRUE", true}, {"false", false}}) {
        bool value = !expected;
        EXPECT_EQ(IniText_GetBoolean(WithValue(text).get(), "s", "k", &value), kIniFound);
        EXPECT_EQ(value, expected);
    }
    for (const char* text : {"yes", "1", "Truth"}) {
        bool value = false;
        EXPECT_EQ(IniText_GetBoolean(WithValue(text).get(), "s", "k", &value), kIniNotBoolean);
    }
}

TEST(IniValueTest, DoublesNeedTheWholeValueAndNoRangeError) {
    double value = 0;
    EXPECT_EQ(IniText_GetDouble(WithValue("inf").get(), "s", "k", &value), kIniFound);
    EXPECT_EQ(value, std::numeric_limits<double>::infinity());
    EXPECT_EQ(IniText_GetDouble(WithValue("+INF").get(), "s", "k", &value), kIniFound);
    EXPECT_EQ(value, std::numeric_limits<double>::infinity());
    EXPECT_EQ(IniText_GetDouble(WithValue("-Inf").get(), "s", "k", &value), kIniFound);
    EXPECT_EQ(value, -std::numeric_limits<double>::infinity());
    EXPECT_EQ(IniText_GetDouble(WithValue("-1.5e3").get(), "s", "k", &value), kIniFound);
    EXPECT_EQ(value, -1500.0);
    for (const char* text : {"1.5x", "1e999", "abc"}) {
        EXPECT_EQ(IniText_GetDouble(WithValue(text).get(), "s", "k", &value), kIniNotDouble)
            << text;
    }
}

TEST(IniValueTest, NumericSettersFormatAndReadBack) {
    IniTextPtr ini = NewIniText();
    ASSERT_EQ(IniText_SetUInt32(ini.get(), "n", "u", 4294967295u), kIniFound);
    ASSERT_EQ(IniText_SetInt32(ini.get(), "n", "i", INT32_MIN), kIniFound);
    ASSERT_EQ(IniText_SetDouble(ini.get(), "n", "d", 0.1), kIniFound);
    EXPECT_EQ(ValueOf(ini.get(), "n", "u"), "4294967295");
    EXPECT_EQ(ValueOf(ini.get(), "n", "i"), "-2147483648");
    EXPECT_EQ(ValueOf(ini.get(), "n", "d"), "1.00000000000000e-01");
    double value = 0;
    EXPECT_EQ(IniText_GetDouble(ini.get(), "n", "d", &value), kIniFound);
    EXPECT_DOUBLE_EQ(value, 0.1);
}

struct EscapeCase {
    std::string stored;
    std::string decoded;
};

class IniEscapeTest : public ::testing::TestWithParam<EscapeCase> {};

TEST_P(IniEscapeTest, DecodesBackslashEscapes) {
    IniTextPtr ini = NewIniText();
    ASSERT_EQ(IniText_SetRaw(ini.get(), "s", "k", GetParam().stored.c_str(), 0), kIniFound);
    const char* value = nullptr;
    ASSERT_EQ(IniText_GetEscapedString(ini.get(), "s", "k", &value), kIniFound);
    EXPECT_EQ(std::string(value), GetParam().decoded);
}

INSTANTIATE_TEST_SUITE_P(
    Sequences, IniEscapeTest,
    ::testing::Values(EscapeCase{"a\\tb\\\\c\\\"d", "a\tb\\c\"d"}, EscapeCase{"\\n", "\n"},
                      EscapeCase{"\\x41\\x4a\\x4A", "AJJ"}, EscapeCase{"\\q\\'", "q'"},
                      EscapeCase{"\\xZZ!", "\xEF!"}, EscapeCase{"\\x4Z", "\x3F"},
                      EscapeCase{"end\\", "end"}, EscapeCase{"end\\x4", "end\x3F"}));

TEST(IniValueTest, EscapedStringsRoundTripThroughEncoding) {
    const std::string original = "tab\tline\nquote\"back\\slash\x01\x7F end";
    IniTextPtr ini = NewIniText();
    ASSERT_EQ(IniText_SetString(ini.get(), "s", "k", original.c_str(), true), kIniFound);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "tab\\tline\\nquote\\\"back\\\\slash\\x01\\x7f end");
    const char* decoded = nullptr;
    ASSERT_EQ(IniText_GetEscapedString(ini.get(), "s", "k", &decoded), kIniFound);
    EXPECT_EQ(std::string(decoded), original);
}

TEST(IniValueTest, CopiesAreCutAndAlwaysTerminated) {
    IniTextPtr ini = WithValue("abcdef");
    char buffer[4] = {'x', 'x', 'x', 'x'};
    EXPECT_EQ(IniText_GetStringIntoBuffer(ini.get(), "s", "k", buffer, sizeof buffer), kIniFound);
    EXPECT_STREQ(buffer, "abc");
    EXPECT_EQ(IniText_GetStringIntoBuffer(ini.get(), "s", "none", buffer, sizeof buffer),
              kIniNotFound);
    char* copy = nullptr;
    ASSERT_EQ(IniText_GetStringCopy(ini.get(), "s", "k", &copy), kIniFound);
    EXPECT_STREQ(copy, "abcdef");
    free(copy);
}

}  // namespace
