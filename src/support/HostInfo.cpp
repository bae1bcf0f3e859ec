#include "support/HostInfo.h"

#include <ifaddrs.h>
#include <linux/if_packet.h>
#include <sys/socket.h>

#include <cstdio>
#include <cstring>
#include <memory>

namespace vq {
namespace dsc {
namespace osdep {
namespace {

const char kNoHardwareAddress[] = "00:00:00:00:00:00";
constexpr int kEthernetAddressLength = 6;

struct InterfaceListDeleter {
    void operator()(ifaddrs* list) const { freeifaddrs(list); }
};

bool IsAllZero(const unsigned char* bytes, int count) {
    for (int i = 0; i < count; ++i) {
        if (bytes[i] != 0) {
            return false;
        }
    }
    return true;
}

std::string FormatHardwareAddress(const unsigned char* bytes) {
    char text[sizeof("aa:bb:cc:dd:ee:ff")];
    std::snprintf(text, sizeof(text), "%02x:%02x:%02x:%02x:%02x:%02x", bytes[0], bytes[1], bytes[2],
                  bytes[3], bytes[4], bytes[5]);
    return text;
}

}  // namespace

std::string FirstAdapterHardwareAddress() {
    ifaddrs* raw = nullptr;
    if (getifaddrs(&raw) != 0) {
        return kNoHardwareAddress;
    }
    std::unique_ptr<ifaddrs, InterfaceListDeleter> list(raw);
    for (const ifaddrs* entry = list.get(); entry != nullptr; entry = entry->ifa_next) {
        if (entry->ifa_addr == nullptr || entry->ifa_addr->sa_family != AF_PACKET) {
            continue;
        }
        // Copied rather than cast: sockaddr is less strictly aligned than sockaddr_ll.
        sockaddr_ll link;
        std::memcpy(&link, entry->ifa_addr, sizeof(link));
        if (link.sll_halen == kEthernetAddressLength &&
            !IsAllZero(link.sll_addr, kEthernetAddressLength)) {
            return FormatHardwareAddress(link.sll_addr);
        }
    }
    return kNoHardwareAddress;
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
