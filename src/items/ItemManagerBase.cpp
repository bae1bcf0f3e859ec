#include "items/ItemManagerBase.h"

#include <utility>

#include "kest/ChassisTags.h"
#include "uxsys/StatusCodes.h"

namespace {
// The process-wide manager, or null; read and written only under the item lock.
ItemManagerBase* processManager = nullptr;
}  // namespace

vq::dsc::Mutex& ItemManagerBase::ItemLock() {
    static vq::dsc::Mutex itemLock;
    return itemLock;
}

CountedPtr<ItemManagerBase> ItemManagerBase::AcquireInstance(ManagerConstructor construct) {
    vq::dsc::ScopedLock lock(ItemLock());
    // A manager whose last reference is just being dropped is not revived: its destructor is
    // waiting for the lock, and a new manager takes its place.
    if (processManager != nullptr && processManager->TryAddRef()) {
        return CountedPtr<ItemManagerBase>(processManager, kAdoptReference);
    }
    if (construct == nullptr) {
        return nullptr;
    }
    CountedPtr<ItemManagerBase> created = construct();
    processManager = created.Get();
    return created;
}

ItemManagerBase::~ItemManagerBase() {
    {
        vq::dsc::ScopedLock lock(ItemLock());
        if (processManager == this) {
            processManager = nullptr;
        }
    }
    ReleaseHandlers();
}

void ItemManagerBase::ReleaseHandlers() noexcept {
    for (CountedPtr<ItemHandler>& handler : handlers_) {
        handler.Reset();
    }
    handlers_.clear();
}

void ItemManagerBase::ClearItems() {
    vq::dsc::ScopedLock lock(ItemLock());
    ReleaseHandlers();
}

void ItemManagerBase::AppendHandler(CountedPtr<ItemHandler> handler) {
    handlers_.push_back(std::move(handler));
}

CountedPtr<ItemHandler> ItemManagerBase::FindItemHandler(const std::wstring& itemName) {
    vq::dsc::ScopedLock lock(ItemLock());
    for (const CountedPtr<ItemHandler>& handler : handlers_) {
        if (handler->HasItemName(itemName)) {
            return handler;
        }
    }
    return nullptr;
}

CountedPtr<ItemHandler> ItemManagerBase::GetItemHandler(const std::wstring& itemName) {
    // Held throughout, so another expert's ClearItems cannot empty the list between the
    // discovery and the second look.
    vq::dsc::ScopedLock lock(ItemLock());
    CountedPtr<ItemHandler> handler = FindItemHandler(itemName);
    if (handler) {
        return handler;
    }
    EnumerateItems();
    handler = FindItemHandler(itemName);
    if (!handler) {
        throw static_cast<long>(UX_E_ITEM_NOT_FOUND);
    }
    return handler;
}

ItemHandlerList ItemManagerBase::GetItemHandlers(bool enumerateFirst) {
    // Taken before the discovery, so the snapshot holds the items it found.
    vq::dsc::ScopedLock lock(ItemLock());
    if (enumerateFirst) {
        EnumerateItems();
    }
    return handlers_;
}

bool ItemManagerBase::AreTagsRequested(uint32_t count, const uint32_t* tags,
                                       const PropertyTagSet& refreshTags) {
    if (tags == nullptr) {
        return false;
    }
    for (uint32_t i = 0; i < count; ++i) {
        if (refreshTags.count(tags[i] & kest::tag::kRefreshMask) != 0) {
            return true;
        }
    }
    return false;
}
