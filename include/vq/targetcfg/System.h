// The controller's identity and system settings. Text getters replace their output (with the
// empty text when the controller has no value); number getters leave their output unchanged when
// the controller has no value.
#pragma once

#include <cstdint>

#include "vq/targetcfg/Types.h"

namespace vq {
namespace targetcfg {
namespace system {

// The controller's device description, for example "KEST 9100".
VQ_TARGETCFG_API int32_t GetDeviceDescription(NarrowString& description);
// The controller's target class.
VQ_TARGETCFG_API int32_t GetTargetClass(NarrowString& targetClass);
// The controller's host name.
VQ_TARGETCFG_API int32_t GetHostName(NarrowString& hostName);
// The controller's target identifier.
VQ_TARGETCFG_API int32_t GetTargetID(uint32_t& targetId);
// The controller's serial number.
VQ_TARGETCFG_API int32_t GetSerialNumber(uint32_t& serialNumber);
// The user comment, as wide text.
VQ_TARGETCFG_API int32_t GetUserComment(WideString& comment);
// The name of the current language, for example "English".
VQ_TARGETCFG_API int32_t GetLanguageName(NarrowString& languageName);
// Appends the names of the supported languages in the controller's order.
VQ_TARGETCFG_API int32_t GetSupportedLanguages(vq::dsc::Vector<NarrowString>& languageNames);
// The current time zone (an Olson name such as "Europe/Berlin", or a legacy text).
VQ_TARGETCFG_API int32_t GetTimeZone(NarrowString& timeZone);
// The current time zone's offset from UTC as the controller reports it (0 when it has none);
// the result is the value itself, or a failure status.
VQ_TARGETCFG_API int32_t GetTimezoneOffset();

// Stores the host name.
VQ_TARGETCFG_API int32_t SetHostName(NarrowString hostName);
// Stores the user comment.
VQ_TARGETCFG_API int32_t SetUserComment(NarrowString comment);
// Selects the language with the locale code `localeCode` (en, de, fr, zh, kr, ja and any the
// controller adds); an unknown code returns status::kValueInvalid and changes nothing.
VQ_TARGETCFG_API int32_t SetLanguageName(NarrowString localeCode);
// Stores the time zone (an Olson name).
VQ_TARGETCFG_API int32_t SetTimeZone(NarrowString timeZone);
// 0 when `timeZone` names a zone of the controller's zone database; status::kValueInvalid
// otherwise (also for names that are empty, absolute or contain "." or ".." components).
VQ_TARGETCFG_API int32_t ValidateTimeZone(NarrowString timeZone);

}  // namespace system
}  // namespace targetcfg
}  // namespace vq
