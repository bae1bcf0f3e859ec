#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "support/Exceptions.h"
#include "support/IntegerText.h"

namespace kest::test::support {

using vq::dsc::IntegerToString;
using vq::dsc::exception::UnableToConvert;

namespace {

// Parsing is checked against an independent reference by the integer-text fuzz target, whose
// seed corpus holds the bounds of each width, strictness, signs and prefixes.
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

}  // namespace

}  // namespace kest::test::support
