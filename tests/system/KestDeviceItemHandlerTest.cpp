#include "system/KestDeviceItemHandler.h"

#include <gtest/gtest.h>

#include <map>
#include <string>
#include <variant>
#include <vector>

#include "property/CuxDynamicPropertyBag.h"
#include "support/AbsTime.h"
#include "system/SystemItemSysroot.h"
#include "uxsys/HostString.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

using kest::test::system::ThrownStatus;
using Value = std::variant<bool, int32_t, uint32_t, std::wstring>;

struct Row {
    uint32_t tag;
    Value value;
};

// The value of `tag` in `bag` as the type the bag holds.
Value ReadValue(IuxSysPropertyBag4* bag, uint32_t tag) {
    uint32_t type = 0;
    EXPECT_EQ(S_OK, bag->GetTagType(tag, &type)) << std::hex << tag;
    switch (type) {
        case UX_PROPERTY_TYPE_BOOL: {
            int32_t value = 0;
            bag->GetBool(tag, &value);
            return value != 0;
        }
        case UX_PROPERTY_TYPE_LONG: {
            int32_t value = 0;
            bag->GetLong(tag, &value);
            return value;
        }
        case UX_PROPERTY_TYPE_ULONG: {
            uint32_t value = 0;
            bag->GetULong(tag, &value);
            return value;
        }
        case UX_PROPERTY_TYPE_STRING: {
            CvqBStrHolder value;
            bag->GetString(tag, value.Receive());
            return std::wstring(value.Get() ? value.Get() : L"");
        }
        default:
            ADD_FAILURE() << "unexpected type " << type << " of " << std::hex << tag;
            return false;
    }
}

std::vector<uint32_t> Tags(IuxSysPropertyBag4* bag) {
    std::vector<uint32_t> tags;
    CountedPtr<IuxSysEnumPropertyTag> enumerator;
    bag->GetTagEnumerator(enumerator.Receive());
    uint32_t tag = 0;
    while (enumerator && enumerator->Next(1, &tag, nullptr) == S_OK) {
        tags.push_back(tag);
    }
    return tags;
}

class KestDeviceItemHandlerTest : public ::testing::Test,
                                  public kest::test::system::SystemItemSysroot {
  protected:
    // The catalogue of a new handler (read into a new bag) and the status of the read.
    HRESULT ReadCatalogue() {
        handler_ = MakeCounted<KestDeviceItemHandler>();
        bag_ = CreatePropertyBag();
        return handler_->GetItemProperties(bag_.Get());
    }
    std::wstring Text(uint32_t tag) { return std::get<std::wstring>(ReadValue(bag_.Get(), tag)); }

    CountedPtr<KestDeviceItemHandler> handler_;
    CountedPtr<IuxSysPropertyBag4> bag_;
};

TEST_F(KestDeviceItemHandlerTest, ReportsEveryCatalogueRowWithItsTypeAndValue) {
    const std::vector<Row> expected = {
        {0x0101C000, int32_t(1)},
        {0x0101D000, std::wstring(L"VQ KEST Chassis")},
        {0x0102A000, int32_t(1000)},
        {0x0101F000, std::wstring(L"kest-01")},
        {0x01037000, uint32_t(0x150000)},
        {0x01001000, true},
        {0x01038000, true},
        {0x01039000, int32_t(1)},
        {0x0103A000, uint32_t(4)},
        {0x01024000, int32_t(1)},
        {0x01002000, uint32_t(0)},
        {0x01006000, std::wstring(L"VQ KEST 9100")},
        {0x01005000, uint32_t(77)},
        {0x0103C000, std::wstring(L"KEST")},
        {0x01008000, true},
        {0x01004000, std::wstring(L"Korvane")},
        {0x01003000, uint32_t(0x1092)},
        {0x01007000, std::wstring(L"00001A2B")},
        {0x0103D000, std::wstring(L"rack 4")},
        {0x0D11D000, std::wstring(L"de")},
        {0x0D11E000, std::wstring(L"en,de,fr")},
        {0x0D12B000, int32_t(-360)},
        {0x0D120000, std::wstring(L"CST6CDT")},
        {0x0D14E000, std::wstring(L"America/Chicago")},
        {0x0D129000, true},
        {0x0102F000, std::wstring(L"22.5.0")},
        {0x0104C000, int32_t(0)},
        {0x0104A000, true},
        {0x0104B000, std::wstring(L"*.cfg")},
        {0x01056000, false},
        {0x01055000, false},
        {0x21004000, false},
    };
    ASSERT_EQ(S_OK, ReadCatalogue());
    std::vector<uint32_t> expectedTags;
    for (const Row& row : expected) {
        EXPECT_EQ(row.value, ReadValue(bag_.Get(), row.tag)) << std::hex << row.tag;
        expectedTags.push_back(row.tag);
    }
    std::sort(expectedTags.begin(), expectedTags.end());
    EXPECT_EQ(expectedTags, Tags(bag_.Get()));

    sysroot_.WriteFile(kest::test::system::kWebServicePath, "[WebService]\nEnable = 1\n");
    ASSERT_EQ(S_OK, ReadCatalogue());
    EXPECT_EQ(Value(true), ReadValue(bag_.Get(), 0x21004000));
}

