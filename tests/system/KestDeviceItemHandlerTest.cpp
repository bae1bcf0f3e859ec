#include "system/KestDeviceItemHandler.h"

#include <gmock/gmock.h>

#include <string>
#include <tuple>

#include "common/BagListing.h"
#include "common/StatusOf.h"
#include "property/CuxDynamicPropertyBag.h"
#include "support/AbsTime.h"
#include "system/SystemItemSysroot.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

using kest::test::Listing;
using kest::test::StatusOf;

constexpr char kCatalogue[] =
    "1001000=b1;1002000=u0;1003000=u1092;1004000=sKorvane;1005000=u4d;1006000=sVQ KEST 9100;"
    "1007000=s00001A2B;1008000=b1;101c000=l1;101d000=sVQ KEST Chassis;101f000=skest-01;"
    "1024000=l1;102a000=l1000;102f000=s22.5.0;1037000=u150000;1038000=b1;1039000=l1;"
    "103a000=u4;103c000=sKEST;103d000=srack 4;104a000=b1;104b000=s*.cfg;104c000=l0;"
    "1055000=b0;1056000=b0;d11d000=sde;d11e000=sen,de,fr;d120000=sCST6CDT;d129000=b1;"
    "d12b000=l-360;d14e000=sAmerica/Chicago;21004000=b0;";

class KestDeviceItemHandlerTest : public ::testing::Test,
                                  public kest::test::system::SystemItemSysroot {
  protected:
    // The catalogue of a new handler (read into a new bag) and the status of the read.
    HRESULT ReadCatalogue() {
        handler_ = MakeCounted<KestDeviceItemHandler>();
        bag_ = CreatePropertyBag();
        return handler_->GetItemProperties(bag_.Get());
    }

    CountedPtr<KestDeviceItemHandler> handler_;
    CountedPtr<IuxSysPropertyBag4> bag_;
};

TEST_F(KestDeviceItemHandlerTest, ReportsEveryCatalogueRowWithItsTypeAndValue) {
    ASSERT_EQ(S_OK, ReadCatalogue());
    EXPECT_EQ(kCatalogue, Listing(bag_.Get()));
    sysroot_.WriteFile(kest::test::system::kWebServicePath, "[WebService]\nEnable = 1\n");
    ASSERT_EQ(S_OK, ReadCatalogue());
    std::string enabled = kCatalogue;
    EXPECT_EQ(enabled.replace(enabled.find("21004000=b0"), 11, "21004000=b1"), Listing(bag_.Get()));
}

TEST_F(KestDeviceItemHandlerTest, FormatsDescriptionSerialNumberAndLocaleCodes) {
    // State lines and the rows they give.
    const std::pair<const char*, const char*> cases[] = {
        {"DeviceDescription = VQ 9100\nSerialNumber = 0x1A2B",
         "1006000=sVQ 9100;1007000=s00001A2B;"},
        {"DeviceDescription = 9999\nSerialNumber = 0", "1006000=sVQ 9999;1007000=s00000000;"},
        {"DeviceDescription = VQ\nSerialNumber = 4294967295", "1006000=sVQ VQ;1007000=sFFFFFFFF;"},
        {"DeviceDescription = VQX\nSerialNumber = 0xabcdef", "1006000=sVQ VQX;1007000=s00ABCDEF;"},
        {"DeviceDescription =\nSerialNumber = 16", "1006000=sVQ ;1007000=s00000010;"},
        {"SupportedLanguages = English,German,Latin,French\nLanguageName = French",
         "d11d000=sfr;d11e000=sen,de,,fr;"},
        {"SupportedLanguages = English,German,Latin,French\nLanguageName = Latin",
         "d11d000=s;d11e000=sen,de,,fr;"},
        {"SupportedLanguages = English,,German\nLanguageName = English",
         "d11d000=sen;d11e000=sen;"},
        {"SupportedLanguages = Japanese,Korean,Chinese\nLanguageName = Korean",
         "d11d000=skr;d11e000=sja,kr,zh;"},
        {"SupportedLanguages =\nLanguageName = Chinese", "d11d000=szh;d11e000=s;"},
    };
    for (const auto& [state, rows] : cases) {
        WriteState(kest::test::system::SystemState(state));
        ASSERT_EQ(S_OK, ReadCatalogue()) << state;
        EXPECT_THAT(Listing(bag_.Get()), ::testing::HasSubstr(rows)) << state;
    }
}

