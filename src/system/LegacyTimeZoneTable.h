// The built-in table of legacy POSIX time-zone texts with their offsets from UTC. It is used to
// correct a clock change that arrives together with a legacy time-zone change.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// One legacy zone: its standard text, its daylight text and its offset east of UTC in
// hundredths of an hour (1 unit is 36 seconds; "PST8PDT" is -800).
struct LegacyTimeZone {
    std::string standardText;
    std::string daylightText;
    int32_t offset;
};

// Seconds in one unit of LegacyTimeZone::offset.
constexpr int32_t kSecondsPerLegacyOffsetUnit = 36;

// The 43 built-in legacy zones, in table order (west to east).
std::vector<LegacyTimeZone> BuiltInLegacyTimeZones();

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