TEST_F(KestDeviceItemHandlerTest, FormatsDescriptionSerialNumberAndLocaleCodes) {
    struct Case {
        std::map<std::string, std::string> state;
        std::vector<std::pair<uint32_t, const wchar_t*>> texts;
    };
    const uint32_t kDescription = 0x01006000, kSerial = 0x01007000, kCodes = 0x0D11E000,
                   kCode = 0x0D11D000;
    const Case cases[] = {
        {{{"DeviceDescription", "VQ 9100"}, {"SerialNumber", "0x1A2B"}},
         {{kDescription, L"VQ 9100"}, {kSerial, L"00001A2B"}}},
        {{{"DeviceDescription", "9999"}, {"SerialNumber", "0"}},
         {{kDescription, L"VQ 9999"}, {kSerial, L"00000000"}}},
        {{{"DeviceDescription", "VQ"}, {"SerialNumber", "4294967295"}},
         {{kDescription, L"VQ VQ"}, {kSerial, L"FFFFFFFF"}}},
        {{{"DeviceDescription", "VQX"}, {"SerialNumber", "0xabcdef"}},
         {{kDescription, L"VQ VQX"}, {kSerial, L"00ABCDEF"}}},
        {{{"DeviceDescription", ""}, {"SerialNumber", "16"}},
         {{kDescription, L"VQ "}, {kSerial, L"00000010"}}},
        {{{"SupportedLanguages", "English,German,Latin,French"}, {"LanguageName", "French"}},
         {{kCodes, L"en,de,,fr"}, {kCode, L"fr"}}},
        {{{"SupportedLanguages", "English,German,Latin,French"}, {"LanguageName", "Latin"}},
         {{kCodes, L"en,de,,fr"}, {kCode, L""}}},
        {{{"SupportedLanguages", "English,,German"}, {"LanguageName", "English"}},
         {{kCodes, L"en"}, {kCode, L"en"}}},
        {{{"SupportedLanguages", "Japanese,Korean,Chinese"}, {"LanguageName", "Korean"}},
         {{kCodes, L"ja,kr,zh"}, {kCode, L"kr"}}},
        {{{"SupportedLanguages", ""}, {"LanguageName", "Chinese"}},
         {{kCodes, L""}, {kCode, L"zh"}}},
    };
    for (const Case& c : cases) {
        WriteState(kest::test::system::SystemState(c.state));
        ASSERT_EQ(S_OK, ReadCatalogue()) << c.state.begin()->second;
        for (const auto& [tag, text] : c.texts) {
            EXPECT_EQ(text, Text(tag)) << c.state.begin()->second << " " << std::hex << tag;
        }
    }
}

// A failing library call (or an unknown current language) ends the catalogue after the rows
// before it, with the call's status.
TEST_F(KestDeviceItemHandlerTest, FailuresEndTheCatalogue) {
    struct Case {
        const char* language;
        const char* failingCall;
        HRESULT status;
        uint32_t lastWritten;
        uint32_t firstMissing;
    };
    const Case cases[] = {
        {"German", "GetDeviceDescription", E_UNEXPECTED, 0x01002000, 0x01006000},
        {"German", "GetTargetClass", E_UNEXPECTED, 0x01005000, 0x0103C000},
        {"German", "GetHostName", E_UNEXPECTED, 0x01007000, 0x0103D000},
        {"German", "GetTimeZone", E_UNEXPECTED, 0x0D12B000, 0x0D120000},
        {"Klingon", "None", E_FAIL, 0x0103D000, 0x0D11D000},
    };
    for (const Case& c : cases) {
        WriteState(kest::test::system::SystemState(
            {{"LanguageName", c.language}},
            std::string("[Faults]\n") + c.failingCall + " = -375501\n"));
        EXPECT_EQ(c.status, ReadCatalogue()) << c.failingCall;
        EXPECT_EQ(S_OK, bag_->HasTag(c.lastWritten)) << c.failingCall;
        EXPECT_EQ(S_FALSE, bag_->HasTag(c.firstMissing)) << c.failingCall;
        EXPECT_EQ(S_FALSE, bag_->HasTag(0x21004000)) << c.failingCall;
    }
    EXPECT_EQ(E_POINTER, handler_->GetItemProperties(nullptr));
}

