// Status codes exchanged between the host and the plug-in.
#pragma once

#include "uxsys/Types.h"

constexpr HRESULT KestStatus(uint32_t bits) {
    return static_cast<HRESULT>(bits);
}

constexpr HRESULT S_OK = KestStatus(0x00000000u);
constexpr HRESULT S_FALSE = KestStatus(0x00000001u);
constexpr HRESULT E_NOTIMPL = KestStatus(0x80004001u);
constexpr HRESULT E_NOINTERFACE = KestStatus(0x80004002u);
constexpr HRESULT E_POINTER = KestStatus(0x80004003u);
constexpr HRESULT E_FAIL = KestStatus(0x80004005u);
constexpr HRESULT E_UNEXPECTED = KestStatus(0x8000FFFFu);
constexpr HRESULT E_OUTOFMEMORY = KestStatus(0x8007000Eu);
constexpr HRESULT E_INVALIDARG = KestStatus(0x80070057u);
constexpr HRESULT UX_E_PROPERTY_TYPE_MISMATCH = KestStatus(0x80040370u);
constexpr HRESULT UX_E_PROPERTY_NOT_FOUND = KestStatus(0x80040371u);
constexpr HRESULT UX_E_ITEM_NOT_FOUND = KestStatus(0x80040375u);
constexpr HRESULT UX_E_HOSTNAME_INVALID = KestStatus(0x8004037Au);
constexpr HRESULT UX_E_VALUE_INVALID = KestStatus(0x8004037Fu);
constexpr HRESULT UX_E_ADDRESS_COMBINATION_INVALID = KestStatus(0x80040380u);
constexpr HRESULT UX_E_FIRMWARE_ID_MISMATCH = KestStatus(0x80040381u);
constexpr HRESULT UX_E_FIRMWARE_BUSY = KestStatus(0x80040385u);
constexpr HRESULT UX_E_FIRMWARE_STATUS_FAILED = KestStatus(0x80040386u);
constexpr HRESULT UX_E_FIRMWARE_STATUS_UNEXPECTED = KestStatus(0x80040387u);
constexpr HRESULT UX_E_STATUS_0420 = KestStatus(0x80040420u);
constexpr HRESULT UX_E_IP_ADDRESS_INVALID = KestStatus(0x80040470u);
constexpr HRESULT UX_E_GATEWAY_INVALID = KestStatus(0x80040471u);
constexpr HRESULT UX_E_DNS_ADDRESS_INVALID = KestStatus(0x80040472u);
constexpr HRESULT UX_E_SUBNET_MASK_INVALID = KestStatus(0x80040473u);

constexpr bool SUCCEEDED(HRESULT status) {
    return status >= 0;
}
constexpr bool FAILED(HRESULT status) {
    return status < 0;
}
