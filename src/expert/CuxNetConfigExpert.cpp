#include "expert/CuxNetConfigExpert.h"

#include <new>
#include <utility>

#include "expert/DiagnosticsSettings.h"
#include "property/CuxDynamicPropertyBag.h"
#include "property/HostStringResult.h"
#include "property/ItemNameEnumerator.h"
#include "property/PropertyTagEnumerator.h"
#include "support/EntryGuard.h"
#include "support/Exceptions.h"
#include "support/Mutex.h"
#include "support/PathHelpers.h"
#include "support/StatusHolder.h"
#include "support/Sysroot.h"
#include "support/TextConversion.h"
#include "support/TraceGate.h"
#include "trace/Tracer.h"

using namespace kest::expert;
using namespace kest::property;

namespace {
// 722d1d51-1c1d-42fe-aeef-5cf6c711ffa7
constexpr CLSID kFrameworkExpertClassId = {
    0x722d1d51, 0x1c1d, 0x42fe, {0xae, 0xef, 0x5c, 0xf6, 0xc7, 0x11, 0xff, 0xa7}};

// Other programs log there too; the sticky bit keeps each one's files its own.
constexpr mode_t kLogDirectoryMode = 01777;

// The expert lock: held by Initialize, Uninitialize and PersistPropertyChanges of every expert of
// the process. Recursive, because a failing Initialize calls Uninitialize while holding it.
vq::dsc::Mutex& ExpertLock() {
    static vq::dsc::Mutex expertLock;
    return expertLock;
}

// Creates the log directory if needed, reads the diagnostics settings and starts the tracer.
// A log directory that cannot be created or trusted leaves tracing without the log file.
void StartDiagnostics(IniFileManager& iniCache) {
    std::string logDirectory = ChooseLogDirectory();
    try {
        vq::dsc::osdep::CreateDirectories(logDirectory, kLogDirectoryMode);
    } catch (const vq::dsc::exception::Exception&) {
        logDirectory.clear();
    }
    const DiagnosticsSettings settings =
        ReadDiagnosticsSettings(iniCache, kest::paths::DiagnosticsSettingsFile());
    InitializeTracing(settings.severity, settings.target, vq::dsc::WideFromNarrow(logDirectory),
                      settings.lowDiskThreshold);
}

}  // namespace

CuxNetConfigExpert::CuxNetConfigExpert() : iniCache_(IniFileManager::GetInstance()) {}

// Members go in reverse order of declaration: the pending tasks, the item manager, the INI cache.
CuxNetConfigExpert::~CuxNetConfigExpert() = default;

HRESULT CuxNetConfigExpert::SetItemManager(const CountedPtr<ItemManagerBase>& manager) {
    if (itemManager_) {
        return S_FALSE;
    }
    itemManager_ = manager;
    return S_OK;
}

ItemManagerBase& CuxNetConfigExpert::ItemManager() const {
    if (!itemManager_) {
        throw static_cast<long>(E_FAIL);
    }
    return *itemManager_;
}

HRESULT CuxNetConfigExpert::SetPlugPlayCallback(IUnknown* /*callback*/) {
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
    try {
        vq::dsc::ScopedLock lock(ExpertLock());
        return InitializeUnderLock();
    } catch (...) {
        // Only taking the expert lock can fail here.
        return E_FAIL;
    }
}

HRESULT CuxNetConfigExpert::InitializeUnderLock() noexcept {
    if (!itemManager_) {
        return E_FAIL;
    }
    try {
        StartDiagnostics(*iniCache_);
    } catch (const std::bad_alloc&) {
        TraceIfEnabled("Not enough memory!", kTraceErrors);
        Uninitialize();
        return E_OUTOFMEMORY;
    } catch (const vq::dsc::exception::Exception& failure) {
        TraceIfEnabled(failure.what(), kTraceErrors);
        Uninitialize();
        return E_FAIL;
    } catch (...) {
        TraceIfEnabled("Uncaught exception", kTraceErrors);
        Uninitialize();
        return E_FAIL;
    }
    TraceIfEnabled("CuxNetConfigExpert::Initialize()", kTraceEntry);
    return S_OK;
}

HRESULT CuxNetConfigExpert::Uninitialize() {
    TraceIfEnabled("CuxNetConfigExpert::Uninitialize()", kTraceEntry);
    return GuardEntryPoint("Failure to uninitialize", [&]() -> HRESULT {
        vq::dsc::ScopedLock lock(ExpertLock());
        if (itemManager_) {
            itemManager_->ClearItems();
        }
        pendingTasks_.clear();
        ShutdownTracing();
        return S_OK;
    });
}

HRESULT CuxNetConfigExpert::SearchForItemsAndProperties(IuxSysSearchSink* sink) {
    static constexpr char kFailureText[] = "Failure to populate property bag.";
    TraceIfEnabled("CuxNetConfigExpert::SearchForItemsAndProperties()", kTraceEntry);
    if (sink == nullptr) {
        return E_POINTER;
    }
    return GuardEntryPoint(kFailureText, [&]() -> HRESULT {
        bool delivered = false;
        for (const CountedPtr<ItemHandler>& handler : ItemManager().GetItemHandlers(true)) {
            CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
            HRESULT status = S_OK;
            try {
                status = handler->GetItemProperties(bag.Get());
            } catch (long thrown) {
                TraceStatus(kFailureText, static_cast<HRESULT>(thrown));
                continue;
            }
            if (FAILED(status)) {
                continue;
            }
            StatusHolder sinkStatus;
            sinkStatus = sink->OnItemFound(bag.Get());
            delivered = true;
        }
        return delivered ? S_OK : S_FALSE;
    });
}

