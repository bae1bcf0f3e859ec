// The rules a changed system-item setting must pass before it is persisted. Each rule returns
// a verdict: S_OK, or the rejection status with the message shown to the user.
#pragma once

#include <string>

#include "uxsys/StatusCodes.h"
#include "uxsys/Types.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

struct ValidationVerdict {
    HRESULT status = S_OK;
    const wchar_t* message = nullptr;  // null when the value passed

    bool Passed() const { return status >= 0; }
};

// A host name of 1 to 63 bytes, alphanumeric at both ends, alphanumeric or "-" inside, and not
// made only of digits. Bytes are judged with isalnum in the process's current locale.
ValidationVerdict CheckHostName(const std::string& hostName);

// A comment of at most 64 bytes (narrow text, so multi-byte characters count per byte) without
// control characters (bytes below 0x20 and 0x7F).
ValidationVerdict CheckComment(const std::string& comment);

// A time-zone name (either notation) that can only name a zone inside the zone directory: no
// leading "/", no ".." part and no control characters. A refusal carries the time-zone message.
ValidationVerdict CheckTimeZoneName(const std::string& name);

// A locale code that is one whole, non-empty element of the comma-separated `localeCodes`.
ValidationVerdict CheckLocaleCode(const std::wstring& localeCode, const std::wstring& localeCodes);

// A current time that, rounded to the nearest millisecond (ties to even), is not before
// 1970-01-01 00:00:00 UTC.
ValidationVerdict CheckCurrentTime(const uxSysAttrTimestampUTC& time);

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
