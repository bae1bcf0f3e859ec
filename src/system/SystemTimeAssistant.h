// Time zones and the clock of the controller. The controller keeps its time zone as an Olson
// name; the host may also see and send a legacy POSIX text ("PST8PDT"). The two are translated
// through the time-zone table file, read through the process-wide INI cache.
#pragma once

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "config/IniFileManager.h"
#include "support/AbsTime.h"
#include "system/LegacyTimeZoneTable.h"
#include "uxsys/PropertyBag.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: not for concurrent calls; its owner calls it under its mutex. The time-zone
// table goes through the INI cache, which takes its own lock.
class SystemTimeAssistant {
  public:
    SystemTimeAssistant();
    ~SystemTimeAssistant();
    SystemTimeAssistant(const SystemTimeAssistant&) = delete;
    SystemTimeAssistant& operator=(const SystemTimeAssistant&) = delete;

    // The Olson name the table gives for `legacyText`: S_OK with `olsonName` set, S_FALSE (output
    // untouched) when the table has no entry or an empty one, or the cache's failure status.
    HRESULT LookupLegacyToOlson(const std::string& legacyText, std::string& olsonName);
    // The legacy text the table gives for `olsonName`, with the same results.
    HRESULT LookupOlsonToLegacy(const std::string& olsonName, std::string& legacyText);

    // The controller's current time zone; a library failure is thrown as a status (long).
    std::string GetOlsonTimeZone();
    // The legacy text of the current time zone, "CUT0" when the table has none.
    std::string GetLegacyTimeZone();

    // The offset in seconds east of UTC of the first built-in row whose standard or daylight
    // text equals `text`, ignoring case and surrounding blanks as the time-zone table does: S_OK,
    // or S_FALSE with `seconds` untouched.
    HRESULT FindLegacyOffset(const std::string& text, int32_t& seconds) const;
    // Offset of `first` minus offset of `second`, in seconds; texts outside the built-in table
    // count as offset 0.
    int32_t GetLegacyOffsetDifference(const std::string& first, const std::wstring& second) const;

    // Checks a time zone in Olson form (through the library, without message) or in legacy form
    // (through the table; an unknown text gives UX_E_VALUE_INVALID and "Timezone not supported."
    // in `message` when given). A name with a leading "/", a ".." part or a control character is
    // refused in either form like an unknown legacy text. Library and cache failures are thrown
    // as statuses.
    HRESULT ValidateOlsonOrLegacyTimeZone(const std::string& text, bool olsonForm,
                                          CvqBStr* message);

    // Applies the time zone under `tag` (legacy text or Olson name) from `bag`: S_FALSE when it
    // is already in force, S_OK once set, UX_E_VALUE_INVALID for a legacy text without Olson name,
    // an empty name or one CheckTimeZoneName refuses, the bag's status when the value cannot be
    // read. `persistFlag` is not touched. A tag other than the two time-zone tags throws E_FAIL.
    HRESULT PersistSystemPropertyTimezone(uint32_t tag, IuxSysPropertyBag* bag,
                                          int32_t& persistFlag);
    // Sets the clock to the bag's current-time value plus `offsetSeconds`: S_OK, the bag's
    // failure status, or E_FAIL when the clock cannot be set.
    HRESULT PersistSystemPropertyCurrentTime(IuxSysPropertyBag* bag, int32_t offsetSeconds);

    // True when one of the real-time clock device nodes is readable.
    static bool HasRealTimeClock();
    // Sets the system clock to `time` and copies it to the hardware clock when there is one.
    // Raises vq::dsc::osdep::PosixError when either step fails (the system time stays set),
    // vq::dsc::exception::Timeout when the hardware-clock tool outlives its limit (it is killed),
    // or vq::dsc::exception::OutOfRange for a time the system clock cannot hold.
    static void SetCurrentSystemTime(const vq::dsc::AbsTime& time);
    // How long the hardware-clock tool may run: 60 s in the plug-in; tests shorten it.
    static void SetHardwareClockTimeLimit(std::chrono::milliseconds limit);

  private:
    HRESULT Lookup(const char* section, const std::string& key, std::string& value);

    std::shared_ptr<IniFileManager> iniCache_;
    std::vector<LegacyTimeZone> legacyTable_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
