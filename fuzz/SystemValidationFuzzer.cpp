// Host-name, comment and locale validation of the system item through a property bag: a bag
// of fuzzed changes goes to the item handler's ValidatePropertyChanges in a private sysroot with
// the simulated controller. The verdicts are checked against the rules, written out anew here,
// as far as they can be predicted (time and time-zone changes end the prediction).
#include <fuzzer/FuzzedDataProvider.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <set>
#include <string>

#include "FuzzCheck.h"
#include "com/CountedPtr.h"
#include "common/TempSysroot.h"
#include "kest/ChassisTags.h"
#include "property/CuxDynamicPropertyBag.h"
#include "support/TextConversion.h"
#include "system/KestDeviceItemHandler.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace {

namespace tag = kest::tag;
using nVQKESTSYSAPICHASSISEXPERT100::KestDeviceItemHandler;

constexpr uint32_t kTags[] = {tag::kHostName,          tag::kComment,        tag::kLocaleCode,
                              tag::kCurrentTime,       tag::kLegacyTimeZone, tag::kOlsonTimeZone,
                              tag::kWebServiceEnabled, tag::kDnsName,        0x00000001};
constexpr char kCallLog[] = "/var/lib/vqtargetcfg/calls.log";
constexpr int kIterationsPerLogTruncation = 512;

KestDeviceItemHandler& Handler() {
    static CountedPtr<KestDeviceItemHandler> handler = MakeCounted<KestDeviceItemHandler>();
    return *handler;
}

// Text made of printable ASCII, host-name characters or arbitrary 32-bit units.
std::wstring ConsumeText(FuzzedDataProvider& input) {
    static const char kHostNameCharacters[] = "abcXYZ019-.";
    const int mode = input.ConsumeIntegralInRange<int>(0, 2);
    const size_t length = input.ConsumeIntegralInRange<size_t>(0, 80);
    std::wstring text;
    for (size_t i = 0; i < length; ++i) {
        const wchar_t unit =
            mode == 0   ? static_cast<wchar_t>(input.ConsumeIntegralInRange<int>(0x20, 0x7E))
            : mode == 1 ? static_cast<wchar_t>(input.PickValueInArray(kHostNameCharacters))
                        : static_cast<wchar_t>(input.ConsumeIntegral<uint32_t>());
        if (unit != L'\0') {
            text += unit;
        }
    }
    return text;
}

// A value of the tag's own type (mostly) or of another.
void SetChange(FuzzedDataProvider& input, IuxSysPropertyBag4* bag, uint32_t tag) {
    switch (input.ConsumeIntegralInRange<int>(0, 5)) {
        case 0:
            bag->SetBool(tag, input.ConsumeIntegral<int32_t>());
            break;
        case 1:
            bag->SetLong(tag, input.ConsumeIntegral<int32_t>());
            break;
        case 2: {
            uxSysAttrTimestampUTC time{};
            time.fraction = input.ConsumeIntegral<uint64_t>();
            time.seconds = input.ConsumeIntegral<int64_t>();
            bag->SetTimestamp(tag, time);
            break;
        }
        default:
            bag->SetString(tag, ConsumeText(input).c_str());
            break;
    }
}