TEST_F(KestDeviceItemHandlerTest, ReadsTheFirstLineOfTheVersionFileOnce) {
    struct Case {
        std::string content;
        std::wstring version;
    };
    const Case cases[] = {
        {"22.5.0\nbuild 17\n", L"22.5.0"},
        {"", L""},
        {"23.1", L"23.1"},
        {std::string(300, '7') + "\n", std::wstring(255, L'7')},
    };
    for (const Case& c : cases) {
        sysroot_.WriteFile("/etc/korvane/version", c.content);
        ASSERT_EQ(S_OK, ReadCatalogue());
        sysroot_.WriteFile("/etc/korvane/version", "changed\n");
        ASSERT_EQ(S_OK, handler_->GetItemProperties(bag_.Get()));
        EXPECT_EQ(c.version, Text(0x0102F000));
    }
}

TEST_F(KestDeviceItemHandlerTest, ConstructionFailsWithoutAReadableVersionFile) {
    std::remove(sysroot_.PathOf("/etc/korvane/version").c_str());
    EXPECT_EQ(E_FAIL, ThrownStatus([] { MakeCounted<KestDeviceItemHandler>(); }));
    sysroot_.MakeDirectory("/etc/korvane/version");
    EXPECT_EQ(E_FAIL, ThrownStatus([] { MakeCounted<KestDeviceItemHandler>(); }));
}

TEST_F(KestDeviceItemHandlerTest, RefreshWritesTheRequestedTimeAndDnsNameBeforeTheCatalogue) {
    ASSERT_EQ(S_OK, ReadCatalogue());
    const uint32_t catalogueSize = static_cast<uint32_t>(Tags(bag_.Get()).size());

    CountedPtr<IuxSysPropertyBag4> refreshed = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(0, nullptr, refreshed.Get()));
    EXPECT_EQ(catalogueSize, Tags(refreshed.Get()).size());

    const vq::dsc::AbsTime before = vq::dsc::AbsTime::Now();
    const uint32_t requested[] = {0x0D11F000, 0x0D114ABC, 0x01006000};
    refreshed = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(3, requested, refreshed.Get()));
    uxSysAttrTimestampUTC time{};
    ASSERT_EQ(S_OK, refreshed->GetTimestamp(0x0D11F000, &time));
    EXPECT_GE(time.seconds, before.seconds);
    EXPECT_EQ(Value(std::wstring(L"kest-01.example.net")), ReadValue(refreshed.Get(), 0x0D114000));
    EXPECT_EQ(catalogueSize + 2, Tags(refreshed.Get()).size());

    const uint32_t masked[] = {0x0D11FFFF};
    refreshed = CreatePropertyBag();
    EXPECT_EQ(S_OK, handler_->RefreshProperties(1, masked, refreshed.Get()));
    EXPECT_EQ(S_OK, refreshed->HasTag(0x0D11F000));
    EXPECT_EQ(S_FALSE, refreshed->HasTag(0x0D114000));
}

TEST_F(KestDeviceItemHandlerTest, ARefreshWhoseDnsNameFailsWritesNoCatalogue) {
    WriteState(
        kest::test::system::SystemState({}, "[Faults]\nGetFullyQualifiedDNSName = -375501\n"));
    ASSERT_EQ(S_OK, ReadCatalogue());
    CountedPtr<IuxSysPropertyBag4> refreshed = CreatePropertyBag();
    const uint32_t requested[] = {0x0D114000};
    EXPECT_EQ(E_UNEXPECTED, handler_->RefreshProperties(1, requested, refreshed.Get()));
    EXPECT_TRUE(Tags(refreshed.Get()).empty());
    EXPECT_EQ(E_POINTER, handler_->RefreshProperties(1, requested, nullptr));
}

}  // namespace
}  // namespace nVQKESTSYSAPICHASSISEXPERT100