// A failing library call (or an unknown current language) ends the catalogue after the rows
// before it, with the call's status.
TEST_F(KestDeviceItemHandlerTest, FailuresEndTheCatalogue) {
    // State lines, the status, the last row written and the first row missing.
    const std::tuple<const char*, HRESULT, uint32_t, uint32_t> cases[] = {
        {"[Faults]\nGetDeviceDescription = -375501", E_UNEXPECTED, 0x01002000, 0x01006000},
        {"[Faults]\nGetTargetClass = -375501", E_UNEXPECTED, 0x01005000, 0x0103C000},
        {"[Faults]\nGetHostName = -375501", E_UNEXPECTED, 0x01007000, 0x0103D000},
        {"[Faults]\nGetTimeZone = -375501", E_UNEXPECTED, 0x0D12B000, 0x0D120000},
        {"LanguageName = Klingon", E_FAIL, 0x0103D000, 0x0D11D000},
    };
    for (const auto& [state, status, lastWritten, firstMissing] : cases) {
        WriteState(kest::test::system::SystemState(state));
        EXPECT_EQ(status, ReadCatalogue()) << state;
        EXPECT_EQ(S_OK, bag_->HasTag(lastWritten)) << state;
        EXPECT_EQ(S_FALSE, bag_->HasTag(firstMissing)) << state;
        EXPECT_EQ(S_FALSE, bag_->HasTag(tags::kWebServiceEnabled)) << state;
    }
    EXPECT_EQ(E_POINTER, handler_->GetItemProperties(nullptr));
}

TEST_F(KestDeviceItemHandlerTest, ReadsTheFirstLineOfTheVersionFileOnceAndNeedsIt) {
    const std::pair<std::string, std::string> cases[] = {
        {"22.5.0\nbuild 17\n", "102f000=s22.5.0;"},
        {"", "102f000=s;"},
        {"23.1", "102f000=s23.1;"},
        {std::string(300, '7') + "\n", "102f000=s" + std::string(255, '7') + ";"},
    };
    for (const auto& [content, row] : cases) {
        sysroot_.WriteFile("/etc/korvane/version", content);
        ASSERT_EQ(S_OK, ReadCatalogue());
        sysroot_.WriteFile("/etc/korvane/version", "changed\n");
        ASSERT_EQ(S_OK, handler_->GetItemProperties(bag_.Get()));
        EXPECT_THAT(Listing(bag_.Get()), ::testing::HasSubstr(row));
    }
    // Without a readable version file there is no handler.
    std::remove(sysroot_.PathOf("/etc/korvane/version").c_str());
    EXPECT_EQ(E_FAIL, StatusOf([] { MakeCounted<KestDeviceItemHandler>(); }));
    sysroot_.MakeDirectory("/etc/korvane/version");
    EXPECT_EQ(E_FAIL, StatusOf([] { MakeCounted<KestDeviceItemHandler>(); }));
}

TEST_F(KestDeviceItemHandlerTest, RefreshWritesTheRequestedTimeAndDnsNameBeforeTheCatalogue) {
    ASSERT_EQ(S_OK, ReadCatalogue());
    bag_ = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(0, nullptr, bag_.Get()));
    EXPECT_EQ(kCatalogue, Listing(bag_.Get()));

    const vq::dsc::AbsTime before = vq::dsc::AbsTime::Now();
    const uint32_t requested[] = {0x0D11F000, 0x0D114ABC, 0x01006000};
    bag_ = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(3, requested, bag_.Get()));
    uxSysAttrTimestampUTC time{};
    ASSERT_EQ(S_OK, bag_->GetTimestamp(0x0D11F000, &time));
    EXPECT_GE(time.seconds, before.seconds);
    std::string expected = kCatalogue;
    expected.insert(expected.find("d11d000"), "d114000=skest-01.example.net;");
    expected.insert(expected.find("d120000"), "d11f000=t" + std::to_string(time.seconds) + ";");
    EXPECT_EQ(expected, Listing(bag_.Get()));

    const uint32_t masked[] = {0x0D11FFFF};
    bag_ = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(1, masked, bag_.Get()));
    EXPECT_EQ(S_OK, bag_->HasTag(0x0D11F000));
    EXPECT_EQ(S_FALSE, bag_->HasTag(0x0D114000));

    // A refresh whose DNS name fails writes no catalogue.
    WriteState(kest::test::system::SystemState("[Faults]\nGetFullyQualifiedDNSName = -375501"));
    ASSERT_EQ(S_OK, ReadCatalogue());
    const uint32_t dnsName[] = {0x0D114000};
    bag_ = CreatePropertyBag();
    EXPECT_EQ(E_UNEXPECTED, handler_->RefreshProperties(1, dnsName, bag_.Get()));
    EXPECT_EQ("", Listing(bag_.Get()));
    EXPECT_EQ(E_POINTER, handler_->RefreshProperties(1, dnsName, nullptr));
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
