#include "system/SystemItemValidation.h"

#include <cctype>

#include "support/AbsTime.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr size_t kMaxHostNameLength = 63;
constexpr size_t kMaxCommentLength = 64;

constexpr wchar_t kHostNameLengthMessage[] =
    L"Hostname cannot be empty or length cannot exceed 63 characters.";
constexpr wchar_t kHostNameEndsMessage[] =
    L"The first and last characters of the hostname must be alphanumeric.";
constexpr wchar_t kHostNameCharactersMessage[] =
    L"Hostname must contain only alphanumeric characters and hyphens.";
constexpr wchar_t kHostNameNumericMessage[] =
    L"The hostname must include at least one non-numeric character.";
constexpr wchar_t kCommentLengthMessage[] = L"Comment length cannot exceed 64 characters.";
constexpr wchar_t kCommentCharactersMessage[] = L"Comment cannot contain control characters.";
constexpr wchar_t kTimeZoneMessage[] = L"Timezone not supported.";
constexpr wchar_t kLocaleMessage[] = L"Locale not supported.";
constexpr wchar_t kTimestampMessage[] = L"Timestamps older than 1970 are not supported.";

bool IsAlphanumeric(char byte) {
    return std::isalnum(static_cast<unsigned char>(byte)) != 0;
}

bool IsDecimalDigit(char byte) {
    return byte >= '0' && byte <= '9';
}

bool IsControlCharacter(char byte) {
    const unsigned char code = static_cast<unsigned char>(byte);
    return code < 0x20 || code == 0x7F;
}

bool HasControlCharacter(const std::string& text) {
    for (char byte : text) {
        if (IsControlCharacter(byte)) {
            return true;
        }
    }
    return false;
}

// True when one of the "/"-separated parts of `name` is "..".
bool HasParentPart(const std::string& name) {
    size_t start = 0;
    for (;;) {
        const size_t slash = name.find('/', start);
        if (name.compare(start, slash - start, "..") == 0) {
            return true;
        }
        if (slash == std::string::npos) {
            return false;
        }
        start = slash + 1;
    }
}

ValidationVerdict Reject(HRESULT status, const wchar_t* message) {
    return ValidationVerdict{status, message};
}

}  // namespace

ValidationVerdict CheckHostName(const std::string& hostName) {
    const size_t length = hostName.size();
    if (length == 0 || length > kMaxHostNameLength) {
        return Reject(UX_E_VALUE_INVALID, kHostNameLengthMessage);
    }
    if (!IsAlphanumeric(hostName[0])) {
        return Reject(UX_E_HOSTNAME_INVALID, kHostNameEndsMessage);
    }
    for (size_t i = 1; i < length; ++i) {
        if (i == length - 1) {
            if (!IsAlphanumeric(hostName[i])) {
                return Reject(UX_E_HOSTNAME_INVALID, kHostNameEndsMessage);
            }
        } else if (!IsAlphanumeric(hostName[i]) && hostName[i] != '-') {
            return Reject(UX_E_HOSTNAME_INVALID, kHostNameCharactersMessage);
        }
    }
    if (IsDecimalDigit(hostName[0])) {
        bool allDigits = true;
        for (char byte : hostName) {
            allDigits = allDigits && IsDecimalDigit(byte);
        }
        if (allDigits) {
            return Reject(UX_E_HOSTNAME_INVALID, kHostNameNumericMessage);
        }
    }
    return ValidationVerdict();
}

ValidationVerdict CheckComment(const std::string& comment) {
    if (comment.size() > kMaxCommentLength) {
        return Reject(UX_E_VALUE_INVALID, kCommentLengthMessage);
    }
    if (HasControlCharacter(comment)) {
        return Reject(UX_E_VALUE_INVALID, kCommentCharactersMessage);
    }
    return ValidationVerdict();
}

ValidationVerdict CheckTimeZoneName(const std::string& name) {
    if ((!name.empty() && name[0] == '/') || HasParentPart(name) || HasControlCharacter(name)) {
        return Reject(UX_E_VALUE_INVALID, kTimeZoneMessage);
    }
    return ValidationVerdict();
}

ValidationVerdict CheckLocaleCode(const std::wstring& localeCode, const std::wstring& localeCodes) {
    if (!localeCode.empty()) {
        size_t start = 0;
        for (;;) {
            const size_t comma = localeCodes.find(L',', start);
            if (localeCodes.compare(start, comma - start, localeCode) == 0) {
                return ValidationVerdict();
            }
            if (comma == std::wstring::npos) {
                break;
            }
            start = comma + 1;
        }
    }
    return Reject(UX_E_VALUE_INVALID, kLocaleMessage);
}

ValidationVerdict CheckCurrentTime(const uxSysAttrTimestampUTC& time) {
    // The time, rounded half to even to whole milliseconds since the Unix epoch, must not be
    // negative. Only in the second before the epoch does the fraction decide: from 999.5 ms on
    // it rounds up to the epoch (-1 ms is odd, so the exact half rounds up too).
    constexpr int64_t kEpoch = vq::dsc::AbsTime::kUnixEpochSeconds;
    constexpr uint64_t kHalf = uint64_t(1) << 63;
    if (time.seconds >= kEpoch) {
        return ValidationVerdict();
    }
    if (time.seconds == kEpoch - 1) {
        const vq::dsc::ScaledFraction milliseconds = vq::dsc::ScaleFraction(time.fraction, 1000);
        if (milliseconds.whole == 999 && milliseconds.remainder >= kHalf) {
            return ValidationVerdict();
        }
    }
    return Reject(UX_E_VALUE_INVALID, kTimestampMessage);
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
