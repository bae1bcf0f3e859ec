// A text with a zero character inside is no address, whatever comes before the zero.
#include <gtest/gtest.h>

#include <string>

#include "vq/dsc/IPAddress.h"

namespace kest::test::support {

namespace {

using vq::dsc::osdep::IPAddress;

TEST(IPAddressEmbeddedZeroTest, TextWithAZeroCharacterIsNoAddress) {
    using namespace std::string_literals;
    for (const std::string& text : {"::1\0junk"s, "fe80::1%lo\0x"s, "1.2.3.4\0"s, "\0"s}) {
        IPAddress address;
        EXPECT_FALSE(address.TryParse(text)) << text.size();
        EXPECT_TRUE(address.IsUnset());
        std::wstring wide(text.begin(), text.end());
        EXPECT_FALSE(address.TryParse(wide)) << text.size();
    }
}

}  // namespace

}  // namespace kest::test::support