HRESULT CuxNetConfigExpert::SearchForItemNames(IuxSysEnumStringList** names) {
    TraceIfEnabled("CuxNetConfigExpert::SearchForItemNames()", kTraceEntry);
    if (names == nullptr) {
        return E_POINTER;
    }
    *names = nullptr;
    return GuardEntryPoint("Failure to populate item names", [&]() -> HRESULT {
        ItemNameList itemNames;
        for (const CountedPtr<ItemHandler>& handler : ItemManager().GetItemHandlers(true)) {
            itemNames.push_back(handler->ItemName());
        }
        *names = CreateItemNameEnumerator(std::move(itemNames)).Detach();
        return S_OK;
    });
}

HRESULT CuxNetConfigExpert::GetPropertiesOfItem(const wchar_t* item,
                                                IuxSysPropertyBag** properties) {
    TraceIfEnabled("CuxNetConfigExpert::GetPropertiesOfItem()", kTraceEntry);
    if (item == nullptr || properties == nullptr) {
        return E_POINTER;
    }
    *properties = nullptr;
    return GuardEntryPoint("Failure to get properties of item", [&]() -> HRESULT {
        CountedPtr<ItemHandler> handler = ItemManager().GetItemHandler(item);
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        StatusHolder status;
        status = handler->GetItemProperties(bag.Get());
        *properties = bag.Detach();
        return S_OK;
    });
}

HRESULT CuxNetConfigExpert::PopulateOrRefreshProperties(const wchar_t* item, uint32_t count,
                                                        const uint32_t* tags,
                                                        IuxSysPropertyBag** properties) {
    TraceIfEnabled("CuxNetConfigExpert::PopulateOrRefreshProperties()", kTraceEntry);
    if (item == nullptr || tags == nullptr || properties == nullptr) {
        return E_POINTER;
    }
    *properties = nullptr;
    return GuardEntryPoint("Error populating properties.", [&]() -> HRESULT {
        CountedPtr<ItemHandler> handler = ItemManager().GetItemHandler(item);
        CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        StatusHolder status;
        status = handler->RefreshProperties(count, tags, bag.Get());
        uint32_t present = 0;
        for (uint32_t i = 0; i < count; ++i) {
            if (bag->HasTag(tags[i]) == S_OK) {
                ++present;
            }
        }
        if (present == 0) {
            TraceIfEnabled("Didn't find any tags.", kTraceErrors);
            return UX_E_PROPERTY_NOT_FOUND;
        }
        *properties = bag.Detach();
        return present == count ? S_OK : S_FALSE;
    });
}

HRESULT CuxNetConfigExpert::ValidatePropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                                    IuxSysEnumPropertyTag** validated,
                                                    CvqBStr* message) {
    TraceIfEnabled("CuxNetConfigExpert::ValidatePropertyChanges()", kTraceEntry);
    if (message != nullptr) {
        *message = nullptr;
    }
    if (item == nullptr || changes == nullptr || validated == nullptr) {
        return E_POINTER;
    }
    *validated = nullptr;
    return GuardEntryPoint("Error validating properties", [&]() -> HRESULT {
        CountedPtr<ItemHandler> handler = ItemManager().GetItemHandler(item);
        PropertyTagSet validatedTags;
        StatusHolder status;
        status = handler->ValidatePropertyChanges(changes, validatedTags, message);
        if (validatedTags.empty()) {
            TraceIfEnabled("Empty validated tag set", kTraceErrors);
            return S_FALSE;
        }
        *validated = CreatePropertyTagEnumerator(validatedTags).Detach();
        return S_OK;
    });
}

HRESULT CuxNetConfigExpert::PersistPropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                                   int32_t* restartRequired) {
    TraceIfEnabled("CuxNetConfigExpert::PersistPropertyChanges()", kTraceEntry);
    if (item == nullptr || changes == nullptr || restartRequired == nullptr) {
        return E_POINTER;
    }
    *restartRequired = 0;
    return GuardEntryPoint("Failure to persist property changes", [&]() -> HRESULT {
        vq::dsc::ScopedLock lock(ExpertLock());
        pendingTasks_.clear();
        CountedPtr<ItemHandler> handler = ItemManager().GetItemHandler(item);
        CountedPtr<vq::targetcfg::IDeviceHandler> deviceHandler;
        bool adapterDisabled = false;
        StatusHolder status;
        status = handler->PersistPropertyChanges(changes, *restartRequired, deviceHandler,
                                                 adapterDisabled);
        status = iniCache_->FlushIniCache();
        if (handler->NeedsInterfaceRestart()) {
            // The interface restarts on the task's thread, after this answer reached the host.
            CountedPtr<IuxSysPropertyBag> clone;
            status = changes->Clone(clone.Receive());
            pendingTasks_.reserve(1);
            pendingTasks_.push_back(MakeCounted<DeferredPersistTask>(
                std::move(deviceHandler), adapterDisabled, handler,
                QueryCounted<IuxSysPropertyBag2>(clone, IID_IuxSysPropertyBag2)));
        }
        return S_OK;
    });
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
