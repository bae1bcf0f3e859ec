// CuxNetConfigExpert's import operations: which properties of an item a saved configuration may
// set, and which items correspond to an item described in it.
#include <new>
#include <utility>

#include "expert/CuxNetConfigExpert.h"
#include "property/ItemNameEnumerator.h"
#include "property/PropertyTagEnumerator.h"
#include "support/EntryGuard.h"
#include "support/StatusHolder.h"
#include "support/TraceGate.h"
#include "uxsys/HostString.h"

using namespace kest::property;

HRESULT CuxNetConfigExpert::GetImportableTags(const wchar_t* item, IuxSysEnumPropertyTag** tags) {
    TraceIfEnabled("CuxNetConfigExpert::GetImportableTags()", kTraceEntry);
    if (item == nullptr || tags == nullptr) {
        return E_POINTER;
    }
    *tags = nullptr;
    return GuardEntryPoint("Error getting importable tags", [&]() -> HRESULT {
        CountedPtr<ItemHandler> handler = ItemManager().GetItemHandler(item);
        PropertyTagSet importable;
        StatusHolder status;
        status = handler->GetImportableTags(importable);
        if (importable.empty()) {
            TraceIfEnabled("Empty importable tag set", kTraceErrors);
            return S_FALSE;
        }
        *tags = CreatePropertyTagEnumerator(importable).Detach();
        return S_OK;
    });
}

HRESULT CuxNetConfigExpert::GetMatchingItems(IuxSysPropertyBag* description, CvqBStr* exactName,
                                             IuxSysEnumStringList** names, void** reserved) {
    TraceIfEnabled("CuxNetConfigExpert::GetMatchingItems()", kTraceEntry);
    if (description == nullptr || exactName == nullptr || names == nullptr || reserved == nullptr) {
        return E_POINTER;
    }
    *exactName = nullptr;
    *names = nullptr;
    *reserved = nullptr;
    return GuardEntryPoint("Error getting matching items", [&]() -> HRESULT {
        ItemNameList matching;
        for (const CountedPtr<ItemHandler>& handler : ItemManager().GetItemHandlers(true)) {
            bool exactMatch = false;
            if (!handler->IsMatchingItem(description, exactMatch)) {
                continue;
            }
            matching.push_back(handler->ItemName());
            if (exactMatch) {
                // A later exact match replaces an earlier one.
                CvqBStr name =
                    CvqBStrAllocLen(handler->ItemName().c_str(), handler->ItemName().size());
                if (name == nullptr) {
                    throw static_cast<long>(E_OUTOFMEMORY);
                }
                CvqBStrFree(std::exchange(*exactName, name));
            }
        }
        *names = CreateItemNameEnumerator(std::move(matching)).Detach();
        return S_OK;
    });
}
