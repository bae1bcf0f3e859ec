#include <gtest/gtest.h>

#include <cstdint>
#include <ctime>
#include <iterator>
#include <string>

#include "support/AbsTime.h"
#include "support/Exceptions.h"

namespace kest::test::support {

using vq::dsc::AbsTime;
using vq::dsc::AbsTimeFormat;
using vq::dsc::AbsTimeToString;
using vq::dsc::DecimalPoint;
using vq::dsc::exception::OutOfRange;

namespace {

TEST(AbsTimeToString, FromUnixTimeFractionRoundingAndLayoutInUtc) {
    const AbsTime half = AbsTime::FromUnixTime(0, 500000000);
    EXPECT_EQ(2082844800, half.seconds);
    EXPECT_EQ(uint64_t{1} << 63, half.fraction);
    const char *date = "%Y%m%d", *time = "%H%M%S";
    const DecimalPoint period = DecimalPoint::Period;
    const int64_t noon = int64_t{12} * 3600;
    const struct {
        int64_t unixSeconds;
        uint32_t nanoseconds;
        AbsTimeFormat format;
        const wchar_t* expected;
    } rows[] = {
        {noon, 999600000, {"", time, 3, true, false, nullptr, period}, L"120001.000"},
        {noon, 999400000, {"", time, 3, true, false, nullptr, period}, L"120000.999"},
        {86399, 999950000, {date, time, 3, true, false, nullptr, period}, L"19700102 000000.000"},
        {noon, 999600000, {date, time, 0, true, false, nullptr, period}, L"19700101 120000"},
        {noon,
         500000000,
         {"", time, 19, true, false, nullptr, period},
         L"120000.5000000000000000000"},
        {noon, 0, {date, time, 0, true, true, nullptr, period}, L"120000 19700101"},
        {noon, 500000000, {date, time, 3, true, false, "UTC", period}, L"19700101 120000.500 UTC"},
        {noon, 500000000, {"", time, 2, true, false, nullptr, DecimalPoint::Comma}, L"120000,50"},
        {noon, 500000000, {"", time, 2, true, false, nullptr, DecimalPoint::Locale}, L"120000.50"},
        {noon, 0, {date, "", 0, true, true, nullptr, period}, L"19700101"},
        {noon, 0, {nullptr, nullptr, 0, true, false, nullptr, period}, L"01/01/70 12:00:00"},
        {-86400, 0, {date, "", 0, true, false, nullptr, period}, L"19691231"}};
    for (const auto& row : rows) {
        const AbsTime moment = AbsTime::FromUnixTime(row.unixSeconds, row.nanoseconds);
        EXPECT_EQ(std::wstring(row.expected), AbsTimeToString(moment, row.format));
    }
    // Where time_t has 32 bits (ARMv7 Linux), a time past January 2038 must not wrap to 1901.
    const AbsTime year2100 = AbsTime::FromUnixTime(4102444800, 0);
    if (sizeof(std::time_t) >= sizeof(int64_t)) {
        EXPECT_EQ(L"21000101", AbsTimeToString(year2100, rows[std::size(rows) - 1].format));
    } else {
        EXPECT_THROW(AbsTimeToString(year2100, rows[std::size(rows) - 1].format), OutOfRange);
    }
    EXPECT_THROW(AbsTime::FromUnixTime(0, 1000000000), OutOfRange);
    EXPECT_GT(AbsTime::Now().seconds, 1577836800 + AbsTime::kUnixEpochSeconds);  // after 2020
    AbsTimeFormat tooPrecise;
    tooPrecise.fractionDigits = 20;
    EXPECT_THROW(AbsTimeToString(AbsTime::Now(), tooPrecise), OutOfRange);
    EXPECT_THROW(AbsTimeToString(AbsTime::Invalid()), OutOfRange);
}

TEST(ScaleFraction, SplitsExactlyIntoWholeUnitsAndTheRest) {
    const struct {
        uint64_t fraction;
        uint32_t perSecond;
        uint64_t whole;
        uint64_t remainder;
    } rows[] = {{uint64_t{1} << 63, 1000, 500, 0},
                {uint64_t{1} << 62, 1000000, 250000, 0},
                {~uint64_t{0}, 1000, 999, ~uint64_t{0} - 999},
                {~uint64_t{0}, 0xFFFFFFFFu, 0xFFFFFFFEu, ~uint64_t{0} - 0xFFFFFFFEu},
                {(uint64_t{1} << 63) + 18446744073709ull, 1000000, 500000, 18446744073709000000ull},
                {0, 1000000, 0, 0}};
    for (const auto& row : rows) {
        const vq::dsc::ScaledFraction scaled = vq::dsc::ScaleFraction(row.fraction, row.perSecond);
        EXPECT_EQ(row.whole, scaled.whole) << row.fraction << " / " << row.perSecond;
        EXPECT_EQ(row.remainder, scaled.remainder) << row.fraction << " / " << row.perSecond;
    }
}

TEST(LocalDateTimeToAbsTime, NormalisesAndRoundTripsThroughLocalFormatting) {
    AbsTimeFormat local;
    local.dateFormat = "%Y-%m-%d";
    local.timeFormat = "%H:%M:%S";
    const struct {
        vq::dsc::LocalDateTime fields;
        const wchar_t* expected;
    } rows[] = {{{2024, 1, 15, 12, 34, 56}, L"2024-01-15 12:34:56"},
                {{2023, 13, 15, 12, 0, 0}, L"2024-01-15 12:00:00"},
                {{2024, 2, 30, 11, 59, 60}, L"2024-03-01 12:00:00"}};
    for (const auto& row : rows) {
        const AbsTime moment = vq::dsc::LocalDateTimeToAbsTime(row.fields);
        EXPECT_EQ(0u, moment.fraction);
        EXPECT_EQ(std::wstring(row.expected), AbsTimeToString(moment, local));
    }
    EXPECT_THROW(vq::dsc::LocalDateTimeToAbsTime({1960, 6, 1, 12, 0, 0}), OutOfRange);
}

}  // namespace

}  // namespace kest::test::support
