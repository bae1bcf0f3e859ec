// Absolute time: signed 64.64 fixed-point seconds since 1904-01-01 00:00:00 UTC, laid out like
// the host's timestamp.
#pragma once

#include <cstdint>
#include <ctime>
#include <string>

#include "uxsys/Types.h"

namespace vq {
namespace dsc {

struct AbsTime {
    // Seconds from 1904-01-01 to 1970-01-01 (the Unix epoch).
    static constexpr int64_t kUnixEpochSeconds = 2082844800;

    uint64_t fraction = 0;  // fraction of a second in units of 2^-64 s
    int64_t seconds = 0;    // whole seconds since 1904-01-01 00:00:00 UTC

    // The current time of the real-time clock.
    static AbsTime Now();
    // The moment `unixSeconds` plus `nanoseconds` after the Unix epoch; nanoseconds of a whole
    // second or more, or seconds beyond the range, raise vq::dsc::exception::OutOfRange.
    static AbsTime FromUnixTime(int64_t unixSeconds, uint32_t nanoseconds);
    // The runtime's invalid time: fraction 0 and the most negative seconds.
    static constexpr AbsTime Invalid() { return AbsTime{0, INT64_MIN}; }

    static AbsTime FromTimestamp(const uxSysAttrTimestampUTC& timestamp) {
        return AbsTime{timestamp.fraction, timestamp.seconds};
    }
    uxSysAttrTimestampUTC ToTimestamp() const { return uxSysAttrTimestampUTC{fraction, seconds}; }
};

static_assert(sizeof(AbsTime) == sizeof(uxSysAttrTimestampUTC), "same layout as the timestamp");

// Which character separates seconds and their fraction.
enum class DecimalPoint { Locale, Period, Comma };

// How AbsTimeToString writes a time; formats are strftime formats.
struct AbsTimeFormat {
    const char* dateFormat = nullptr;  // null: the locale's date format; empty: no date
    const char* timeFormat = nullptr;  // null: the locale's time format; empty: no time
    unsigned fractionDigits = 0;       // 0 to 19 digits of the fraction, rounded to nearest
    bool utc = false;                  // UTC instead of local time
    bool timeFirst = false;            // time before date
    const char* suffix = nullptr;      // appended to the time format after a blank; null: none
    DecimalPoint decimalPoint = DecimalPoint::Locale;
};

// Formats `time` as `format` says: date and time joined by one blank (an empty part leaves no
// blank), the fraction after the time's seconds with a rounding up to one whole second carried
// into the seconds. Raises vq::dsc::exception::OutOfRange for more than 19 fraction digits or a
// time that the C library cannot break down.
std::wstring AbsTimeToString(const AbsTime& time, const AbsTimeFormat& format = AbsTimeFormat());

// A fraction of a second counted in units of 1/perSecond s: the whole units, and the rest in
// units of 2^-64 of one unit.
struct ScaledFraction {
    uint64_t whole;
    uint64_t remainder;
};

// `fraction` (units of 2^-64 s) in units of 1/`perSecond` s, exactly. Built from 32-bit halves,
// so it needs no 128-bit integer type (32-bit targets have none).
ScaledFraction ScaleFraction(uint64_t fraction, uint32_t perSecond);

// A local calendar date and time; fields outside their usual ranges are normalised.
struct LocalDateTime {
    int year;    // e.g. 2024
    int month;   // 1 to 12
    int day;     // 1 to 31
    int hour;    // 0 to 23
    int minute;  // 0 to 59
    int second;  // 0 to 60
};

// The moment of the local date and time `fields` with fraction 0. Raises
// vq::dsc::exception::OutOfRange when it cannot be represented or is not after
// 1970-01-01 00:00:00 UTC.
AbsTime LocalDateTimeToAbsTime(const LocalDateTime& fields);

}  // namespace dsc
}  // namespace vq
