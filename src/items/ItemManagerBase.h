// The process-wide owner of the item handlers: one manager per process, shared by every expert,
// holding one handler per item in discovery order and finding them by item name. A subclass
// knows how to discover the items; this base keeps the list, the lookups and the singleton.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "com/CountedPtr.h"
#include "items/ItemHandler.h"
#include "items/RefCountedThreadSafePolicy.h"
#include "support/Mutex.h"
#include "uxsys/Types.h"

// A snapshot of handlers, each held by its own reference.
using ItemHandlerList = std::vector<CountedPtr<ItemHandler>>;

// Thread safety: every operation may be called on any thread at once; the handler list and the
// process-wide manager are guarded by the item lock (ItemLock).
class ItemManagerBase : public vq::dsc::RefCountedThreadSafePolicy {
  public:
    // The process-wide manager with one more reference. When there is none and `create` is set,
    // a new Manager becomes the process-wide one; otherwise the result may be null.
    template <class Manager>
    static CountedPtr<ItemManagerBase> GetInstance(bool create) {
        return AcquireInstance(create ? &ConstructManager<Manager> : nullptr);
    }

    // Releases every handler, leaving the list empty; the next demand discovers the items again.
    virtual void ClearItems();
    // An operation kept for the manager's slot layout; no caller uses it.
    virtual HRESULT ReservedManagerOperation() = 0;
    // Re-discovers the items; returns the discovery's status.
    virtual HRESULT RefreshItems() = 0;
    // Builds the handler list when it is empty: S_OK when built, S_FALSE when already built, or
    // the failure's status (handlers appended before a failure stay).
    virtual HRESULT EnumerateItems() = 0;

    // The first handler whose item name equals `itemName` ignoring case, or null.
    CountedPtr<ItemHandler> FindItemHandler(const std::wstring& itemName);
    // As FindItemHandler, discovering the items once more on a miss; a second miss throws
    // UX_E_ITEM_NOT_FOUND as a status (long).
    CountedPtr<ItemHandler> GetItemHandler(const std::wstring& itemName);
    // A snapshot of all handlers in list order, after discovering the items when
    // `enumerateFirst` is set (the discovery's status is not consulted).
    ItemHandlerList GetItemHandlers(bool enumerateFirst);

    // True when some of the `count` tags at `tags`, with its low 12 bits cleared, is in
    // `refreshTags`.
    static bool AreTagsRequested(uint32_t count, const uint32_t* tags,
                                 const PropertyTagSet& refreshTags);

  protected:
    ItemManagerBase() = default;
    // Forgets this manager as the process-wide one, then releases every handler.
    ~ItemManagerBase() override;

    // The lock that guards the handler lists of all managers and the process-wide manager.
    static vq::dsc::Mutex& ItemLock();
    // Appends a handler; the caller holds the item lock.
    void AppendHandler(CountedPtr<ItemHandler> handler);
    // True when the list is empty; the caller holds the item lock.
    bool HasNoHandlers() const noexcept { return handlers_.empty(); }
    // Makes room for `count` handlers; the caller holds the item lock.
    void ReserveHandlers(size_t count) { handlers_.reserve(count); }

  private:
    using ManagerConstructor = CountedPtr<ItemManagerBase> (*)();

    template <class Manager>
    static CountedPtr<ItemManagerBase> ConstructManager() {
        return MakeCounted<Manager>();
    }

    static CountedPtr<ItemManagerBase> AcquireInstance(ManagerConstructor construct);
    void ReleaseHandlers() noexcept;

    ItemHandlerList handlers_;
};
