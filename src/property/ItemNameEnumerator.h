// The enumerator over item names that the expert hands to the host: it owns the names in the
// order they were appended, and its clones share them.
// Thread safety: as every enumerator, one thread at a time; its clones may serve other threads.
#pragma once

#include <string>
#include <vector>

#include "com/CountedPtr.h"
#include "property/EnumOnSTL.h"
#include "uxsys/Enumerators.h"

using ItemNameList = std::vector<std::wstring>;

using ItemNameEnumeratorBase = CVQComEnumOnSTL<IuxSysEnumStringList, &IID_IuxSysEnumStringList,
                                               CvqBStr, ItemNameList, HostStringCopy>;

// A name enumerator that owns its names, positioned at the first one.
class CuxSysEnumItemNamesSTL : public ItemNameEnumeratorBase {
  public:
    // Takes over `names`.
    explicit CuxSysEnumItemNamesSTL(ItemNameList names);

  private:
    ItemNameList names_;
};

namespace kest::property {
// A new name enumerator with one reference, owning `names`. A failed allocation is thrown as the
// status E_OUTOFMEMORY (a long).
CountedPtr<IuxSysEnumStringList> CreateItemNameEnumerator(ItemNameList names);
}  // namespace kest::property
