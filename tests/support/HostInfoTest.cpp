#include "support/HostInfo.h"

#include <dirent.h>
#include <gtest/gtest.h>

#include <fstream>
#include <set>
#include <string>

namespace kest::test::support {

using vq::dsc::osdep::FirstAdapterHardwareAddress;

// The first adapter's address is one of the machine's non-zero six-byte adapter addresses, as the
// kernel lists them; only a machine without any gets the all-zero fallback.
TEST(HostInfoTest, FirstAdapterAddressIsANonZeroAddressOfThisMachine) {
    std::set<std::string> addresses;
    DIR* adapters = opendir("/sys/class/net");
    ASSERT_NE(nullptr, adapters);
    while (const dirent* entry = readdir(adapters)) {
        std::string address;
        std::ifstream(std::string("/sys/class/net/") + entry->d_name + "/address") >> address;
        if (address.size() == 17 && address != "00:00:00:00:00:00") {
            addresses.insert(address);
        }
    }
    closedir(adapters);
    const std::string first = FirstAdapterHardwareAddress();
    if (addresses.empty()) {
        EXPECT_EQ("00:00:00:00:00:00", first);
    } else {
        EXPECT_EQ(1u, addresses.count(first)) << first;
    }
}

}  // namespace kest::test::support
