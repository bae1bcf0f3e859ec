// The framework expert: the primary interface chain, plug-and-play registration and the import
// operations, over the reference count shared by all of the object's interfaces.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "com/CVQComMultiThreadModelNoCS.h"
#include "com/CVQComObjectRootEx.h"
#include "com/CountedPtr.h"
#include "config/IniFileManager.h"
#include "items/DeferredPersistTask.h"
#include "items/ItemManagerBase.h"
#include "uxsys/Expert.h"

// Thread safety: any host thread may call at once. Initialize, Uninitialize and
// PersistPropertyChanges (and with it the pending tasks) hold the process-wide expert lock; the
// other entry points rely on the item manager's and the handlers' own locks. SetItemManager is
// called once, by the factory, before the expert is shared.
class CuxNetConfigExpert : public IuxSysExpert3,
                           public IuxSysExpertPlugPlay,
                           public IuxSysExpertImportExport,
                           public virtual CVQComObjectRootEx<CVQComMultiThreadModelNoCS> {
  public:
    ~CuxNetConfigExpert() override;

    // Operations of this class beyond the primary chain, in the class's own slot order.
    HRESULT SetPlugPlayCallback(IUnknown* callback) override;
    HRESULT GetImportableTags(const wchar_t* item, IuxSysEnumPropertyTag** tags) override;
    HRESULT GetMatchingItems(IuxSysPropertyBag* description, CvqBStr* exactName,
                             IuxSysEnumStringList** names, void** reserved) override;
    HRESULT ReservedImportExport5() override;

    // IuxSysExpertInfo: the framework's identity; the string results are new host strings.
    HRESULT GetExpertClassId(GUID* classId) override;
    HRESULT GetExpertDisplayName(CvqBStr* name) override;
    HRESULT GetExpertVersion(CvqBStr* version) override;
    HRESULT GetExpertProgrammaticName(CvqBStr* name) override;

    // IuxSysExpert and IuxSysExpert2 entry points: each finds the item handlers in the shared
    // item manager and delegates to them; results are new objects the host releases.
    HRESULT Initialize() override;
    HRESULT Uninitialize() override;
    HRESULT SearchForItemsAndProperties(IuxSysSearchSink* sink) override;
    HRESULT SearchForItemNames(IuxSysEnumStringList** names) override;
    HRESULT GetPropertiesOfItem(const wchar_t* item, IuxSysPropertyBag** properties) override;
    HRESULT PopulateOrRefreshProperties(const wchar_t* item, uint32_t count, const uint32_t* tags,
                                        IuxSysPropertyBag** properties) override;
    HRESULT ValidatePropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                    IuxSysEnumPropertyTag** validated, CvqBStr* message) override;
    HRESULT PersistPropertyChanges(const wchar_t* item, IuxSysPropertyBag* changes,
                                   int32_t* restartRequired) override;

    // Unsupported slots of the primary chain: E_NOTIMPL, E_NOTIMPL and S_FALSE.
    HRESULT ReservedExpert13() override;
    HRESULT ReservedExpert14() override;
    HRESULT ReservedExpert17() override;

    // Installs the shared item manager: S_OK and a reference of its own when the expert has
    // none yet; S_FALSE, keeping the one it has, otherwise.
    HRESULT SetItemManager(const CountedPtr<ItemManagerBase>& manager);

  protected:
    // Takes a reference to the process-wide INI cache.
    CuxNetConfigExpert();

  private:
    // Interface restarts started by the last persist, kept until the next persist,
    // Uninitialize or destruction (whichever comes first).
    using DeferredPersistTask = kest::items::DeferredPersistTask;
    using PendingTaskList = std::vector<CountedPtr<DeferredPersistTask>>;

    // Initialize's work once the expert lock is held: the log directory, the diagnostics
    // settings and the tracer. Failures end in Uninitialize.
    HRESULT InitializeUnderLock() noexcept;
    // The installed item manager; throws E_FAIL (a long) when none is installed.
    ItemManagerBase& ItemManager() const;

    std::shared_ptr<IniFileManager> iniCache_;
    CountedPtr<ItemManagerBase> itemManager_;
    PendingTaskList pendingTasks_;
};
