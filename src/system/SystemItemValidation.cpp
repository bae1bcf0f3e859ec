#include "system/SystemItemValidation.h"

#include <cctype>

#include "support/AbsTime.h"
#include "uxsys/HostString.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// 128-bit integers for exact fixed-point arithmetic on timestamps.
__extension__ typedef __int128 Wide;
__extension__ typedef unsigned __int128 UnsignedWide;

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
constexpr wchar_t kLocaleMessage[] = L"Locale not supported.";
constexpr wchar_t kTimestampMessage[] = L"Timestamps older than 1970 are not supported.";

bool IsAlphanumeric(char byte) {
    return std::isalnum(static_cast<unsigned char>(byte)) != 0;
}

bool IsDecimalDigit(char byte) {
    return byte >= '0' && byte <= '9';
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
    // Whole milliseconds since the Unix epoch, then the fraction's share of a millisecond in
    // units of 2^-64 ms; both exact, so the rounding below is exact too.
    const Wide wholeMilliseconds =
        (static_cast<Wide>(time.seconds) - vq::dsc::AbsTime::kUnixEpochSeconds) * 1000;
    const UnsignedWide scaledFraction = static_cast<UnsignedWide>(time.fraction) * 1000;
    const Wide fractionMilliseconds = static_cast<Wide>(scaledFraction >> 64);
    const uint64_t remainder = static_cast<uint64_t>(scaledFraction);
    constexpr uint64_t kHalf = uint64_t(1) << 63;
    Wide milliseconds = wholeMilliseconds + fractionMilliseconds;
    if (remainder > kHalf || (remainder == kHalf && (milliseconds & 1) != 0)) {
        ++milliseconds;
    }
    if (milliseconds < 0) {
        return Reject(UX_E_VALUE_INVALID, kTimestampMessage);
    }
    return ValidationVerdict();
}

void StoreValidationMessage(CvqBStr* slot, const wchar_t* text) {
    if (slot == nullptr) {
        return;
    }
    CvqBStrFree(*slot);
    *slot = CvqBStrAlloc(text);
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
