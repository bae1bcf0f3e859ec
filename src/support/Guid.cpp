#include "support/Guid.h"

#include <sched.h>
#include <unistd.h>

#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <mutex>
#include <random>

#include "support/AbsTime.h"
#include "support/HostInfo.h"

namespace vq {
namespace dsc {
namespace {

constexpr uint64_t kIntervalsPerSecond = 10000000;  // 100-ns intervals
// Seconds from 1582-10-15 00:00:00 UTC (the start of version 1 timestamps) to 1904-01-01.
constexpr uint64_t kGregorianToAbsTimeSeconds = 10136448000u;
constexpr uint16_t kClockSequenceMask = 0x3FFF;
// The version field of a time-based identifier, above the timestamp's top twelve bits.
constexpr uint16_t kTimestampHighMask = 0x0FFF;
constexpr uint16_t kVersionTimeBased = 0x1000;
// The variant of the layout, above the clock sequence's top six bits.
constexpr uint8_t kClockSequenceHighMask = 0x3F;
constexpr uint8_t kVariantStandard = 0x80;
// Set in the first byte of a node made of random bytes.
constexpr uint8_t kRandomNodeBit = 0x80;
constexpr size_t kNodeBytes = 6;

uint64_t MonotonicIntervals() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<uint64_t>(now.tv_sec) * kIntervalsPerSecond +
           static_cast<uint64_t>(now.tv_nsec) / 100;
}

uint64_t WallClockIntervals() {
    const AbsTime now = AbsTime::Now();
    const uint64_t seconds = static_cast<uint64_t>(now.seconds) + kGregorianToAbsTimeSeconds;
    const uint64_t fractionIntervals = ((now.fraction >> 32) * kIntervalsPerSecond) >> 32;
    return seconds * kIntervalsPerSecond + fractionIntervals;
}

// Bits from the system's entropy source. std::rand would start every process from the same
// seed, so all processes would share one clock sequence (and one node without an adapter).
uint32_t RandomBits() {
    std::random_device entropy;
    return entropy();
}

int HexValue(char c) {
    if (std::isdigit(static_cast<unsigned char>(c))) {
        return c - '0';
    }
    if (std::isxdigit(static_cast<unsigned char>(c))) {
        return std::toupper(static_cast<unsigned char>(c)) - 'A' + 10;
    }
    return -1;
}

// Parses "aa:bb:cc:dd:ee:ff" into six bytes; false when the text has another form.
bool ParseHardwareAddress(const std::string& text, uint8_t (&node)[kNodeBytes]) {
    if (text.size() != kNodeBytes * 3 - 1) {
        return false;
    }
    for (size_t i = 0; i < kNodeBytes; ++i) {
        const int high = HexValue(text[i * 3]);
        const int low = HexValue(text[i * 3 + 1]);
        if (high < 0 || low < 0 || (i + 1 < kNodeBytes && text[i * 3 + 2] != ':')) {
            return false;
        }
        node[i] = static_cast<uint8_t>(high * 16 + low);
    }
    return true;
}

bool IsAllZero(const uint8_t (&node)[kNodeBytes]) {
    for (uint8_t byte : node) {
        if (byte != 0) {
            return false;
        }
    }
    return true;
}

// The process-wide state of time-based identifiers.
class TimeBasedGenerator {
  public:
    TimeBasedGenerator()
        : monotonicToWallClock_(WallClockIntervals() - MonotonicIntervals()),
          clockSequence_(RandomClockSequence()) {
        if (!ParseHardwareAddress(osdep::FirstAdapterHardwareAddress(), node_) ||
            IsAllZero(node_)) {
            for (uint8_t& byte : node_) {
                byte = static_cast<uint8_t>(RandomBits());
            }
            node_[0] |= kRandomNodeBit;
        }
    }

    Guid Next() {
        std::lock_guard<std::mutex> lock(mutex_);
        if (process_ != getpid()) {
            // A forked child draws its own sequence, so it never repeats its parent's identifiers.
            process_ = getpid();
            clockSequence_ = RandomClockSequence();
        }
        uint64_t timestamp = Timestamp();
        while (timestamp == lastTimestamp_) {
            sched_yield();
            timestamp = Timestamp();
        }
        if (timestamp < lastTimestamp_) {
            clockSequence_ = static_cast<uint16_t>((clockSequence_ + 1) & kClockSequenceMask);
        }
        lastTimestamp_ = timestamp;

        Guid guid;
        guid.Data1 = static_cast<uint32_t>(timestamp);
        guid.Data2 = static_cast<uint16_t>(timestamp >> 32);
        guid.Data3 =
            static_cast<uint16_t>(((timestamp >> 48) & kTimestampHighMask) | kVersionTimeBased);
        guid.Data4[0] = static_cast<uint8_t>(((clockSequence_ >> 8) & kClockSequenceHighMask) |
                                             kVariantStandard);
        guid.Data4[1] = static_cast<uint8_t>(clockSequence_);
        std::memcpy(&guid.Data4[2], node_, kNodeBytes);
        return guid;
    }

  private:
    // 100-ns intervals since 1582-10-15 on the monotonic clock, so that changes of the wall
    // clock do not move it.
    uint64_t Timestamp() const { return MonotonicIntervals() + monotonicToWallClock_; }

    static uint16_t RandomClockSequence() {
        return static_cast<uint16_t>(RandomBits() & kClockSequenceMask);
    }

    std::mutex mutex_;
    pid_t process_ = getpid();
    const uint64_t monotonicToWallClock_;
    uint16_t clockSequence_;
    uint8_t node_[kNodeBytes] = {};
    uint64_t lastTimestamp_ = 0;
};

}  // namespace

Guid::Guid(const GUID& guid) {
    std::memcpy(this, &guid, sizeof(guid));
}

Guid::operator GUID() const {
    GUID guid;
    std::memcpy(&guid, this, sizeof(guid));
    return guid;
}

Guid Guid::CreateTimeBased() {
    static TimeBasedGenerator generator;
    return generator.Next();
}

bool operator==(const Guid& a, const Guid& b) {
    return std::memcmp(&a, &b, sizeof(Guid)) == 0;
}

std::wstring GuidToString(const Guid& guid) {
    char text[sizeof("{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}")];
    std::snprintf(text, sizeof(text), "{%08X-%04X-%04X-%02X%02X-%02X%02X%02X%02X%02X%02X}",
                  static_cast<unsigned>(guid.Data1), static_cast<unsigned>(guid.Data2),
                  static_cast<unsigned>(guid.Data3), guid.Data4[0], guid.Data4[1], guid.Data4[2],
                  guid.Data4[3], guid.Data4[4], guid.Data4[5], guid.Data4[6], guid.Data4[7]);
    return std::wstring(text, text + std::strlen(text));
}

}  // namespace dsc
}  // namespace vq
