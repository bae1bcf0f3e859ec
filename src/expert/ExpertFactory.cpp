// The plug-in's one exported function.
#include "com/CVQComObject.h"
#include "com/CountedPtr.h"
#include "expert/KestSysApiExpert.h"
#include "uxsys/Expert.h"

using nVQKESTSYSAPICHASSISEXPERT100::KestSysApiExpert;

extern "C" HRESULT createKestSysApiChassisExpert(IuxSysExpert3** expert) {
    if (expert == nullptr) {
        return E_POINTER;
    }
    *expert = nullptr;
    CVQComObject<KestSysApiExpert>* created = nullptr;
    const HRESULT status = CreateComObjectInstance<KestSysApiExpert>(&created);
    if (FAILED(status)) {
        return status;
    }
    CountedPtr<CVQComObject<KestSysApiExpert>> object(created);
    *expert = object.Detach();
    return S_OK;
}
