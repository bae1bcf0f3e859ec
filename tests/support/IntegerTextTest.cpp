#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "support/Exceptions.h"
#include "support/IntegerText.h"

using vq::dsc::IntegerToString;
using vq::dsc::StringToInteger;
using vq::dsc::exception::UnableToConvert;

namespace {

TEST(IntegerToString, DigitsInEachBase) {
    EXPECT_EQ(L"-2147467259", IntegerToString(int32_t{-2147467259}));
    EXPECT_EQ(L"-2147483648", IntegerToString(INT32_MIN));
    EXPECT_EQ(L"2147483647", IntegerToString(INT32_MAX));
    EXPECT_EQ(L"80004005", IntegerToString(int32_t{-2147467259}, 16));
    EXPECT_EQ(L"FF", IntegerToString(255u, 16));
    EXPECT_EQ(L"0", IntegerToString(0u));
    EXPECT_EQ(L"0", IntegerToString(int32_t{0}, 2));
    EXPECT_EQ(L"4294967295", IntegerToString(UINT32_MAX));
    EXPECT_EQ(std::wstring(32, L'1'), IntegerToString(UINT32_MAX, 2));
    EXPECT_EQ(L"1Z141Z3", IntegerToString(UINT32_MAX, 36));
    EXPECT_EQ(L"11111111111111111111111111111111", IntegerToString(int32_t{-1}, 2));
    for (uint32_t base : {0u, 1u, 37u}) {
        EXPECT_THROW(IntegerToString(5u, base), UnableToConvert) << base;
    }
}

struct ParseRow {
    const char* text;
    uint32_t base;
    bool strict;
    bool fails;
    int64_t value;
};

template <class T, size_t N>
void ExpectRows(const ParseRow (&rows)[N]) {
    for (const ParseRow& row : rows) {
        const std::string narrow(row.text);
        const std::wstring wide(narrow.begin(), narrow.end());
        const std::string what = std::string("\"") + row.text + "\" base " +
                                 std::to_string(row.base) + (row.strict ? " strict" : "");
        if (row.fails) {
            EXPECT_THROW(StringToInteger<T>(narrow, row.base, row.strict), UnableToConvert) << what;
            EXPECT_THROW(StringToInteger<T>(wide, row.base, row.strict), UnableToConvert) << what;
        } else {
            EXPECT_EQ(static_cast<T>(row.value), StringToInteger<T>(narrow, row.base, row.strict))
                << what;
            EXPECT_EQ(static_cast<T>(row.value), StringToInteger<T>(wide, row.base, row.strict))
                << what;
        }
    }
}

TEST(StringToInteger, BoundsOfEachWidth) {
    const ParseRow int8Rows[] = {
        {"127", 10, true, false, 127},   {"128", 10, true, true, 0},
        {"-128", 10, true, false, -128}, {"-129", 10, true, true, 0},
        {"7f", 16, true, false, 127},    {"-80", 16, true, false, -128},
    };
    const ParseRow uint8Rows[] = {
        {"255", 10, true, false, 255}, {"256", 10, true, true, 0},
        {"-1", 10, true, false, 255},  {"-255", 10, true, false, 1},
        {"-256", 10, true, true, 0},   {"0xFF", 16, true, false, 255},
        {"100", 16, true, true, 0},    {"11111111", 2, true, false, 255},
    };
    const ParseRow int16Rows[] = {
        {"32767", 10, true, false, 32767},
        {"32768", 10, true, true, 0},
        {"-32768", 10, true, false, -32768},
        {"-32769", 10, true, true, 0},
    };
    const ParseRow uint16Rows[] = {
        {"65535", 10, true, false, 65535},
        {"65536", 10, true, true, 0},
        {"-1", 10, true, false, 65535},
    };
    const ParseRow int32Rows[] = {
        {"2147483647", 10, true, false, INT32_MAX},   {"2147483648", 10, true, true, 0},
        {"-2147483648", 10, true, false, INT32_MIN},  {"-2147483649", 10, true, true, 0},
        {"99999999999999999999", 10, false, true, 0},
    };
    const ParseRow uint32Rows[] = {
        {"4294967295", 10, true, false, UINT32_MAX}, {"4294967296", 10, true, true, 0},
        {"FFFFFFFF", 16, true, false, UINT32_MAX},   {"1Z141Z3", 36, true, false, UINT32_MAX},
        {"-1", 10, true, false, UINT32_MAX},
    };
    ExpectRows<int8_t>(int8Rows);
    ExpectRows<uint8_t>(uint8Rows);
    ExpectRows<int16_t>(int16Rows);
    ExpectRows<uint16_t>(uint16Rows);
    ExpectRows<int32_t>(int32Rows);
    ExpectRows<uint32_t>(uint32Rows);
}

TEST(StringToInteger, StrictnessSignsAndPrefixes) {
    const ParseRow rows[] = {
        {"12a", 10, true, true, 0},       {"12a", 10, false, false, 12},
        {"  42", 10, false, false, 42},   {"  42", 10, true, true, 0},
        {"\t-42", 10, false, false, -42}, {"+42", 10, true, false, 42},
        {"0x1F", 16, true, false, 31},    {"0X1f", 16, true, false, 31},
        {"-0x10", 16, true, false, -16},  {"0x", 16, true, true, 0},
        {"0x", 16, false, false, 0},      {"1F", 16, true, false, 31},
        {"0x1F", 10, false, false, 0},    {"", 10, false, true, 0},
        {"-", 10, false, true, 0},        {"+-1", 10, false, true, 0},
        {"z", 10, false, true, 0},        {"9", 8, false, true, 0},
        {"78", 8, false, false, 7},       {"zz", 36, true, false, 1295},
        {"5", 1, false, true, 0},         {"5", 37, false, true, 0},
        {"-0", 10, true, false, 0},       {"12 ", 10, true, true, 0},
    };
    ExpectRows<int32_t>(rows);
}

TEST(StringToInteger, NonAsciiCharactersEndTheNumber) {
    EXPECT_EQ(12, StringToInteger<int32_t>(std::string("12\xE9"), 10, false));
    EXPECT_THROW(StringToInteger<int32_t>(std::string("12\xE9"), 36, true), UnableToConvert);
    EXPECT_EQ(38, StringToInteger<int32_t>(std::wstring(L"12\u00E9"), 36, false));
    EXPECT_THROW(StringToInteger<int32_t>(std::wstring(L"\u0661"), 10, false), UnableToConvert);
}

}  // namespace
