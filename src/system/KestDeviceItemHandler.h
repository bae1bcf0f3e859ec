// The handler of the system item: the chassis itself, always the first item. It reports the
// controller's identity and settings and validates and applies changes to host name, comment,
// locale, time zone, clock and the web-service switch.
#pragma once

#include <cstdint>
#include <map>
#include <string>

#include "items/ItemHandler.h"
#include "support/Mutex.h"
#include "system/KestConfigIni.h"
#include "system/SystemTimeAssistant.h"
#include "vq/targetcfg/Types.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: any thread may call at once; GetItemProperties, ValidatePropertyChanges and
// PersistPropertyChanges hold mutex_ throughout, RefreshProperties takes it through
// GetItemProperties, and the owned time assistant and web-service settings are used only under it.
class KestDeviceItemHandler : public ItemHandler {
  public:
    // The item name and the second name of the system item.
    static constexpr const wchar_t* kItemName = L"VQ KEST Chassis";

    // Reads the firmware version file and the supported languages. Throws E_FAIL (a long) when
    // the version file cannot be read.
    KestDeviceItemHandler();

    // Writes the common rows and the system item's catalogue. E_POINTER for a null bag; the
    // first failing write or library call ends it with its status (earlier rows stay written).
    HRESULT GetItemProperties(IuxSysPropertyBag* bag) override;
    // Writes the DNS name and the current time when requested (tags compared without their low
    // 12 bits), then the whole catalogue.
    HRESULT RefreshProperties(uint32_t count, const uint32_t* tags,
                              IuxSysPropertyBag* bag) override;
    // Checks each modified setting of `changes`, adding accepted tags to `validated`; the first
    // rejection ends the walk with its status and, when `message` is given, its message. S_FALSE
    // when nothing is modified.
    HRESULT ValidatePropertyChanges(IuxSysPropertyBag* changes, PropertyTagSet& validated,
                                    CvqBStr* message) override;
    // Checks the changes as ValidatePropertyChanges does (a rejection is returned and nothing is
    // applied), then applies each modified setting of `changes` in tag order and the clock last;
    // sets `persistFlag` to 1 after host-name, locale and web-service changes. S_FALSE when
    // nothing is modified; the first failure ends the walk (earlier changes stay applied).
    HRESULT PersistPropertyChanges(IuxSysPropertyBag* changes, int32_t& persistFlag,
                                   CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler,
                                   bool& adapterDisabled) override;

  protected:
    ~KestDeviceItemHandler() override;

  private:
    // The locale codes of `languageNames` joined by `separator`, in the given order. A name
    // missing from the language table adds an empty code (and becomes a row with an empty code);
    // an empty name ends the list.
    std::wstring GetLangCodes(const vq::dsc::Vector<vq::targetcfg::NarrowString>& languageNames,
                              const std::wstring& separator);
    // Writes catalogue rows 1 to 28; failures are thrown.
    void WriteCatalogue(IuxSysPropertyBag* bag);
    // Checks one modified tag: S_OK accepted, S_FALSE not a setting of this item, else the
    // rejection status (with the message stored). Read failures are thrown.
    HRESULT ValidateChange(uint32_t tag, IuxSysPropertyBag* bag, CvqBStr* message);
    // Applies one modified tag other than the current time; failures are thrown.
    void PersistChange(uint32_t tag, IuxSysPropertyBag* bag, int32_t& persistFlag);

    std::wstring firmwareVersion_;
    std::wstring localeCodes_;
    std::map<std::string, std::wstring> languageTable_;
    vq::dsc::Mutex mutex_;
    SystemTimeAssistant timeAssistant_;
    KestConfigIni webServiceSettings_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
