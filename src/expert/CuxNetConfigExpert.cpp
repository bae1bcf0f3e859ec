#include "expert/CuxNetConfigExpert.h"

#include "expert/HostStringResult.h"
#include "support/TraceGate.h"

namespace {
// 722d1d51-1c1d-42fe-aeef-5cf6c711ffa7
constexpr CLSID kFrameworkExpertClassId = {
    0x722d1d51, 0x1c1d, 0x42fe, {0xae, 0xef, 0x5c, 0xf6, 0xc7, 0x11, 0xff, 0xa7}};
}  // namespace

CuxNetConfigExpert::~CuxNetConfigExpert() = default;

HRESULT CuxNetConfigExpert::SetPlugPlayCallback(IUnknown* /*callback*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::GetImportableTags(const wchar_t* /*item*/,
                                              IuxSysEnumPropertyTag** /*tags*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::GetMatchingItems(IuxSysPropertyBag* /*description*/,
                                             CvqBStr* /*exactName*/,
                                             IuxSysEnumStringList** /*names*/,
                                             void** /*reserved*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::ReservedImportExport5() {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::GetExpertClassId(GUID* classId) {
    TraceIfEnabled("CuxNetConfigExpert::GetExpertClassId()", kTraceEntry);
    if (classId == nullptr) {
        return E_POINTER;
    }
    *classId = kFrameworkExpertClassId;
    return S_OK;
}

HRESULT CuxNetConfigExpert::GetExpertDisplayName(CvqBStr* name) {
    TraceIfEnabled("CuxNetConfigExpert::GetExpertDisplayName()", kTraceEntry);
    return StoreNewHostString(L"VQ System Configuration", name);
}

HRESULT CuxNetConfigExpert::GetExpertVersion(CvqBStr* version) {
    TraceIfEnabled("CuxNetConfigExpert::GetExpertVersion()", kTraceEntry);
    return StoreNewHostString(L"22.5", version);
}

HRESULT CuxNetConfigExpert::GetExpertProgrammaticName(CvqBStr* name) {
    TraceIfEnabled("CuxNetConfigExpert::GetExpertProgrammaticName()", kTraceEntry);
    return StoreNewHostString(L"vqsyscfg", name);
}

HRESULT CuxNetConfigExpert::Initialize() {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::Uninitialize() {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::SearchForItemsAndProperties(IuxSysSearchSink* /*sink*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::SearchForItemNames(IuxSysEnumStringList** /*names*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::GetPropertiesOfItem(const wchar_t* /*item*/,
                                                IuxSysPropertyBag** /*properties*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::PopulateOrRefreshProperties(const wchar_t* /*item*/, uint32_t /*count*/,
                                                        const uint32_t* /*tags*/,
                                                        IuxSysPropertyBag** /*properties*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::ValidatePropertyChanges(const wchar_t* /*item*/,
                                                    IuxSysPropertyBag* /*changes*/,
                                                    IuxSysEnumPropertyTag** /*validated*/,
                                                    CvqBStr* /*message*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::PersistPropertyChanges(const wchar_t* /*item*/,
                                                   IuxSysPropertyBag* /*changes*/,
                                                   int32_t* /*restartRequired*/) {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::ReservedExpert13() {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::ReservedExpert14() {
    return E_NOTIMPL;
}

HRESULT CuxNetConfigExpert::ReservedExpert17() {
    return S_FALSE;
}
