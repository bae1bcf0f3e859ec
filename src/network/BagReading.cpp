#include "network/BagReading.h"

#include "support/StatusHolder.h"
#include "uxsys/StatusCodes.h"

uint32_t ReadULong(IuxSysPropertyBag* bag, uint32_t tag, uint32_t preset) {
    StatusHolder status;
    uint32_t value = preset;
    status = bag->GetULong(tag, &value);
    return value;
}

CountedPtr<IuxSysEnumPropertyTag> ModifiedTags(IuxSysPropertyBag* bag) {
    const CountedPtr<IuxSysPropertyBag2> bag2 = QueryCounted<IuxSysPropertyBag2>(
        CountedPtr<IuxSysPropertyBag>(bag), IID_IuxSysPropertyBag2);
    if (!bag2) {
        throw static_cast<long>(E_NOINTERFACE);
    }
    StatusHolder status;
    CountedPtr<IuxSysEnumPropertyTag> tags;
    status = bag2->GetModifiedTagEnumerator(tags.Receive());
    return tags;
}
