#include "system/SystemItemValidation.h"

#include <gtest/gtest.h>

#include <clocale>
#include <string>

#include "support/AbsTime.h"
#include "support/TextConversion.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

constexpr wchar_t kLengthMessage[] =
    L"Hostname cannot be empty or length cannot exceed 63 characters.";
constexpr wchar_t kEndsMessage[] =
    L"The first and last characters of the hostname must be alphanumeric.";
constexpr wchar_t kCharactersMessage[] =
    L"Hostname must contain only alphanumeric characters and hyphens.";
constexpr wchar_t kNumericMessage[] =
    L"The hostname must include at least one non-numeric character.";

struct Case {
    const char* name;
    std::string value;
    HRESULT status;
    const wchar_t* message;
};

void ExpectVerdict(const ValidationVerdict& verdict, const Case& expected) {
    EXPECT_EQ(expected.status, verdict.status) << expected.name;
    if (expected.message == nullptr) {
        EXPECT_EQ(nullptr, verdict.message) << expected.name;
    } else {
        ASSERT_NE(nullptr, verdict.message) << expected.name;
        EXPECT_STREQ(expected.message, verdict.message) << expected.name;
    }
}

TEST(HostNameRule, JudgesLengthEndsCharactersAndDigitsInThatOrder) {
    const Case cases[] = {
        {"63 bytes", std::string(63, 'a'), S_OK, nullptr},
        {"64 bytes", std::string(64, 'a'), UX_E_VALUE_INVALID, kLengthMessage},
        {"empty", "", UX_E_VALUE_INVALID, kLengthMessage},
        {"inner hyphen", "a-b", S_OK, nullptr},
        {"leading hyphen", "-ab", UX_E_HOSTNAME_INVALID, kEndsMessage},
        {"trailing hyphen", "ab-", UX_E_HOSTNAME_INVALID, kEndsMessage},
        {"underscore", "a_b", UX_E_HOSTNAME_INVALID, kCharactersMessage},
        {"inner fault before bad end", "a_b-", UX_E_HOSTNAME_INVALID, kCharactersMessage},
        {"digits only", "123", UX_E_HOSTNAME_INVALID, kNumericMessage},
        {"digit then letter", "1a", S_OK, nullptr},
        {"digits with hyphen", "12-3", S_OK, nullptr},
        {"single letter", "a", S_OK, nullptr},
        {"single digit", "7", UX_E_HOSTNAME_INVALID, kNumericMessage},
        {"too long and bad", "-" + std::string(70, '1'), UX_E_VALUE_INVALID, kLengthMessage},
        {"non-ASCII byte", "ab\xC3\xA9z", UX_E_HOSTNAME_INVALID, kCharactersMessage},
    };
    for (const Case& c : cases) {
        ExpectVerdict(CheckHostName(c.value), c);
    }
}

TEST(CommentRule, CountsBytesOfTheNarrowTextAndRefusesControlCharacters) {
    const wchar_t* message = L"Comment length cannot exceed 64 characters.";
    const wchar_t* control = L"Comment cannot contain control characters.";
    const Case cases[] = {
        {"64 bytes", std::string(64, 'c'), S_OK, nullptr},
        {"65 bytes", std::string(65, 'c'), UX_E_VALUE_INVALID, message},
        {"empty", "", S_OK, nullptr},
        {"line break", "rack\n4", UX_E_VALUE_INVALID, control},
        {"delete", "rack 4\x7F", UX_E_VALUE_INVALID, control},
        {"multi-byte character", "rack \xC3\xA9", S_OK, nullptr},
    };
    for (const Case& c : cases) {
        ExpectVerdict(CheckComment(c.value), c);
    }
}

TEST(CommentRule, MeasuresMultiByteCharactersInBytes) {
    const std::string previous = std::setlocale(LC_ALL, nullptr);
    ASSERT_NE(nullptr, std::setlocale(LC_ALL, "C.UTF-8"));
    // 40 characters that take two bytes each in UTF-8: 80 bytes.
    const std::string narrow = vq::dsc::NarrowFromWide(std::wstring(40, L'\u00E9'));
    std::setlocale(LC_ALL, previous.c_str());
    EXPECT_EQ(80u, narrow.size());
    EXPECT_EQ(UX_E_VALUE_INVALID, CheckComment(narrow).status);
}

TEST(LocaleRule, AcceptsOnlyWholeNonEmptyElements) {
    struct LocaleCase {
        const wchar_t* code;
        const wchar_t* supported;
        bool passes;
    };
    const LocaleCase cases[] = {
        {L"en", L"en,de,fr", true},
        {L"fr", L"en,de,fr", true},
        {L"de", L"en,de,fr", true},
        {L"n", L"en,de,fr", false},
        {L"e,d", L"en,de,fr", false},
        {L"", L"en,de,fr", false},
        {L"es", L"en,de,fr", false},
        {L"en,de", L"en,de,fr", false},
        {L"", L"en,de,,fr", false},
        {L"fr", L"en,de,,fr", true},
        {L"", L"", false},
        {L"en", L"", false},
        {L"EN", L"en", false},
        {L"en ", L"en", false},
    };
    for (const LocaleCase& c : cases) {
        const ValidationVerdict verdict = CheckLocaleCode(c.code, c.supported);
        EXPECT_EQ(c.passes, verdict.Passed()) << "'" << vq::dsc::NarrowFromWide(c.code) << "' in '"
                                              << vq::dsc::NarrowFromWide(c.supported) << "'";
        if (!c.passes) {
            EXPECT_EQ(UX_E_VALUE_INVALID, verdict.status);
            EXPECT_STREQ(L"Locale not supported.", verdict.message);
        }
    }
}

TEST(CurrentTimeRule, RoundsToTheNearestMillisecondBeforeJudging) {
    constexpr int64_t kEpoch = vq::dsc::AbsTime::kUnixEpochSeconds;
    // Fractions in units of 2^-64 s; 9223372036854776 units are a hair over half a millisecond.
    // (No fraction lies exactly half a millisecond before a whole second, so no tie can decide
    // the sign.)
    constexpr uint64_t kHalfMillisecond = 9223372036854776ull;
    struct TimeCase {
        const char* name;
        uxSysAttrTimestampUTC time;
        bool passes;
    };
    const TimeCase cases[] = {
        {"epoch", {0, kEpoch}, true},
        {"one second before", {0, kEpoch - 1}, false},
        {"0.4 ms before", {~uint64_t(0) - 7378697629483820ull, kEpoch - 1}, true},
        {"0.6 ms before", {~uint64_t(0) - 11068046444225730ull, kEpoch - 1}, false},
        {"just under half a ms before", {~uint64_t(0) - kHalfMillisecond + 2, kEpoch - 1}, true},
        {"just over half a ms before", {~uint64_t(0) - kHalfMillisecond, kEpoch - 1}, false},
        {"long before", {0, 0}, false},
        {"most negative", {0, INT64_MIN}, false},
        {"far future", {~uint64_t(0), INT64_MAX}, true},
        {"2023", {0, kEpoch + 1700000000}, true},
    };
    for (const TimeCase& c : cases) {
        const ValidationVerdict verdict = CheckCurrentTime(c.time);
        EXPECT_EQ(c.passes, verdict.Passed()) << c.name;
        if (!c.passes) {
            EXPECT_EQ(UX_E_VALUE_INVALID, verdict.status) << c.name;
            EXPECT_STREQ(L"Timestamps older than 1970 are not supported.", verdict.message);
        }
    }
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
