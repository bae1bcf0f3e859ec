#include <gtest/gtest.h>

#include <string>

#include "property/BagAccess.h"
#include "property/CuxDynamicPropertyBag.h"
#include "property/PropertyTagEnumerator.h"

using namespace kest::property;

namespace kest::test::property {

namespace {

TEST(BagAccessTest, BooleansAndStringsRoundTripAndFailuresClearTheResult) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, BagSetBool(bag.Get(), 1, true));
    ASSERT_EQ(S_OK, BagSetNarrowString(bag.Get(), 2, "host-01"));
    ASSERT_EQ(S_OK, BagSetWideString(bag.Get(), 3, L"comment"));

    bool flag = false;
    EXPECT_EQ(S_OK, BagGetBool(bag.Get(), 1, flag));
    EXPECT_TRUE(flag);
    EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, BagGetBool(bag.Get(), 2, flag));
    EXPECT_FALSE(flag);

    std::string narrow;
    std::wstring wide;
    EXPECT_EQ(S_OK, BagGetNarrowString(bag.Get(), 2, narrow));
    EXPECT_EQ("host-01", narrow);
    EXPECT_EQ(S_OK, BagGetWideString(bag.Get(), 3, wide));
    EXPECT_EQ(L"comment", wide);
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, BagGetNarrowString(bag.Get(), 4, narrow));
    EXPECT_EQ("", narrow);
    EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, BagGetWideString(bag.Get(), 1, wide));
    EXPECT_EQ(L"", wide);

    EXPECT_TRUE(BagHasTag(bag.Get(), 3));
    EXPECT_FALSE(BagHasTag(bag.Get(), 4));
}

TEST(BagAccessTest, EnumeratorHasTagSearchesFromTheStart) {
    EXPECT_FALSE(EnumeratorHasTag(nullptr, 1));
    const CountedPtr<IuxSysEnumPropertyTag> tags =
        CreatePropertyTagEnumerator(PropertyTagList{2, 4, 6});
    ASSERT_EQ(S_FALSE, tags->Skip(5));
    EXPECT_TRUE(EnumeratorHasTag(tags.Get(), 2));
    EXPECT_TRUE(EnumeratorHasTag(tags.Get(), 6));
    EXPECT_FALSE(EnumeratorHasTag(tags.Get(), 5));
}

}  // namespace

}  // namespace kest::test::property
