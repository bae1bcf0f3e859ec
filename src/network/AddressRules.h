// Rules for a static IPv4 configuration: the shape of a subnet mask and how an address and its
// gateway must relate under it. Values are in host byte order.
#pragma once

#include <cstdint>

namespace kest::network {

// True when the mask's one-bits run contiguously from the top bit (0.0.0.0 included).
bool IsContiguousSubnetMask(uint32_t mask);

// The first rule that an address and gateway under a mask break.
enum class AddressPairFault {
    kNone,
    // The address's host part is all 0 or all 1.
    kAddressHostPart,
    // The gateway's host part is all 0 or all 1.
    kGatewayHostPart,
    // Address and gateway lie in different subnets.
    kDifferentSubnets,
};

// Checks the address first, then the gateway; a gateway of 0.0.0.0 (none) passes its checks.
AddressPairFault CheckAddressAndGateway(uint32_t address, uint32_t mask, uint32_t gateway);

}  // namespace kest::network
