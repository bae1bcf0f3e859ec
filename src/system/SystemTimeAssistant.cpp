#include "system/SystemTimeAssistant.h"

#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstdint>

#include "config/IniNames.h"
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "property/BagAccess.h"
#include "property/HostStringResult.h"
#include "support/Exceptions.h"
#include "support/ExternalApplication.h"
#include "support/StatusHolder.h"
#include "support/Sysroot.h"
#include "support/SystemClock.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "support/TrustedTool.h"
#include "system/SystemItemValidation.h"
#include "vq/targetcfg/System.h"

using namespace kest::items;
using namespace kest::property;

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

namespace targetsystem = vq::targetcfg::system;

constexpr char kLegacyToOlsonSection[] = "LegacyToOlson";
constexpr char kOlsonToLegacySection[] = "OlsonToLegacy";
constexpr char kUnmappedLegacyTimeZone[] = "CUT0";
constexpr wchar_t kTimeZoneMessage[] = L"Timezone not supported.";

// The hardware-clock arguments: without a usable drift file the clock is taken as UTC and the
// drift file is left alone.
constexpr wchar_t kHardwareClockArgumentsWithoutAdjtime[] = L"--systohc --noadjfile --utc";
constexpr wchar_t kHardwareClockArguments[] = L"--systohc";

// The whole environment of the hardware-clock tool: nothing of the host's reaches it.
constexpr char kHardwareClockSearchPath[] = "PATH=/usr/sbin:/usr/bin:/sbin:/bin";
// A real-time clock that does not answer must not hold a persist for ever.
constexpr std::chrono::milliseconds kDefaultHardwareClockTimeLimit{60000};

constexpr uint32_t kMicrosecondsPerSecond = 1000000;

std::atomic<int64_t>& HardwareClockTimeLimitMs() {
    static std::atomic<int64_t> limit{kDefaultHardwareClockTimeLimit.count()};
    return limit;
}

// Copies the system time to the hardware clock with the hardware-clock tool and waits for it;
// a tool that outlives its time limit is killed and raises Timeout.
void CopySystemTimeToHardwareClock() {
    const bool adjtimeUsable = access(kest::paths::AdjtimeFile().c_str(), R_OK | W_OK) == 0;
    vq::dsc::osdep::ExternalApplication tool;
    tool.SetEnvironment({kHardwareClockSearchPath});
    tool.StartCommandLine(
        vq::dsc::WideFromNarrow(kest::TrustedToolPath(kest::paths::HardwareClockTool())),
        adjtimeUsable ? kHardwareClockArguments : kHardwareClockArgumentsWithoutAdjtime);
    tool.Wait(static_cast<int32_t>(HardwareClockTimeLimitMs().load()), true);
    if (tool.ExitResult() != 0) {
        throw vq::dsc::osdep::PosixError(
            "hardware clock update ended with " + std::to_string(tool.ExitResult()), EIO);
    }
}

}  // namespace

SystemTimeAssistant::SystemTimeAssistant() : legacyTable_(BuiltInLegacyTimeZones()) {
    TraceIfEnabled("SystemTimeAssistant", kTraceEntry);
    iniCache_ = IniFileManager::GetInstance();
}

SystemTimeAssistant::~SystemTimeAssistant() {
    TraceIfEnabled("~SystemTimeAssistant", kTraceEntry);
}

HRESULT SystemTimeAssistant::Lookup(const char* section, const std::string& key,
                                    std::string& value) {
    std::string found;
    const HRESULT status =
        iniCache_->GetStringFromIni(kest::paths::TimeZoneTableFile(), section, key, found);
    if (status != S_OK) {
        return status;
    }
    if (found.empty()) {
        return S_FALSE;
    }
    value = found;
    return S_OK;
}

HRESULT SystemTimeAssistant::LookupLegacyToOlson(const std::string& legacyText,
                                                 std::string& olsonName) {
    return Lookup(kLegacyToOlsonSection, legacyText, olsonName);
}

HRESULT SystemTimeAssistant::LookupOlsonToLegacy(const std::string& olsonName,
                                                 std::string& legacyText) {
    return Lookup(kOlsonToLegacySection, olsonName, legacyText);
}

std::string SystemTimeAssistant::GetOlsonTimeZone() {
    vq::targetcfg::NarrowString timeZone;
    ThrowIfLibraryCallFailed(targetsystem::GetTimeZone(timeZone));
    return timeZone.str();
}

std::string SystemTimeAssistant::GetLegacyTimeZone() {
    const std::string olsonName = GetOlsonTimeZone();
    std::string legacyText = kUnmappedLegacyTimeZone;
    StatusHolder status;
    status = LookupOlsonToLegacy(olsonName, legacyText);
    return legacyText;
}

HRESULT SystemTimeAssistant::FindLegacyOffset(const std::string& text, int32_t& seconds) const {
    // The time-zone table finds its keys ignoring case and surrounding blanks; so does this
    // look-up, so every text the table accepts gets its offset.
    const kest::ini::NameRules sameName;
    for (const LegacyTimeZone& zone : legacyTable_) {
        if (sameName(zone.standardText, text) || sameName(zone.daylightText, text)) {
            seconds = zone.offset * kSecondsPerLegacyOffsetUnit;
            return S_OK;
        }
    }
    return S_FALSE;
}

