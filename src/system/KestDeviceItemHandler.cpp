#include "system/KestDeviceItemHandler.h"

#include <cstdio>
#include <memory>

#include "items/LibraryCall.h"
#include "kest/ChassisTags.h"
#include "property/BagAccess.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/StatusHolder.h"
#include "support/Sysroot.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "vq/targetcfg/Network.h"
#include "vq/targetcfg/System.h"

using namespace kest::items;
using namespace kest::property;

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

namespace targetsystem = vq::targetcfg::system;
using vq::dsc::WideFromNarrow;
using vq::targetcfg::NarrowString;

constexpr wchar_t kUnknownFirmwareVersion[] = L"UNKNOWN";
// The first line of the version file is kept up to this size, terminating zero included.
constexpr int kVersionLineBufferSize = 256;
constexpr char kDescriptionPrefix[] = "VQ ";
constexpr wchar_t kVendorName[] = L"Korvane";
constexpr uint32_t kProductCode = 0x1092;
constexpr wchar_t kConfigurationFilePattern[] = L"*.cfg";

struct FileCloser {
    void operator()(FILE* file) const { std::fclose(file); }
};

// The first line of the firmware version file, without its line end; E_FAIL (a long) when the
// file cannot be opened or read.
std::wstring ReadFirmwareVersion() {
    std::unique_ptr<FILE, FileCloser> file(std::fopen(kest::paths::VersionFile().c_str(), "re"));
    if (!file) {
        throw static_cast<long>(E_FAIL);
    }
    char line[kVersionLineBufferSize] = {};
    if (std::fgets(line, sizeof(line), file.get()) == nullptr && std::ferror(file.get()) != 0) {
        throw static_cast<long>(E_FAIL);
    }
    std::string version(line);
    const size_t newline = version.find('\n');
    if (newline != std::string::npos) {
        version.erase(newline);
    }
    return WideFromNarrow(version);
}

// The device description as reported: "VQ " in front unless it already starts with it.
std::wstring ReportedDescription(const std::string& description) {
    if (description.compare(0, 3, kDescriptionPrefix) == 0) {
        return WideFromNarrow(description);
    }
    return WideFromNarrow(kDescriptionPrefix + description);
}

// The serial number as eight upper-case hexadecimal digits.
std::wstring ReportedSerialNumber(uint32_t serialNumber) {
    char text[11];
    std::snprintf(text, sizeof(text), "%08X", serialNumber);
    return WideFromNarrow(text);
}

void SetString(StatusHolder& status, IuxSysPropertyBag* bag, uint32_t tag,
               const std::wstring& value) {
    status = bag->SetString(tag, value.c_str());
}

}  // namespace

KestDeviceItemHandler::KestDeviceItemHandler()
    : ItemHandler(kItemName, kItemName, kNumericAttribute),
      firmwareVersion_(kUnknownFirmwareVersion) {
    TraceIfEnabled("KestDeviceItemHandler", kTraceEntry);
    firmwareVersion_ = ReadFirmwareVersion();
    languageTable_.emplace("English", L"en");
    languageTable_.emplace("German", L"de");
    languageTable_.emplace("French", L"fr");
    languageTable_.emplace("Chinese", L"zh");
    languageTable_.emplace("Korean", L"kr");
    languageTable_.emplace("Japanese", L"ja");
    vq::dsc::Vector<NarrowString> languageNames;
    targetsystem::GetSupportedLanguages(languageNames);
    localeCodes_ = GetLangCodes(languageNames, L",");
}

KestDeviceItemHandler::~KestDeviceItemHandler() {
    TraceIfEnabled("~KestDeviceItemHandler", kTraceEntry);
}

std::wstring KestDeviceItemHandler::GetLangCodes(const vq::dsc::Vector<NarrowString>& languageNames,
                                                 const std::wstring& separator) {
    TraceIfEnabled("GetLangCodes", kTraceEntry);
    std::wstring codes;
    bool first = true;
    for (const NarrowString& name : languageNames) {
        if (name.empty()) {
            break;
        }
        if (!first) {
            codes += separator;
        }
        first = false;
        codes += languageTable_[name.str()];
    }
    return codes;
}

HRESULT KestDeviceItemHandler::GetItemProperties(IuxSysPropertyBag* bag) {
    vq::dsc::ScopedLock lock(mutex_);
    TraceIfEnabled("GetItemProperties", kTraceEntry);
    if (bag == nullptr) {
        return E_POINTER;
    }
    try {
        StatusHolder status;
        status = ItemHandler::GetItemProperties(bag);
        WriteCatalogue(bag);
        return S_OK;
    } catch (...) {
        return CurrentExceptionToStatus();
    }
}

