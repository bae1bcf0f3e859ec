#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "support/Exceptions.h"
#include "support/IntegerText.h"

namespace kest::test::support {

using vq::dsc::IntegerToString;
using vq::dsc::StringToInteger;
using vq::dsc::exception::UnableToConvert;

namespace {

TEST(IntegerToString, DigitsInEachBase) {
    EXPECT_EQ(L"-2147467259", IntegerToString(int32_t{-2147467259}));
    EXPECT_EQ(L"-2147483648", IntegerToString(INT32_MIN));
    EXPECT_EQ(L"80004005", IntegerToString(int32_t{-2147467259}, 16));
    EXPECT_EQ(L"FF", IntegerToString(255u, 16));
    EXPECT_EQ(L"0", IntegerToString(0u));
    EXPECT_EQ(std::wstring(32, L'1'), IntegerToString(int32_t{-1}, 2));
    EXPECT_EQ(L"1Z141Z3", IntegerToString(UINT32_MAX, 36));
    for (uint32_t base : {0u, 1u, 37u}) {
        EXPECT_THROW(IntegerToString(5u, base), UnableToConvert) << base;
    }
}

// One parse: text, base, strict flag, and the value or kFails.
struct ParseRow {
    const char* text;
    uint32_t base;
    bool strict;
    int64_t value;
};
constexpr int64_t kFails = INT64_MIN;

// Parses each row as narrow and as wide text into T.
template <class T, size_t N>
void ExpectRows(const ParseRow (&rows)[N]) {
    for (const ParseRow& row : rows) {
        const std::string narrow(row.text);
        const std::wstring wide(narrow.begin(), narrow.end());
        const std::string what = narrow + " base " + std::to_string(row.base);
        if (row.value == kFails) {
            EXPECT_THROW(StringToInteger<T>(narrow, row.base, row.strict), UnableToConvert) << what;
            EXPECT_THROW(StringToInteger<T>(wide, row.base, row.strict), UnableToConvert) << what;
        } else {
            EXPECT_EQ(T(row.value), StringToInteger<T>(narrow, row.base, row.strict)) << what;
            EXPECT_EQ(T(row.value), StringToInteger<T>(wide, row.base, row.strict)) << what;
        }
    }
}

TEST(StringToInteger, BoundsOfEachWidth) {
    const ParseRow int8[] = {{"127", 10, 1, 127},
                             {"128", 10, 1, kFails},
                             {"-128", 10, 1, -128},
                             {"-129", 10, 1, kFails}};
    const ParseRow uint8[] = {
        {"255", 10, 1, 255}, {"256", 10, 1, kFails}, {"-1", 10, 1, 255}, {"-256", 10, 1, kFails}};
    const ParseRow int16[] = {{"-32768", 10, 1, -32768}, {"32768", 10, 1, kFails}};
    const ParseRow uint16[] = {{"65535", 10, 1, 65535}, {"65536", 10, 1, kFails}};
    const ParseRow int32[] = {{"-2147483648", 10, 1, INT32_MIN},
                              {"2147483648", 10, 1, kFails},
                              {"-2147483649", 10, 1, kFails},
                              {"99999999999999999999", 10, 0, kFails}};
    const ParseRow uint32[] = {{"4294967295", 10, 1, UINT32_MAX},
                               {"4294967296", 10, 1, kFails},
                               {"1Z141Z3", 36, 1, UINT32_MAX}};
    ExpectRows<int8_t>(int8);
    ExpectRows<uint8_t>(uint8);
    ExpectRows<int16_t>(int16);
    ExpectRows<uint16_t>(uint16);
    ExpectRows<int32_t>(int32);
    ExpectRows<uint32_t>(uint32);
}

TEST(StringToInteger, StrictnessSignsAndPrefixes) {
    const ParseRow rows[] = {{"12a", 10, 1, kFails},  {"12a", 10, 0, 12},     {"  42", 10, 0, 42},
                             {"  42", 10, 1, kFails}, {"\t-42", 10, 0, -42},  {"+42", 10, 1, 42},
                             {"0x1F", 16, 1, 31},     {"-0X1f", 16, 1, -31},  {"0x", 16, 1, kFails},
                             {"0x", 16, 0, 0},        {"0x1F", 10, 0, 0},     {"", 10, 0, kFails},
                             {"-", 10, 0, kFails},    {"+-1", 10, 0, kFails}, {"9", 8, 0, kFails},
                             {"78", 8, 0, 7},         {"12 ", 10, 1, kFails}, {"5", 37, 0, kFails},
                             {"12\xE9", 10, 0, 12}};
    ExpectRows<int32_t>(rows);
}

}  // namespace

}  // namespace kest::test::support
