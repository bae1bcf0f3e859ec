#include "support/HostInfo.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace kest::test::support {

using vq::dsc::osdep::FirstAdapterHardwareAddress;

TEST(HostInfoTest, FirstAdapterAddressIsSixColonSeparatedHexBytes) {
    EXPECT_THAT(FirstAdapterHardwareAddress(),
                ::testing::MatchesRegex("[0-9a-f]{2}(:[0-9a-f]{2}){5}"));
}

}  // namespace kest::test::support