HRESULT ExpectedHostName(const std::string& name) {
    if (name.empty() || name.size() > 63) {
        return UX_E_VALUE_INVALID;
    }
    bool allDigits = true;
    for (size_t i = 0; i < name.size(); ++i) {
        const bool end = i == 0 || i == name.size() - 1;
        const char c = name[i];
        const bool alphanumeric =
            (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
        if (!alphanumeric && (end || c != '-')) {
            return UX_E_HOSTNAME_INVALID;
        }
        allDigits = allDigits && name[i] >= '0' && name[i] <= '9';
    }
    return allDigits ? UX_E_HOSTNAME_INVALID : S_OK;
}

std::wstring StringIn(IuxSysPropertyBag4* bag, uint32_t tag) {
    CvqBStrHolder text;
    FUZZ_CHECK(bag->GetString(tag, text.Receive()) == S_OK);
    return std::wstring(text.Get(), CvqBStrLength(text.Get()));
}

// The verdict of one modified tag: S_OK accepted, S_FALSE ignored, a failure, or nothing when
// the rules here do not predict it.
bool PredictTag(IuxSysPropertyBag4* bag, uint32_t tag, HRESULT* verdict) {
    uint32_t type = 0;
    FUZZ_CHECK(bag->GetTagType(tag, &type) == S_OK);
    switch (tag) {
        case tag::kHostName:
        case tag::kComment:
        case tag::kLocaleCode: {
            if (type != UX_PROPERTY_TYPE_STRING) {
                *verdict = UX_E_PROPERTY_TYPE_MISMATCH;
                return true;
            }
            const std::wstring text = StringIn(bag, tag);
            if (tag == tag::kHostName) {
                *verdict = ExpectedHostName(vq::dsc::NarrowFromWide(text));
            } else if (tag == tag::kComment) {
                const std::string narrow = vq::dsc::NarrowFromWide(text);
                const bool control = std::any_of(narrow.begin(), narrow.end(), [](char c) {
                    return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
                });
                *verdict = narrow.size() > 64 || control ? UX_E_VALUE_INVALID : S_OK;
            } else {
                const bool supported = text == L"en" || text == L"de" || text == L"fr";
                *verdict = supported ? S_OK : UX_E_VALUE_INVALID;
            }
            return true;
        }
        case tag::kWebServiceEnabled:
            *verdict = type == UX_PROPERTY_TYPE_BOOL ? S_OK : UX_E_PROPERTY_TYPE_MISMATCH;
            return true;
        case tag::kCurrentTime:
        case tag::kLegacyTimeZone:
        case tag::kOlsonTimeZone:
            return false;
        default:
            *verdict = S_FALSE;
            return true;
    }
}

void CheckAgainstPrediction(IuxSysPropertyBag4* bag, HRESULT status,
                            const std::set<uint32_t>& validated, CvqBStr message) {
    CountedPtr<IuxSysEnumPropertyTag> modified;
    if (bag->GetModifiedTagEnumerator(modified.Receive()) == S_FALSE) {
        FUZZ_CHECK(status == S_FALSE && validated.empty() && message == nullptr);
        return;
    }
    std::set<uint32_t> accepted;
    uint32_t tag = 0;
    while (modified->Next(1, &tag, nullptr) == S_OK) {
        HRESULT verdict = S_OK;
        if (!PredictTag(bag, tag, &verdict)) {
            return;
        }
        if (verdict < 0) {
            FUZZ_CHECK(status == verdict);
            FUZZ_CHECK(validated == accepted);
            const bool rulesMessage = verdict != UX_E_PROPERTY_TYPE_MISMATCH;
            FUZZ_CHECK(rulesMessage == (message != nullptr));
            return;
        }
        if (verdict == S_OK) {
            accepted.insert(tag);
        }
    }
    FUZZ_CHECK(status == S_OK && validated == accepted && message == nullptr);
}

// The simulated controller's files, in a sysroot that lives as long as the process.
const kest::test::TempSysroot sysroot;

}  // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/) {
    sysroot.WriteFile("/etc/korvane/version", "22.5.0\n");
    sysroot.WriteFile("/var/lib/vqtargetcfg/state.ini",
                      "[System]\nHostName = kest-01\nLanguageName = English\n"
                      "SupportedLanguages = English,German,French\nTimeZone = Europe/Berlin\n");
    sysroot.WriteFile("/usr/share/vqsysapi/timezone.ini",
                      "[LegacyToOlson]\nCST6CDT = America/Chicago\n"
                      "[OlsonToLegacy]\nAmerica/Chicago = CST6CDT\n");
    sysroot.WriteFile("/usr/share/zoneinfo/Europe/Berlin", "TZif");
    sysroot.WriteFile("/usr/share/zoneinfo/America/Chicago", "TZif");
    Handler();
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static int iterations = 0;
    if (++iterations % kIterationsPerLogTruncation == 0) {
        truncate(sysroot.PathOf(kCallLog).c_str(), 0);
    }
    FuzzedDataProvider input(data, size);
    const CountedPtr<IuxSysPropertyBag4> changes = CreatePropertyBag();
    while (input.remaining_bytes() > 0) {
        const uint32_t tag = input.PickValueInArray(kTags);
        if (input.ConsumeIntegralInRange<int>(0, 7) == 0) {
            changes->ClearModified(tag, nullptr);
        } else {
            SetChange(input, changes.Get(), tag);
        }
    }
    std::set<uint32_t> validated;
    CvqBStrHolder message;
    const HRESULT status =
        Handler().ValidatePropertyChanges(changes.Get(), validated, message.Receive());
    CheckAgainstPrediction(changes.Get(), status, validated, message.Get());
    return 0;
}
