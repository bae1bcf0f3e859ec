#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "support/AbsTime.h"
#include "support/Exceptions.h"

using vq::dsc::AbsTime;
using vq::dsc::AbsTimeFormat;
using vq::dsc::AbsTimeToString;
using vq::dsc::DecimalPoint;
using vq::dsc::LocalDateTime;
using vq::dsc::LocalDateTimeToAbsTime;
using vq::dsc::exception::OutOfRange;

namespace {

constexpr int64_t kNoonOfTheEpoch = 12 * 3600;

TEST(AbsTime, UnixTimeConversion) {
    const AbsTime half = AbsTime::FromUnixTime(0, 500000000);
    EXPECT_EQ(2082844800, half.seconds);
    EXPECT_EQ(uint64_t{1} << 63, half.fraction);
    EXPECT_EQ(0u, AbsTime::FromUnixTime(-1, 0).fraction);
    EXPECT_EQ(2082844799, AbsTime::FromUnixTime(-1, 0).seconds);
    EXPECT_GT(AbsTime::FromUnixTime(0, 999999999).fraction, UINT64_MAX - (uint64_t{1} << 35));
    EXPECT_THROW(AbsTime::FromUnixTime(0, 1000000000), OutOfRange);
    EXPECT_THROW(AbsTime::FromUnixTime(INT64_MAX, 0), OutOfRange);
    // 2020-01-01 00:00:00 UTC as a lower bound of the clock.
    EXPECT_GT(AbsTime::Now().seconds, 1577836800 + AbsTime::kUnixEpochSeconds);
}

struct FormatRow {
    const char* name;
    int64_t unixSeconds;
    uint32_t nanoseconds;
    AbsTimeFormat format;
    const wchar_t* expected;
};

TEST(AbsTimeToString, FractionRoundingAndLayoutInUtc) {
    const char* date = "%Y%m%d";
    const char* time = "%H%M%S";
    const FormatRow rows[] = {
        {"rounding carries into seconds",
         kNoonOfTheEpoch,
         999600000,
         {"", time, 3, true, false, nullptr, DecimalPoint::Period},
         L"120001.000"},
        {"rounding below the carry",
         kNoonOfTheEpoch,
         999400000,
         {"", time, 3, true, false, nullptr, DecimalPoint::Period},
         L"120000.999"},
        {"carry across midnight",
         86399,
         999950000,
         {date, time, 3, true, false, nullptr, DecimalPoint::Period},
         L"19700102 000000.000"},
        {"no digits truncates",
         kNoonOfTheEpoch,
         999600000,
         {date, time, 0, true, false, nullptr, DecimalPoint::Period},
         L"19700101 120000"},
        {"one digit",
         kNoonOfTheEpoch,
         949999999,
         {"", time, 1, true, false, nullptr, DecimalPoint::Period},
         L"120000.9"},
        {"nine digits",
         kNoonOfTheEpoch,
         123456789,
         {"", time, 9, true, false, nullptr, DecimalPoint::Period},
         L"120000.123456789"},
        {"nineteen digits",
         kNoonOfTheEpoch,
         500000000,
         {"", time, 19, true, false, nullptr, DecimalPoint::Period},
         L"120000.5000000000000000000"},
        {"time first",
         kNoonOfTheEpoch,
         0,
         {date, time, 0, true, true, nullptr, DecimalPoint::Period},
         L"120000 19700101"},
        {"suffix after fraction",
         kNoonOfTheEpoch,
         500000000,
         {date, time, 3, true, false, "UTC", DecimalPoint::Period},
         L"19700101 120000.500 UTC"},
        {"comma",
         kNoonOfTheEpoch,
         500000000,
         {"", time, 2, true, false, nullptr, DecimalPoint::Comma},
         L"120000,50"},
        {"C locale's point",
         kNoonOfTheEpoch,
         500000000,
         {"", time, 2, true, false, nullptr, DecimalPoint::Locale},
         L"120000.50"},
        {"date only",
         kNoonOfTheEpoch,
         0,
         {date, "", 0, true, true, nullptr, DecimalPoint::Period},
         L"19700101"},
        {"nothing",
         kNoonOfTheEpoch,
         0,
         {"", "", 0, true, false, nullptr, DecimalPoint::Period},
         L""},
        {"locale defaults",
         kNoonOfTheEpoch,
         0,
         {nullptr, nullptr, 0, true, false, nullptr, DecimalPoint::Period},
         L"01/01/70 12:00:00"},
        {"before 1970",
         -86400,
         0,
         {date, "", 0, true, false, nullptr, DecimalPoint::Period},
         L"19691231"},
    };
    for (const FormatRow& row : rows) {
        EXPECT_EQ(
            std::wstring(row.expected),
            AbsTimeToString(AbsTime::FromUnixTime(row.unixSeconds, row.nanoseconds), row.format))
            << row.name;
    }
}

TEST(AbsTimeToString, RejectsWhatItCannotWrite) {
    AbsTimeFormat tooPrecise;
    tooPrecise.fractionDigits = 20;
    tooPrecise.utc = true;
    EXPECT_THROW(AbsTimeToString(AbsTime::Now(), tooPrecise), OutOfRange);
    AbsTimeFormat utc;
    utc.utc = true;
    EXPECT_THROW(AbsTimeToString(AbsTime::Invalid(), utc), OutOfRange);
}

TEST(LocalDateTimeToAbsTime, RoundTripsThroughLocalFormatting) {
    AbsTimeFormat local;
    local.dateFormat = "%Y-%m-%d";
    local.timeFormat = "%H:%M:%S";
    const struct {
        LocalDateTime fields;
        const wchar_t* expected;
    } rows[] = {
        {{2024, 1, 15, 12, 34, 56}, L"2024-01-15 12:34:56"},
        {{2023, 13, 15, 12, 0, 0}, L"2024-01-15 12:00:00"},
        {{2024, 2, 30, 11, 59, 60}, L"2024-03-01 12:00:00"},
    };
    for (const auto& row : rows) {
        const AbsTime time = LocalDateTimeToAbsTime(row.fields);
        EXPECT_EQ(0u, time.fraction);
        EXPECT_EQ(std::wstring(row.expected), AbsTimeToString(time, local));
    }
    EXPECT_THROW(LocalDateTimeToAbsTime({1960, 6, 1, 12, 0, 0}), OutOfRange);
}

}  // namespace
