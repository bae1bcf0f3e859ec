#include "hostkit/TimestampText.h"

#include <time.h>

#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <limits>

namespace kest::hostkit {

namespace {

constexpr double kFractionUnitsPerSecond = 18446744073709551616.0;  // 2^64

// The fraction of a second as 2^-64 units, for `nanoseconds` below one second.
uint64_t FractionFromNanoseconds(uint64_t nanoseconds) {
    return static_cast<uint64_t>(static_cast<double>(nanoseconds) / 1e9 * kFractionUnitsPerSecond);
}

// Reads exactly `count` decimal digits at `text[*position]`, advancing the position.
bool ReadDigits(const std::string& text, size_t* position, size_t count, int* value) {
    if (*position + count > text.size()) {
        return false;
    }
    int result = 0;
    for (size_t i = 0; i < count; ++i) {
        const char c = text[*position + i];
        if (c < '0' || c > '9') {
            return false;
        }
        result = result * 10 + (c - '0');
    }
    *position += count;
    *value = result;
    return true;
}

bool ReadLiteral(const std::string& text, size_t* position, char expected) {
    if (*position >= text.size() || text[*position] != expected) {
        return false;
    }
    ++*position;
    return true;
}

}  // namespace

bool IsNoTime(const uxSysAttrTimestampUTC& time) {
    return time.fraction == 0 && time.seconds == 0;
}

std::string TimestampToIso8601(const uxSysAttrTimestampUTC& time) {
    int64_t seconds = time.seconds;
    long long milliseconds = -1;
    if (time.fraction != 0) {
        // Rounded to the nearest millisecond, so that a parsed ".123" shows as ".123" again.
        milliseconds =
            std::llround(static_cast<double>(time.fraction) / kFractionUnitsPerSecond * 1000.0);
        if (milliseconds == 1000) {
            milliseconds = 0;
            if (seconds == std::numeric_limits<int64_t>::max()) {
                return std::string();
            }
            ++seconds;
        }
    }
    if (seconds < std::numeric_limits<int64_t>::min() + kSecondsFrom1904To1970) {
        return std::string();
    }
    const time_t posixSeconds = static_cast<time_t>(seconds - kSecondsFrom1904To1970);
    // Where time_t has 32 bits, a time past January 2038 would otherwise wrap to 1901.
    if (static_cast<int64_t>(posixSeconds) != seconds - kSecondsFrom1904To1970) {
        return std::string();
    }
    struct tm fields {};
    if (gmtime_r(&posixSeconds, &fields) == nullptr) {
        return std::string();
    }
    char text[64];
    const int length =
        std::snprintf(text, sizeof text, "%04lld-%02d-%02dT%02d:%02d:%02d",
                      static_cast<long long>(fields.tm_year) + 1900, fields.tm_mon + 1,
                      fields.tm_mday, fields.tm_hour, fields.tm_min, fields.tm_sec);
    std::string result(text, static_cast<size_t>(length));
    if (milliseconds >= 0) {
        std::snprintf(text, sizeof text, ".%03lld", milliseconds);
        result += text;
    }
    return result + "Z";
}

std::optional<uxSysAttrTimestampUTC> TimestampFromIso8601(const std::string& text) {
    size_t position = 0;
    struct tm fields {};
    int year = 0;
    int month = 0;
    if (!ReadDigits(text, &position, 4, &year) || !ReadLiteral(text, &position, '-') ||
        !ReadDigits(text, &position, 2, &month) || !ReadLiteral(text, &position, '-') ||
        !ReadDigits(text, &position, 2, &fields.tm_mday)) {
        return std::nullopt;
    }
    if (!ReadLiteral(text, &position, 'T') && !ReadLiteral(text, &position, ' ')) {
        return std::nullopt;
    }
    if (!ReadDigits(text, &position, 2, &fields.tm_hour) || !ReadLiteral(text, &position, ':') ||
        !ReadDigits(text, &position, 2, &fields.tm_min) || !ReadLiteral(text, &position, ':') ||
        !ReadDigits(text, &position, 2, &fields.tm_sec)) {
        return std::nullopt;
    }
    uint64_t nanoseconds = 0;
    if (ReadLiteral(text, &position, '.')) {
        size_t digits = 0;
        uint64_t scale = 100000000;
        for (; position < text.size() && std::isdigit(static_cast<unsigned char>(text[position]));
             ++position, ++digits, scale /= 10) {
            if (digits == 9) {
                return std::nullopt;
            }
            nanoseconds += static_cast<uint64_t>(text[position] - '0') * scale;
        }
        if (digits == 0) {
            return std::nullopt;
        }
    }
    if (!ReadLiteral(text, &position, 'Z') || position != text.size()) {
        return std::nullopt;
    }
    fields.tm_year = year - 1900;
    fields.tm_mon = month - 1;
    const struct tm requested = fields;
    errno = 0;
    const time_t posixSeconds = timegm(&fields);
    // A date that time_t cannot hold (past January 2038 where it has 32 bits).
    if (posixSeconds == -1 && errno == EOVERFLOW) {
        return std::nullopt;
    }
    // timegm normalises out-of-range fields; a date that changed on the way did not exist.
    if (fields.tm_year != requested.tm_year || fields.tm_mon != requested.tm_mon ||
        fields.tm_mday != requested.tm_mday || fields.tm_hour != requested.tm_hour ||
        fields.tm_min != requested.tm_min || fields.tm_sec != requested.tm_sec) {
        return std::nullopt;
    }
    return uxSysAttrTimestampUTC{FractionFromNanoseconds(nanoseconds),
                                 static_cast<int64_t>(posixSeconds) + kSecondsFrom1904To1970};
}

uxSysAttrTimestampUTC CurrentTimestamp() {
    struct timespec now {};
    clock_gettime(CLOCK_REALTIME, &now);
    return uxSysAttrTimestampUTC{FractionFromNanoseconds(static_cast<uint64_t>(now.tv_nsec)),
                                 static_cast<int64_t>(now.tv_sec) + kSecondsFrom1904To1970};
}

}  // namespace kest::hostkit
