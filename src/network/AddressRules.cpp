#include "network/AddressRules.h"

namespace kest::network {

namespace {

// True when the host part of `address` under `mask` is all 0 or all 1.
bool IsReservedHostPart(uint32_t address, uint32_t mask) {
    const uint32_t hostPart = address & ~mask;
    return hostPart == 0 || hostPart == ~mask;
}

}  // namespace

bool IsContiguousSubnetMask(uint32_t mask) {
    uint32_t rest = mask;
    while ((rest & 0x80000000u) != 0) {
        rest <<= 1;
    }
    return rest == 0;
}

AddressPairFault CheckAddressAndGateway(uint32_t address, uint32_t mask, uint32_t gateway) {
    if (IsReservedHostPart(address, mask)) {
        return AddressPairFault::kAddressHostPart;
    }
    if (gateway == 0) {
        return AddressPairFault::kNone;
    }
    if (IsReservedHostPart(gateway, mask)) {
        return AddressPairFault::kGatewayHostPart;
    }
    if (((address ^ gateway) & mask) != 0) {
        return AddressPairFault::kDifferentSubnets;
    }
    return AddressPairFault::kNone;
}

}  // namespace kest::network
