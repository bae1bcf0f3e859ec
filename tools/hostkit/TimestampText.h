// Timestamps (64.64 fixed-point seconds since 1904-01-01 UTC) as ISO 8601 UTC text.
#pragma once

#include <optional>
#include <string>

#include "uxsys/Types.h"

namespace kest::hostkit {

// Seconds from 1904-01-01 to 1970-01-01, both UTC.
inline constexpr int64_t kSecondsFrom1904To1970 = 2082844800;

// True for the all-zero timestamp, which means "no time".
bool IsNoTime(const uxSysAttrTimestampUTC& time);

// "YYYY-MM-DDTHH:MM:SSZ", with ".mmm" milliseconds (rounded) before the Z when the fraction
// is not zero. Empty for a time the calendar conversion cannot represent.
std::string TimestampToIso8601(const uxSysAttrTimestampUTC& time);

// Parses "YYYY-MM-DDTHH:MM:SS" with an optional fraction of up to nine digits and a final "Z"
// (UTC); a blank may replace the "T". Nothing for any other text, an impossible date or one
// that the system's time_t cannot hold.
std::optional<uxSysAttrTimestampUTC> TimestampFromIso8601(const std::string& text);

// The current time of the real-time clock.
uxSysAttrTimestampUTC CurrentTimestamp();

}  // namespace kest::hostkit