void KestDeviceItemHandler::WriteCatalogue(IuxSysPropertyBag* bag) {
    StatusHolder status;
    status = bag->SetBool(kest::tag::kChassisFixedBool1, 1);
    status = bag->SetBool(kest::tag::kItemFixedBool, 1);
    status = bag->SetLong(kest::tag::kItemFixedLong2, 1);
    status = bag->SetULong(kest::tag::kItemFixedULong2, 4);
    status = bag->SetLong(kest::tag::kChassisFixedLong1, 1);
    status = bag->SetULong(kest::tag::kChassisFixedULong1, 0);

    // One narrow string carries the description, then the target class, then the host name.
    NarrowString text;
    ThrowIfLibraryCallFailed(targetsystem::GetDeviceDescription(text));
    SetString(status, bag, kest::tag::kDeviceDescription, ReportedDescription(text.str()));
    uint32_t targetId = 0;
    targetsystem::GetTargetID(targetId);
    status = bag->SetULong(kest::tag::kTargetId, targetId);
    ThrowIfLibraryCallFailed(targetsystem::GetTargetClass(text));
    SetString(status, bag, kest::tag::kTargetClass, WideFromNarrow(text.str()));
    status = bag->SetBool(kest::tag::kChassisFixedBool2, 1);
    SetString(status, bag, kest::tag::kVendorName, kVendorName);
    status = bag->SetULong(kest::tag::kChassisFixedULong2, kProductCode);
    uint32_t serialNumber = 0;
    targetsystem::GetSerialNumber(serialNumber);
    SetString(status, bag, kest::tag::kSerialNumber, ReportedSerialNumber(serialNumber));
    ThrowIfLibraryCallFailed(targetsystem::GetHostName(text));
    SetString(status, bag, kest::tag::kHostName, WideFromNarrow(text.str()));
    vq::targetcfg::WideString comment;
    targetsystem::GetUserComment(comment);
    status = bag->SetString(kest::tag::kComment, comment.c_str());

    // A current language outside the table raises std::out_of_range (E_FAIL at the boundary).
    NarrowString languageName;
    targetsystem::GetLanguageName(languageName);
    SetString(status, bag, kest::tag::kLocaleCode, languageTable_.at(languageName.str()));
    SetString(status, bag, kest::tag::kSupportedLocaleCodes, localeCodes_);
    status = bag->SetLong(kest::tag::kTimeZoneOffset, targetsystem::GetTimezoneOffset());
    SetString(status, bag, kest::tag::kLegacyTimeZone,
              WideFromNarrow(timeAssistant_.GetLegacyTimeZone()));
    SetString(status, bag, kest::tag::kOlsonTimeZone,
              WideFromNarrow(timeAssistant_.GetOlsonTimeZone()));
    status = bag->SetBool(kest::tag::kChassisFixedBool3, 1);
    SetString(status, bag, kest::tag::kFirmwareVersion, firmwareVersion_);
    status = bag->SetLong(kest::tag::kChassisFixedLong2, 0);
    status = bag->SetBool(kest::tag::kChassisFixedBool4, 1);
    SetString(status, bag, kest::tag::kConfigurationFilePattern, kConfigurationFilePattern);
    status = bag->SetBool(kest::tag::kChassisFixedBool5, 0);
    status = bag->SetBool(kest::tag::kChassisFixedBool6, 0);
    status = bag->SetBool(kest::tag::kWebServiceEnabled,
                          webServiceSettings_.IsWebServiceEnabled() ? 1 : 0);
}

HRESULT KestDeviceItemHandler::RefreshProperties(uint32_t count, const uint32_t* tags,
                                                 IuxSysPropertyBag* bag) {
    TraceIfEnabled("RefreshProperties", kTraceEntry);
    if (bag == nullptr || (count != 0 && tags == nullptr)) {
        return E_POINTER;
    }
    try {
        StatusHolder status;
        bool timeRequested = false;
        NarrowString dnsName;
        for (uint32_t i = 0; i < count; ++i) {
            const uint32_t requested = tags[i] & kest::tag::kRefreshMask;
            if (requested == kest::tag::kDnsName) {
                ThrowIfLibraryCallFailed(vq::targetcfg::network::GetFullyQualifiedDNSName(dnsName));
                SetString(status, bag, kest::tag::kDnsName, WideFromNarrow(dnsName.str()));
            } else if (requested == kest::tag::kCurrentTime) {
                timeRequested = true;
            }
        }
        const vq::dsc::AbsTime now = vq::dsc::AbsTime::Now();
        if (timeRequested) {
            const bool valid = now.seconds != vq::dsc::AbsTime::Invalid().seconds;
            status = QueryPropertyBag2(bag)->SetTimestamp(
                kest::tag::kCurrentTime, valid ? now.ToTimestamp() : uxSysAttrTimestampUTC{0, 0});
        }
    } catch (...) {
        return CurrentExceptionToStatus();
    }
    return GetItemProperties(bag);
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
