#include "BagValues.h"

#include "ExitCodes.h"
#include "StatusNames.h"
#include "hostkit/InterfaceRef.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

HRESULT ReadBagValue(IuxSysPropertyBag2* bag, uint32_t tag, PropertyValue* value) {
    uint32_t type = 0;
    HRESULT status = bag->GetTagType(tag, &type);
    if (status < 0) {
        return status;
    }
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL: {
            int32_t flag = 0;
            status = bag->GetBool(tag, &flag);
            value->emplace<bool>(flag != 0);
            break;
        }
        case UX_PROPERTY_TYPE_LONG: {
            int32_t number = 0;
            status = bag->GetLong(tag, &number);
            value->emplace<int32_t>(number);
            break;
        }
        case UX_PROPERTY_TYPE_ULONG: {
            uint32_t number = 0;
            status = bag->GetULong(tag, &number);
            value->emplace<uint32_t>(number);
            break;
        }
        case UX_PROPERTY_TYPE_DOUBLE: {
            double number = 0;
            status = bag->GetDouble(tag, &number);
            value->emplace<double>(number);
            break;
        }
        case UX_PROPERTY_TYPE_GUID: {
            GUID guid{};
            status = bag->GetGuid(tag, &guid);
            value->emplace<GUID>(guid);
            break;
        }
        case UX_PROPERTY_TYPE_STRING: {
            CvqBStrHolder text;
            status = bag->GetString(tag, text.Receive());
            value->emplace<std::wstring>(text.Get() != nullptr ? text.Get() : L"",
                                         CvqBStrLength(text.Get()));
            break;
        }
        case UX_PROPERTY_TYPE_TIMESTAMP: {
            uxSysAttrTimestampUTC time{};
            status = bag->GetTimestamp(tag, &time);
            value->emplace<uxSysAttrTimestampUTC>(time);
            break;
        }
        default:
            return E_UNEXPECTED;
    }
    return status;
}

HRESULT WriteBagValue(IuxSysPropertyBag2* bag, uint32_t tag, const PropertyValue& value) {
    switch (TypeCodeOf(value)) {
        case UX_PROPERTY_TYPE_BOOL:
            return bag->SetBool(tag, std::get<bool>(value) ? 1 : 0);
        case UX_PROPERTY_TYPE_LONG:
            return bag->SetLong(tag, std::get<int32_t>(value));
        case UX_PROPERTY_TYPE_ULONG:
            return bag->SetULong(tag, std::get<uint32_t>(value));
        case UX_PROPERTY_TYPE_DOUBLE:
            return bag->SetDouble(tag, std::get<double>(value));
        case UX_PROPERTY_TYPE_GUID:
            return bag->SetGuid(tag, std::get<GUID>(value));
        case UX_PROPERTY_TYPE_STRING:
            return bag->SetString(tag, std::get<std::wstring>(value).c_str());
        default:
            return bag->SetTimestamp(tag, std::get<uxSysAttrTimestampUTC>(value));
    }
}

std::vector<uint32_t> RemainingTags(IuxSysEnumPropertyTag* tags) {
    std::vector<uint32_t> result;
    if (tags == nullptr) {
        return result;
    }
    for (;;) {
        uint32_t tag = 0;
        uint32_t fetched = 0;
        const HRESULT status = tags->Next(1, &tag, &fetched);
        if (status < 0) {
            throw Failure("reading a tag list failed with " + StatusWithName(status));
        }
        if (status != S_OK || fetched != 1) {
            return result;
        }
        result.push_back(tag);
    }
}

std::vector<uint32_t> AllTags(IuxSysPropertyBag* bag) {
    InterfaceRef<IuxSysEnumPropertyTag> tags;
    const HRESULT status = bag->GetTagEnumerator(tags.Receive());
    if (status < 0) {
        throw Failure("listing the tags of a property bag failed with " + StatusWithName(status));
    }
    return RemainingTags(tags.Get());
}

}  // namespace kest::cfg
