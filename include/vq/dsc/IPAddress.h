// An IPv4 or IPv6 address as a plain value. Its layout is part of the binary interface with the
// controller library: 16 address bytes in network order (IPv4 uses the first four), the 32-bit
// zone index of IPv6 link-local addresses, then the family byte. The all-zero value is unset.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <type_traits>

namespace vq {
namespace dsc {
namespace osdep {

enum class IPFamily : uint8_t { Unset = 0, IPv4 = 1, IPv6 = 2 };

struct IPAddress {
    uint8_t bytes[16] = {};
    uint32_t zoneIndex = 0;
    IPFamily family = IPFamily::Unset;

    // The unset address.
    IPAddress() = default;
    // An address from raw bytes: IPv4 needs exactly 4, IPv6 exactly 16; anything else raises
    // vq::dsc::exception::InvalidArgument.
    IPAddress(const uint8_t* address, size_t count, IPFamily addressFamily);

    // Makes this the unset address.
    void Clear();
    bool IsUnset() const { return family == IPFamily::Unset; }

    // Parses dotted IPv4 text or IPv6 text (with an optional "%zone" suffix naming an interface
    // or giving a decimal index); the empty text gives the unset address. Returns false and
    // leaves the unset address when the text is no address.
    bool TryParse(const std::string& text);
    bool TryParse(const std::wstring& text);
    // As TryParse, raising vq::dsc::exception::InvalidArgument when the text is no address.
    void Parse(const std::string& text);
    void Parse(const std::wstring& text);

    // Display text: dotted decimal for IPv4, IPv6 text with "%index" for a zone, "" when unset.
    std::string ToString() const;
};

// Addresses are equal when family, zone and all bytes are.
bool operator==(const IPAddress& left, const IPAddress& right);
inline bool operator!=(const IPAddress& left, const IPAddress& right) {
    return !(left == right);
}

static_assert(std::is_trivially_copyable<IPAddress>::value, "IPAddress is copied as bytes");
static_assert(std::is_standard_layout<IPAddress>::value, "IPAddress has a fixed layout");
static_assert(offsetof(IPAddress, bytes) == 0, "address bytes come first");
static_assert(offsetof(IPAddress, zoneIndex) == 16, "zone index follows the address bytes");
static_assert(offsetof(IPAddress, family) == 20, "family byte follows the zone index");
static_assert(sizeof(IPAddress) == 24 && alignof(IPAddress) == 4, "IPAddress size and alignment");

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
