#include "property/BagAccess.h"

#include "support/StatusHolder.h"
#include "support/TextConversion.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::property {

HRESULT BagGetBool(IuxSysPropertyBag* bag, uint32_t tag, bool& value) {
    int32_t stored = 0;
    const HRESULT status = bag->GetBool(tag, &stored);
    value = stored != 0;
    return status;
}

HRESULT BagSetBool(IuxSysPropertyBag* bag, uint32_t tag, bool value) {
    return bag->SetBool(tag, value ? 1 : 0);
}

bool BagHasTag(IuxSysPropertyBag* bag, uint32_t tag) {
    return bag->HasTag(tag) == S_OK;
}

HRESULT BagGetWideString(IuxSysPropertyBag* bag, uint32_t tag, std::wstring& value) {
    CvqBStrHolder stored;
    const HRESULT status = bag->GetString(tag, stored.Receive());
    value.assign(stored.Get() != nullptr ? stored.Get() : L"", CvqBStrLength(stored.Get()));
    return status;
}

HRESULT BagGetNarrowString(IuxSysPropertyBag* bag, uint32_t tag, std::string& value) {
    std::wstring wide;
    const HRESULT status = BagGetWideString(bag, tag, wide);
    value = vq::dsc::NarrowFromWide(wide);
    return status;
}

HRESULT BagSetWideString(IuxSysPropertyBag* bag, uint32_t tag, const std::wstring& value) {
    return bag->SetString(tag, value.c_str());
}

HRESULT BagSetNarrowString(IuxSysPropertyBag* bag, uint32_t tag, const std::string& value) {
    return BagSetWideString(bag, tag, vq::dsc::WideFromNarrow(value));
}

CountedPtr<IuxSysPropertyBag2> QueryPropertyBag2(IuxSysPropertyBag* bag) {
    CountedPtr<IuxSysPropertyBag2> bag2;
    if (bag == nullptr || bag->QueryInterface(IID_IuxSysPropertyBag2, bag2.ReceiveVoid()) < 0 ||
        !bag2) {
        throw static_cast<long>(E_NOINTERFACE);
    }
    return bag2;
}

uint32_t ReadULong(IuxSysPropertyBag* bag, uint32_t tag, uint32_t preset) {
    StatusHolder status;
    uint32_t value = preset;
    status = bag->GetULong(tag, &value);
    return value;
}

CountedPtr<IuxSysEnumPropertyTag> ModifiedTags(IuxSysPropertyBag* bag) {
    StatusHolder status;
    CountedPtr<IuxSysEnumPropertyTag> tags;
    status = QueryPropertyBag2(bag)->GetModifiedTagEnumerator(tags.Receive());
    return tags;
}

bool EnumeratorHasTag(IuxSysEnumPropertyTag* tags, uint32_t tag) {
    if (tags == nullptr) {
        return false;
    }
    tags->Reset();
    uint32_t current = 0;
    while (tags->Next(1, &current, nullptr) == S_OK) {
        if (current == tag) {
            return true;
        }
    }
    return false;
}

}  // namespace kest::property
