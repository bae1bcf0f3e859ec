#include "system/SystemItemValidation.h"

#include <gtest/gtest.h>

#include <string>

#include "support/AbsTime.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr wchar_t kLength[] = L"Hostname cannot be empty or length cannot exceed 63 characters.";
constexpr wchar_t kEnds[] = L"The first and last characters of the hostname must be alphanumeric.";
constexpr wchar_t kCharacters[] =
    L"Hostname must contain only alphanumeric characters and hyphens.";
constexpr wchar_t kNumeric[] = L"The hostname must include at least one non-numeric character.";
constexpr wchar_t kCommentLength[] = L"Comment length cannot exceed 64 characters.";
constexpr wchar_t kControl[] = L"Comment cannot contain control characters.";
constexpr wchar_t kLocale[] = L"Locale not supported.";
constexpr wchar_t kOld[] = L"Timestamps older than 1970 are not supported.";

constexpr int64_t kEpoch = vq::dsc::AbsTime::kUnixEpochSeconds;
// Fractions in units of 2^-64 s before a whole second; kHalfMillisecond units are a hair over
// half a millisecond. (No fraction lies exactly half a millisecond before a whole second, so no
// tie can decide the sign.)
constexpr uint64_t kHalfMillisecond = 9223372036854776ull;
constexpr uint64_t kWhole = ~uint64_t(0);

struct Case {
    const char* name;
    ValidationVerdict verdict;
    HRESULT status;
    const wchar_t* message;  // null: none
};

// Host names are judged by length, then ends, then characters, then digits; comments count the
// bytes of the narrow text; locale codes must be whole non-empty elements of the list; times are
// rounded to the nearest millisecond before they are judged. (The system validation fuzzer's
// seeds hold more host names, comments and locale codes, judged by its own rules.)
TEST(SystemItemRules, GiveTheirStatusAndMessage) {
    std::string twoByteCharacters;  // 33 characters in 66 bytes
    for (int i = 0; i < 33; ++i) {
        twoByteCharacters += "\xC3\xA9";
    }
    const Case cases[] = {
        {"host 64 bytes", CheckHostName(std::string(64, 'a')), UX_E_VALUE_INVALID, kLength},
        {"host leading hyphen", CheckHostName("-ab"), UX_E_HOSTNAME_INVALID, kEnds},
        {"host underscore", CheckHostName("a_b"), UX_E_HOSTNAME_INVALID, kCharacters},
        {"host inner fault first", CheckHostName("a_b-"), UX_E_HOSTNAME_INVALID, kCharacters},
        {"host digits only", CheckHostName("123"), UX_E_HOSTNAME_INVALID, kNumeric},
        {"host non-ASCII", CheckHostName("ab\xC3\xA9z"), UX_E_HOSTNAME_INVALID, kCharacters},
        {"comment 65 bytes", CheckComment(std::string(65, 'c')), UX_E_VALUE_INVALID,
         kCommentLength},
        {"comment line break", CheckComment("rack\n4"), UX_E_VALUE_INVALID, kControl},
        {"comment delete", CheckComment("rack 4\x7F"), UX_E_VALUE_INVALID, kControl},
        {"comment multi-byte", CheckComment("rack \xC3\xA9"), S_OK, nullptr},
        {"comment 33 two-byte characters", CheckComment(twoByteCharacters), UX_E_VALUE_INVALID,
         kCommentLength},
        {"locale n", CheckLocaleCode(L"n", L"en,de,fr"), UX_E_VALUE_INVALID, kLocale},
        {"locale empty element", CheckLocaleCode(L"", L"en,de,,fr"), UX_E_VALUE_INVALID, kLocale},
        {"locale after empty", CheckLocaleCode(L"fr", L"en,de,,fr"), S_OK, nullptr},
        {"locale empty list", CheckLocaleCode(L"", L""), UX_E_VALUE_INVALID, kLocale},
        {"locale none offered", CheckLocaleCode(L"en", L""), UX_E_VALUE_INVALID, kLocale},
        {"locale EN", CheckLocaleCode(L"EN", L"en"), UX_E_VALUE_INVALID, kLocale},
        {"locale en blank", CheckLocaleCode(L"en ", L"en"), UX_E_VALUE_INVALID, kLocale},
        {"time epoch", CheckCurrentTime({0, kEpoch}), S_OK, nullptr},
        {"time one second before", CheckCurrentTime({0, kEpoch - 1}), UX_E_VALUE_INVALID, kOld},
        {"time 0.4 ms before", CheckCurrentTime({kWhole - 7378697629483820ull, kEpoch - 1}), S_OK,
         nullptr},
        {"time 0.6 ms before", CheckCurrentTime({kWhole - 11068046444225730ull, kEpoch - 1}),
         UX_E_VALUE_INVALID, kOld},
        {"time under half a ms before",
         CheckCurrentTime({kWhole - kHalfMillisecond + 2, kEpoch - 1}), S_OK, nullptr},
        {"time over half a ms before", CheckCurrentTime({kWhole - kHalfMillisecond, kEpoch - 1}),
         UX_E_VALUE_INVALID, kOld},
        {"time long before", CheckCurrentTime({0, 0}), UX_E_VALUE_INVALID, kOld},
        {"time most negative", CheckCurrentTime({0, INT64_MIN}), UX_E_VALUE_INVALID, kOld},
        {"time far future", CheckCurrentTime({kWhole, INT64_MAX}), S_OK, nullptr},
        {"time 2023", CheckCurrentTime({0, kEpoch + 1700000000}), S_OK, nullptr},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(c.status, c.verdict.status) << c.name;
        EXPECT_EQ(c.status >= 0, c.verdict.Passed()) << c.name;
        EXPECT_EQ(std::wstring(c.message ? c.message : L"(none)"),
                  c.verdict.message ? c.verdict.message : L"(none)")
            << c.name;
    }
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