int32_t SystemTimeAssistant::GetLegacyOffsetDifference(const std::string& first,
                                                       const std::wstring& second) const {
    int32_t firstOffset = 0;
    int32_t secondOffset = 0;
    FindLegacyOffset(first, firstOffset);
    FindLegacyOffset(vq::dsc::NarrowFromWide(second), secondOffset);
    return firstOffset - secondOffset;
}

HRESULT SystemTimeAssistant::ValidateOlsonOrLegacyTimeZone(const std::string& text, bool olsonForm,
                                                           CvqBStr* message) {
    TraceIfEnabled("SystemTimeAssistant::ValidateOlsonOrLegacyTimeZone()", kTraceEntry);
    // A name is looked up as a file below the zone directory: it must not lead out of it.
    const ValidationVerdict nameVerdict = CheckTimeZoneName(text);
    if (!nameVerdict.Passed()) {
        TraceIfEnabled("ValidateOlsonOrLegacyTimeZone() failed", kTraceErrors);
        StoreValidationMessage(message, nameVerdict.message);
        return nameVerdict.status;
    }
    StatusHolder status;
    if (olsonForm) {
        ThrowIfLibraryCallFailed(targetsystem::ValidateTimeZone(text));
        return S_OK;
    }
    std::string olsonName;
    status = LookupLegacyToOlson(text, olsonName);
    if (status.Get() == S_FALSE) {
        TraceIfEnabled("ValidateOlsonOrLegacyTimeZone() failed", kTraceErrors);
        StoreValidationMessage(message, kTimeZoneMessage);
        return UX_E_VALUE_INVALID;
    }
    return S_OK;
}

HRESULT SystemTimeAssistant::PersistSystemPropertyTimezone(uint32_t tag, IuxSysPropertyBag* bag,
                                                           int32_t& /*persistFlag*/) {
    TraceIfEnabled("SystemTimeAssistant::PersistSystemPropertyTimezone()", kTraceEntry);
    if (bag == nullptr) {
        return E_POINTER;
    }
    if (tag != kest::tag::kLegacyTimeZone && tag != kest::tag::kOlsonTimeZone) {
        throw static_cast<long>(E_FAIL);
    }
    std::string newText;
    const HRESULT read = BagGetNarrowString(bag, tag, newText);
    if (read < 0) {
        return read;
    }
    std::string olsonName;
    if (tag == kest::tag::kLegacyTimeZone) {
        if (newText == GetLegacyTimeZone()) {
            return S_FALSE;
        }
        StatusHolder status;
        status = LookupLegacyToOlson(newText, olsonName);
    } else {
        if (newText == GetOlsonTimeZone()) {
            return S_FALSE;
        }
        olsonName = newText;
    }
    // An empty name would leave the controller without a time zone; a name leading out of the
    // zone directory is never handed on.
    if (olsonName.empty() || !CheckTimeZoneName(olsonName).Passed()) {
        TraceIfEnabled("PersistSystemPropertyTimezone() failed", kTraceErrors);
        return UX_E_VALUE_INVALID;
    }
    ThrowIfLibraryCallFailed(targetsystem::SetTimeZone(olsonName));
    return S_OK;
}

HRESULT SystemTimeAssistant::PersistSystemPropertyCurrentTime(IuxSysPropertyBag* bag,
                                                              int32_t offsetSeconds) {
    TraceIfEnabled("SystemTimeAssistant::PersistSystemPropertyCurrentTime()", kTraceEntry);
    if (bag == nullptr) {
        return E_POINTER;
    }
    uxSysAttrTimestampUTC timestamp{};
    StatusHolder status;
    status = QueryPropertyBag2(bag)->GetTimestamp(kest::tag::kCurrentTime, &timestamp);
    try {
        vq::dsc::AbsTime time = vq::dsc::AbsTime::FromTimestamp(timestamp);
        if (__builtin_add_overflow(time.seconds, offsetSeconds, &time.seconds)) {
            throw vq::dsc::exception::OutOfRange();
        }
        SetCurrentSystemTime(time);
    } catch (const vq::dsc::exception::Exception&) {
        TraceIfEnabled("SystemTimeAssistant::PersistSystemPropertyCurrentTime() failed",
                       kTraceErrors);
        return E_FAIL;
    }
    return S_OK;
}

void SystemTimeAssistant::SetHardwareClockTimeLimit(std::chrono::milliseconds limit) {
    HardwareClockTimeLimitMs().store(limit.count());
}

bool SystemTimeAssistant::HasRealTimeClock() {
    for (const std::string& device : kest::paths::RealTimeClockDevices()) {
        if (access(device.c_str(), R_OK) == 0) {
            return true;
        }
    }
    return false;
}

void SystemTimeAssistant::SetCurrentSystemTime(const vq::dsc::AbsTime& time) {
    // Whole Unix seconds and the fraction cut to whole microseconds; the clock cannot go back
    // before the Unix epoch.
    int64_t unixSeconds = 0;
    if (__builtin_sub_overflow(time.seconds, vq::dsc::AbsTime::kUnixEpochSeconds, &unixSeconds) ||
        unixSeconds < 0) {
        throw vq::dsc::exception::OutOfRange();
    }
    const uint64_t microseconds =
        vq::dsc::ScaleFraction(time.fraction, kMicrosecondsPerSecond).whole;
    kest::SetSystemClock(unixSeconds, static_cast<int64_t>(microseconds));
    if (HasRealTimeClock()) {
        CopySystemTimeToHardwareClock();
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
