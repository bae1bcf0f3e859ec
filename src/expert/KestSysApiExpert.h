// The KEST chassis expert: the framework expert with the chassis's identity, firmware update and
// framework notifications. Created only as CVQComObject<KestSysApiExpert>.
#pragma once

#include "com/CountedPtr.h"
#include "com/InterfaceMap.h"
#include "expert/CuxNetConfigExpert.h"
#include "expert/FirmwareUpdater.h"
#include "uxsys/Expert.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: as CuxNetConfigExpert; the firmware operations go to the FirmwareUpdater, which
// guards itself.
class KestSysApiExpert : public CuxNetConfigExpert,
                         public IuxSysExpertFirmware,
                         public IuxSysFrameworkNotificationHandler {
  public:
    // QueryInterface answers the primary chain under all three expert identifiers, then
    // plug-and-play, firmware and notifications; the import operations are not handed out.
    using InterfaceMap = ComInterfaceMap<
        ComInterface<&IID_IuxSysExpert, IuxSysExpert3>,
        ComInterface<&IID_IuxSysExpert2, IuxSysExpert3>,
        ComInterface<&IID_IuxSysExpert3, IuxSysExpert3>,
        ComInterface<&IID_IuxSysExpertPlugPlay, IuxSysExpertPlugPlay>,
        ComInterface<&IID_IuxSysExpertFirmware, IuxSysExpertFirmware>,
        ComInterface<&IID_IuxSysFrameworkNotificationHandler, IuxSysFrameworkNotificationHandler>>;

    // The chassis expert's class identifier and display name.
    HRESULT GetExpertClassId(GUID* classId) override;
    HRESULT GetExpertDisplayName(CvqBStr* name) override;

    // The framework's Initialize, then the firmware staging path. A failure to set the path
    // undoes the framework's part.
    HRESULT Initialize() override;
    // The framework's Uninitialize, then waits for a running firmware update to end and lets
    // go of the controller's update lock of an update prepared but not started. E_FAIL, without
    // waiting, on the update's own worker thread.
    HRESULT Uninitialize() override;

    // Keeps one reference to `callback` (null drops the one held) and never calls it.
    HRESULT SetPlugPlayCallback(IUnknown* callback) override;

    // IuxSysExpertFirmware: announce, start and follow an update of the controller's firmware
    // (the item, flag and reserved arguments are not used); slots 5 and 6 are unsupported.
    HRESULT PrepareFirmwareUpdate(const wchar_t* item, uint32_t flags, uint32_t imageSize,
                                  CvqBStr* updateId) override;
    HRESULT StartFirmwareUpdate(const wchar_t* item, const wchar_t* updateId, uint32_t flags,
                                void* reserved, IUnknown* imageSource) override;
    HRESULT ReservedFirmware5() override;
    HRESULT ReservedFirmware6() override;
    HRESULT GetFirmwareUpdateStatus(const wchar_t* item, int32_t* state, int32_t* percent) override;

    // Framework notifications are declined: always E_NOTIMPL.
    HRESULT HandleFrameworkNotification(uint32_t notification, IUnknown* details) override;

  protected:
    KestSysApiExpert() = default;
    // Releases the plug-and-play callback, then waits for a running firmware update to end.
    ~KestSysApiExpert() override;

  private:
    FirmwareUpdater firmwareUpdate_;
    CountedPtr<IUnknown> plugPlayCallback_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
