#include "support/AbsTime.h"

#include <clocale>
#include <cstdio>
#include <string>

#include "support/Exceptions.h"
#include "support/TextConversion.h"
#include "vq/dsc/SafeInteger.h"

namespace vq {
namespace dsc {
namespace {

constexpr unsigned kMaxFractionDigits = 19;
constexpr size_t kMaxFormattedBytes = 512;

// floor((a * b + 2^63) / 2^64): the product of a and a fraction b / 2^64, rounded to nearest.
// Built from 32-bit halves, so it needs no 128-bit integer type.
uint64_t RoundedScaledProduct(uint64_t a, uint64_t b) {
    const uint64_t mask = 0xFFFFFFFFu;
    const uint64_t lowLow = (a & mask) * (b & mask);
    const uint64_t lowHigh = (a & mask) * (b >> 32);
    const uint64_t highLow = (a >> 32) * (b & mask);
    const uint64_t highHigh = (a >> 32) * (b >> 32);
    const uint64_t middle = (lowLow >> 32) + (lowHigh & mask) + (highLow & mask);
    const uint64_t low = (middle << 32) | (lowLow & mask);
    uint64_t high = highHigh + (lowHigh >> 32) + (highLow >> 32) + (middle >> 32);
    const uint64_t half = uint64_t{1} << 63;
    if (low + half < low) {
        ++high;
    }
    return high;
}

uint64_t PowerOfTen(unsigned exponent) {
    uint64_t power = 1;
    while (exponent-- != 0) {
        power *= 10;
    }
    return power;
}

std::string DecimalPointText(DecimalPoint choice) {
    switch (choice) {
        case DecimalPoint::Period:
            return ".";
        case DecimalPoint::Comma:
            return ",";
        case DecimalPoint::Locale:
            break;
    }
    return std::localeconv()->decimal_point;
}

std::tm BreakDown(int64_t seconds, bool utc) {
    // Narrowed on its own: where time_t has 32 bits, a time it cannot hold is out of range.
    const int64_t unixSeconds =
        (SafeInteger<int64_t>(seconds) - AbsTime::kUnixEpochSeconds).Value();
    const std::time_t unixTime = SafeInteger<std::time_t>(unixSeconds).Value();
    std::tm fields{};
    if ((utc ? gmtime_r(&unixTime, &fields) : localtime_r(&unixTime, &fields)) == nullptr) {
        throw exception::OutOfRange();
    }
    return fields;
}

}  // namespace

AbsTime AbsTime::Now() {
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    return FromUnixTime(now.tv_sec, static_cast<uint32_t>(now.tv_nsec));
}

AbsTime AbsTime::FromUnixTime(int64_t unixSeconds, uint32_t nanoseconds) {
    if (nanoseconds >= 1000000000u) {
        throw exception::OutOfRange();
    }
    // nanoseconds * 2^64 / 10^9 exactly: 2^64 / 10^9 = 18446744073 + 709551616 / 10^9.
    const uint64_t ns = nanoseconds;
    const uint64_t fraction = ns * 18446744073u + ns * 709551616u / 1000000000u;
    return AbsTime{fraction, (SafeInteger<int64_t>(unixSeconds) + kUnixEpochSeconds).Value()};
}

std::wstring AbsTimeToString(const AbsTime& time, const AbsTimeFormat& format) {
    if (format.fractionDigits > kMaxFractionDigits) {
        throw exception::OutOfRange();
    }
    int64_t seconds = time.seconds;
    std::string timeFormat = format.timeFormat != nullptr ? format.timeFormat : "%X";
    if (format.fractionDigits > 0) {
        const uint64_t scale = PowerOfTen(format.fractionDigits);
        uint64_t digits = RoundedScaledProduct(time.fraction, scale);
        if (digits >= scale) {
            seconds = (SafeInteger<int64_t>(seconds) + 1).Value();
            digits = 0;
        }
        char fraction[24];
        std::snprintf(fraction, sizeof(fraction), "%0*llu", static_cast<int>(format.fractionDigits),
                      static_cast<unsigned long long>(digits));
        timeFormat += DecimalPointText(format.decimalPoint);
        timeFormat += fraction;
    }
    if (format.suffix != nullptr) {
        timeFormat += ' ';
        timeFormat += format.suffix;
    }
    const std::string dateFormat = format.dateFormat != nullptr ? format.dateFormat : "%x";
    const std::string& first = format.timeFirst ? timeFormat : dateFormat;
    const std::string& second = format.timeFirst ? dateFormat : timeFormat;
    std::string combined = first;
    if (!first.empty() && !second.empty()) {
        combined += ' ';
    }
    combined += second;

    const std::tm fields = BreakDown(seconds, format.utc);
    char text[kMaxFormattedBytes];
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-nonliteral"
    // The format is the caller's by design.
    const size_t length = std::strftime(text, sizeof(text), combined.c_str(), &fields);
#pragma GCC diagnostic pop
    return WideFromNarrow(text, length);
}

ScaledFraction ScaleFraction(uint64_t fraction, uint32_t perSecond) {
    // fraction * perSecond = high * 2^32 + (low mod 2^32); high stays below 2^64.
    const uint64_t mask = 0xFFFFFFFFu;
    const uint64_t low = (fraction & mask) * perSecond;
    const uint64_t high = (fraction >> 32) * perSecond + (low >> 32);
    return ScaledFraction{high >> 32, (high << 32) | (low & mask)};
}

AbsTime LocalDateTimeToAbsTime(const LocalDateTime& fields) {
    std::tm calendar{};
    calendar.tm_year = fields.year - 1900;
    calendar.tm_mon = fields.month - 1;
    calendar.tm_mday = fields.day;
    calendar.tm_hour = fields.hour;
    calendar.tm_min = fields.minute;
    calendar.tm_sec = fields.second;
    calendar.tm_isdst = -1;
    const std::time_t unixTime = std::mktime(&calendar);
    if (unixTime < 1) {
        throw exception::OutOfRange();
    }
    return AbsTime{0, static_cast<int64_t>(unixTime) + AbsTime::kUnixEpochSeconds};
}

}  // namespace dsc
}  // namespace vq
