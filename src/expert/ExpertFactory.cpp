// The plug-in's one exported function.
#include "com/CVQComObject.h"
#include "com/CountedPtr.h"
#include "expert/KestItemManager.h"
#include "expert/KestSysApiExpert.h"
#include "items/ItemManagerBase.h"
#include "support/CurrentExceptionToStatus.h"
#include "uxsys/Expert.h"

using nVQKESTSYSAPICHASSISEXPERT100::KestItemManager;
using nVQKESTSYSAPICHASSISEXPERT100::KestSysApiExpert;

namespace {

// Gives `expert` the process-wide item manager, creating the manager on first use. Failures
// become status codes: nothing escapes the exported function.
HRESULT InstallItemManager(KestSysApiExpert& expert) noexcept {
    try {
        expert.SetItemManager(ItemManagerBase::GetInstance<KestItemManager>(true));
        return S_OK;
    } catch (...) {
        try {
            return CurrentExceptionToStatus();
        } catch (...) {
            return E_FAIL;
        }
    }
}

}  // namespace

extern "C" HRESULT createKestSysApiChassisExpert(IuxSysExpert3** expert) {
    if (expert == nullptr) {
        return E_POINTER;
    }
    *expert = nullptr;
    CVQComObject<KestSysApiExpert>* created = nullptr;
    HRESULT status = CreateComObjectInstance<KestSysApiExpert>(&created);
    if (FAILED(status)) {
        return status;
    }
    CountedPtr<CVQComObject<KestSysApiExpert>> object(created);
    status = InstallItemManager(*object);
    if (FAILED(status)) {
        return status;
    }
    *expert = object.Detach();
    return S_OK;
}
