#include "property/ItemNameEnumerator.h"

#include <utility>

CuxSysEnumItemNamesSTL::CuxSysEnumItemNamesSTL(ItemNameList names)
    : ItemNameEnumeratorBase(nullptr, &names_, {}), names_(std::move(names)) {
    Reset();
}

namespace kest::property {
CountedPtr<IuxSysEnumStringList> CreateItemNameEnumerator(ItemNameList names) {
    return CreateCountedComObject<CuxSysEnumItemNamesSTL>(std::move(names));
}

}  // namespace kest::property
