#include "StatusNames.h"

#include "hostkit/HostText.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

struct NamedStatus {
    HRESULT status;
    const char* name;
};

#define KEST_NAMED_STATUS(name) \
    { name, #name }

constexpr NamedStatus kNamedStatuses[] = {
    KEST_NAMED_STATUS(S_OK),
    KEST_NAMED_STATUS(S_FALSE),
    KEST_NAMED_STATUS(E_NOTIMPL),
    KEST_NAMED_STATUS(E_NOINTERFACE),
    KEST_NAMED_STATUS(E_POINTER),
    KEST_NAMED_STATUS(E_FAIL),
    KEST_NAMED_STATUS(E_UNEXPECTED),
    KEST_NAMED_STATUS(E_OUTOFMEMORY),
    KEST_NAMED_STATUS(E_INVALIDARG),
    KEST_NAMED_STATUS(UX_E_PROPERTY_TYPE_MISMATCH),
    KEST_NAMED_STATUS(UX_E_PROPERTY_NOT_FOUND),
    KEST_NAMED_STATUS(UX_E_ITEM_NOT_FOUND),
    KEST_NAMED_STATUS(UX_E_HOSTNAME_INVALID),
    KEST_NAMED_STATUS(UX_E_VALUE_INVALID),
    KEST_NAMED_STATUS(UX_E_ADDRESS_COMBINATION_INVALID),
    KEST_NAMED_STATUS(UX_E_FIRMWARE_ID_MISMATCH),
    KEST_NAMED_STATUS(UX_E_FIRMWARE_BUSY),
    KEST_NAMED_STATUS(UX_E_FIRMWARE_STATUS_FAILED),
    KEST_NAMED_STATUS(UX_E_FIRMWARE_STATUS_UNEXPECTED),
    KEST_NAMED_STATUS(UX_E_STATUS_0420),
    KEST_NAMED_STATUS(UX_E_IP_ADDRESS_INVALID),
    KEST_NAMED_STATUS(UX_E_GATEWAY_INVALID),
    KEST_NAMED_STATUS(UX_E_DNS_ADDRESS_INVALID),
    KEST_NAMED_STATUS(UX_E_SUBNET_MASK_INVALID),
};

#undef KEST_NAMED_STATUS

}  // namespace

std::string StatusName(HRESULT status) {
    for (const NamedStatus& named : kNamedStatuses) {
        if (named.status == status) {
            return named.name;
        }
    }
    return std::string();
}

std::string StatusWithName(HRESULT status) {
    const std::string name = StatusName(status);
    return name.empty() ? StatusText(status) : name + " (" + StatusText(status) + ")";
}

bool IsValueRejection(HRESULT status) {
    switch (status) {
        case UX_E_VALUE_INVALID:
        case UX_E_HOSTNAME_INVALID:
        case UX_E_ADDRESS_COMBINATION_INVALID:
        case UX_E_IP_ADDRESS_INVALID:
        case UX_E_GATEWAY_INVALID:
        case UX_E_DNS_ADDRESS_INVALID:
        case UX_E_SUBNET_MASK_INVALID:
            return true;
        default:
            return false;
    }
}

}  // namespace kest::cfg
