// Validation and persistence of changes to the system item.
#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "property/BagAccess.h"
#include "property/HostStringResult.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/StatusHolder.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "system/KestDeviceItemHandler.h"
#include "system/SystemItemValidation.h"
#include "vq/targetcfg/System.h"

using namespace kest::items;
using namespace kest::property;

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

namespace targetsystem = vq::targetcfg::system;

// The verdict's status, with its message stored when it is a rejection.
HRESULT Report(const ValidationVerdict& verdict, CvqBStr* message) {
    if (!verdict.Passed()) {
        StoreValidationMessage(message, verdict.message);
    }
    return verdict.status;
}

std::string ReadNarrowString(IuxSysPropertyBag* bag, uint32_t tag) {
    std::string value;
    StatusHolder status;
    status = BagGetNarrowString(bag, tag, value);
    return value;
}

}  // namespace

HRESULT KestDeviceItemHandler::ValidatePropertyChanges(IuxSysPropertyBag* changes,
                                                       PropertyTagSet& validated,
                                                       CvqBStr* message) {
    vq::dsc::ScopedLock lock(mutex_);
    TraceIfEnabled("ValidatePropertyChanges", kTraceEntry);
    if (changes == nullptr) {
        return E_POINTER;
    }
    try {
        CountedPtr<IuxSysEnumPropertyTag> tags;
        const HRESULT listed = QueryPropertyBag2(changes)->GetModifiedTagEnumerator(tags.Receive());
        if (listed < 0) {
            return listed;
        }
        if (!tags) {
            return S_FALSE;
        }
        uint32_t tag = 0;
        while (tags->Next(1, &tag, nullptr) == S_OK) {
            const HRESULT verdict = ValidateChange(tag, changes, message);
            if (verdict < 0) {
                return verdict;
            }
            if (verdict == S_OK) {
                validated.insert(tag);
            }
        }
        return S_OK;
    } catch (...) {
        return CurrentExceptionToStatus();
    }
}

HRESULT KestDeviceItemHandler::ValidateChange(uint32_t tag, IuxSysPropertyBag* bag,
                                              CvqBStr* message) {
    StatusHolder status;
    switch (tag) {
        case kest::tag::kHostName:
            return Report(CheckHostName(ReadNarrowString(bag, tag)), message);
        case kest::tag::kComment:
            return Report(CheckComment(ReadNarrowString(bag, tag)), message);
        case kest::tag::kLocaleCode: {
            std::wstring localeCode;
            status = BagGetWideString(bag, tag, localeCode);
            return Report(CheckLocaleCode(localeCode, localeCodes_), message);
        }
        case kest::tag::kCurrentTime: {
            uxSysAttrTimestampUTC time{};
            status = QueryPropertyBag2(bag)->GetTimestamp(tag, &time);
            return Report(CheckCurrentTime(time), message);
        }
        case kest::tag::kOlsonTimeZone:
            return timeAssistant_.ValidateOlsonOrLegacyTimeZone(ReadNarrowString(bag, tag), true,
                                                                message);
        case kest::tag::kLegacyTimeZone:
            return timeAssistant_.ValidateOlsonOrLegacyTimeZone(ReadNarrowString(bag, tag), false,
                                                                message);
        case kest::tag::kWebServiceEnabled: {
            bool enabled = false;
            status = BagGetBool(bag, tag, enabled);
            return S_OK;
        }
        default:
            return S_FALSE;
    }
}

HRESULT KestDeviceItemHandler::PersistPropertyChanges(
    IuxSysPropertyBag* changes, int32_t& persistFlag,
    CountedPtr<vq::targetcfg::IDeviceHandler>& /*deviceHandler*/, bool& /*adapterDisabled*/) {
    vq::dsc::ScopedLock lock(mutex_);
    TraceIfEnabled("PersistPropertyChanges", kTraceEntry);
    if (changes == nullptr) {
        return E_POINTER;
    }
    try {
        CountedPtr<IuxSysEnumPropertyTag> tags;
        StatusHolder status;
        status = QueryPropertyBag2(changes)->GetModifiedTagEnumerator(tags.Receive());
        if (!tags) {
            return S_FALSE;
        }
        // A host may persist without validating first: what would be rejected is not written.
        PropertyTagSet checked;
        const HRESULT verdict = ValidatePropertyChanges(changes, checked, nullptr);
        if (verdict < 0) {
            return verdict;
        }

        // The clock correction uses the time zone in force before any change is applied.
        int32_t clockCorrection = 0;
        if (EnumeratorHasTag(tags.Get(), kest::tag::kLegacyTimeZone)) {
            std::wstring newLegacyText;
            BagGetWideString(changes, kest::tag::kLegacyTimeZone, newLegacyText);
            vq::targetcfg::NarrowString currentTimeZone;
            ThrowIfLibraryCallFailed(targetsystem::GetTimeZone(currentTimeZone));
            clockCorrection =
                timeAssistant_.GetLegacyOffsetDifference(currentTimeZone.str(), newLegacyText);
        }

        status = tags->Reset();
        bool clockRequested = false;
        uint32_t tag = 0;
        while (tags->Next(1, &tag, nullptr) == S_OK) {
            if (tag == kest::tag::kCurrentTime) {
                clockRequested = true;
            } else {
                PersistChange(tag, changes, persistFlag);
            }
        }
        if (clockRequested) {
            status = timeAssistant_.PersistSystemPropertyCurrentTime(changes, clockCorrection);
        }
        return S_OK;
    } catch (...) {
        return CurrentExceptionToStatus();
    }
}

void KestDeviceItemHandler::PersistChange(uint32_t tag, IuxSysPropertyBag* bag,
                                          int32_t& persistFlag) {
    StatusHolder status;
    switch (tag) {
        case kest::tag::kHostName:
            ThrowIfLibraryCallFailed(targetsystem::SetHostName(ReadNarrowString(bag, tag)));
            persistFlag = 1;
            break;
        case kest::tag::kComment:
            ThrowIfLibraryCallFailed(targetsystem::SetUserComment(ReadNarrowString(bag, tag)));
            break;
        case kest::tag::kLocaleCode:
            ThrowIfLibraryCallFailed(targetsystem::SetLanguageName(ReadNarrowString(bag, tag)));
            persistFlag = 1;
            break;
        case kest::tag::kLegacyTimeZone:
        case kest::tag::kOlsonTimeZone:
            status = timeAssistant_.PersistSystemPropertyTimezone(tag, bag, persistFlag);
            break;
        case kest::tag::kWebServiceEnabled: {
            bool enabled = false;
            status = BagGetBool(bag, tag, enabled);
            webServiceSettings_.SetWebServiceEnabled(enabled);
            persistFlag = 1;
            break;
        }
        default:
            break;
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
