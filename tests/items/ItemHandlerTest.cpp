// The handler base: the rows it writes, how a failing setter ends them, and name matching.
#include <gtest/gtest.h>

#include "ItemTestSupport.h"
#include "property/BagAccess.h"
#include "property/CuxDynamicPropertyBag.h"

using namespace kest::property;

namespace kest::test::items {
namespace {

TEST(ItemHandlerTest, BaseRowsCarryTheIdentityWithTheirTypes) {
    CountedPtr<TestHandler> handler = MakeCounted<TestHandler>(L"eth0");
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, handler->GetItemProperties(bag.Get()));

    int32_t number = 0;
    for (const auto& [tag, value] : {std::pair{0x0101C000u, 1}, std::pair{0x0102A000u, 1000}}) {
        EXPECT_EQ(S_OK, bag->GetLong(tag, &number)) << std::hex << tag;
        EXPECT_EQ(value, number) << std::hex << tag;
    }
    uint32_t unsignedValue = 0;
    EXPECT_EQ(S_OK, bag->GetULong(0x01037000, &unsignedValue));
    EXPECT_EQ(0x150000u, unsignedValue);
    for (const auto& [tag, value] :
         {std::pair{0x0101D000u, L"eth0"}, {0x0101F000u, L"Second eth0"}}) {
        std::wstring text;
        EXPECT_EQ(S_OK, BagGetWideString(bag.Get(), tag, text)) << std::hex << tag;
        EXPECT_EQ(value, text) << std::hex << tag;
    }
}

TEST(ItemHandlerTest, FirstFailingSetterIsThrownAndStopsTheRows) {
    CountedPtr<TestHandler> handler = MakeCounted<TestHandler>(L"eth0");
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    // The numeric attribute's tag already holds text, so the third row fails.
    ASSERT_EQ(S_OK, bag->SetString(0x0102A000, L"taken"));
    try {
        handler->GetItemProperties(bag.Get());
        FAIL() << "no status thrown";
    } catch (long status) {
        EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, status);
    }
    EXPECT_EQ(S_OK, bag->HasTag(0x0101D000));
    EXPECT_EQ(S_FALSE, bag->HasTag(0x0101F000));
    EXPECT_EQ(S_FALSE, bag->HasTag(0x01037000));
}

struct NameCase {
    const wchar_t* itemName;
    const wchar_t* asked;
    bool matches;
};

class ItemNameMatchTest : public ::testing::TestWithParam<NameCase> {};

TEST_P(ItemNameMatchTest, ComparesWholeNamesIgnoringCase) {
    const NameCase& c = GetParam();
    CountedPtr<TestHandler> handler = MakeCounted<TestHandler>(c.itemName);
    EXPECT_EQ(c.matches, handler->HasItemName(c.asked));
}

INSTANTIATE_TEST_SUITE_P(
    Names, ItemNameMatchTest,
    ::testing::Values(NameCase{L"eth0", L"eth0", true}, NameCase{L"eth0", L"ETH0", true},
                      NameCase{L"VQ KEST Chassis", L"vq kest chassis", true},
                      NameCase{L"eth0", L"eth", false}, NameCase{L"eth0", L"eth00", false},
                      NameCase{L"eth0", L"eth1", false}, NameCase{L"eth0", L"", false}));

}  // namespace
}  // namespace kest::test::items
