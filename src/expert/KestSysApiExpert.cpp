#include "expert/KestSysApiExpert.h"

#include "property/HostStringResult.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/Sysroot.h"
#include "support/TraceGate.h"

using namespace kest::property;

namespace nVQKESTSYSAPICHASSISEXPERT100 {

namespace {
// 999d9aa4-5475-4ca7-a560-93c51b5bfceb
constexpr CLSID kKestExpertClassId = {
    0x999d9aa4, 0x5475, 0x4ca7, {0xa5, 0x60, 0x93, 0xc5, 0x1b, 0x5b, 0xfc, 0xeb}};
}  // namespace

// Members go in reverse order of declaration: the callback, then the firmware update.
KestSysApiExpert::~KestSysApiExpert() = default;

HRESULT KestSysApiExpert::GetExpertClassId(GUID* classId) {
    TraceIfEnabled("KestSysApiExpert::GetExpertClassId()", kTraceEntry);
    if (classId == nullptr) {
        return E_POINTER;
    }
    *classId = kKestExpertClassId;
    return S_OK;
}

HRESULT KestSysApiExpert::GetExpertDisplayName(CvqBStr* name) {
    TraceIfEnabled("KestSysApiExpert::GetExpertDisplayName()", kTraceEntry);
    return StoreNewHostString(L"KEST Configuration", name);
}

HRESULT KestSysApiExpert::Initialize() {
    const HRESULT status = CuxNetConfigExpert::Initialize();
    if (FAILED(status)) {
        return status;
    }
    try {
        firmwareUpdate_.SetStagingPath(kest::paths::FirmwareStagingFile());
    } catch (...) {
        const HRESULT failure = CurrentExceptionToStatus();
        CuxNetConfigExpert::Uninitialize();
        return failure;
    }
    return S_OK;
}

HRESULT KestSysApiExpert::Uninitialize() {
    const HRESULT status = CuxNetConfigExpert::Uninitialize();
    const HRESULT waited = firmwareUpdate_.WaitForWorker();
    firmwareUpdate_.ReleasePreparedUpdate();
    return FAILED(waited) ? waited : status;
}

HRESULT KestSysApiExpert::SetPlugPlayCallback(IUnknown* callback) {
    TraceIfEnabled("KestSysApiExpert::SetPlugPlayCallback()", kTraceEntry);
    plugPlayCallback_ = CountedPtr<IUnknown>(callback);
    return S_OK;
}

HRESULT KestSysApiExpert::PrepareFirmwareUpdate(const wchar_t* /*item*/, uint32_t /*flags*/,
                                                uint32_t imageSize, CvqBStr* updateId) {
    TraceIfEnabled("KestSysApiExpert::PrepareFirmwareUpdate()", kTraceEntry);
    return firmwareUpdate_.Prepare(imageSize, updateId);
}

HRESULT KestSysApiExpert::StartFirmwareUpdate(const wchar_t* /*item*/, const wchar_t* updateId,
                                              uint32_t /*flags*/, void* /*reserved*/,
                                              IUnknown* imageSource) {
    TraceIfEnabled("KestSysApiExpert::StartFirmwareUpdate()", kTraceEntry);
    return firmwareUpdate_.Start(updateId, imageSource);
}

HRESULT KestSysApiExpert::ReservedFirmware5() {
    return E_NOTIMPL;
}

HRESULT KestSysApiExpert::ReservedFirmware6() {
    return E_NOTIMPL;
}

HRESULT KestSysApiExpert::GetFirmwareUpdateStatus(const wchar_t* /*item*/, int32_t* state,
                                                  int32_t* percent) {
    TraceIfEnabled("KestSysApiExpert::GetFirmwareUpdateStatus()", kTraceEntry);
    return firmwareUpdate_.GetStatus(state, percent);
}

HRESULT KestSysApiExpert::HandleFrameworkNotification(uint32_t /*notification*/,
                                                      IUnknown* /*details*/) {
    return E_NOTIMPL;
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
