// The bag kestcfg hands to the plug-in: the behaviour the plug-in relies on in a changes bag.
#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "BagValues.h"
#include "hostkit/HostPropertyBag.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

std::vector<uint32_t> ModifiedTags(IuxSysPropertyBag2* bag) {
    InterfaceRef<IuxSysEnumPropertyTag> tags;
    const HRESULT status = bag->GetModifiedTagEnumerator(tags.Receive());
    EXPECT_EQ(tags ? S_OK : S_FALSE, status);
    return RemainingTags(tags.Get());
}

TEST(HostPropertyBagTest, ValuesKeepTheirTypeAndEverySetMarksTheTagModified) {
    const InterfaceRef<IuxSysPropertyBag4> bag = HostPropertyBag::Create();
    EXPECT_EQ(S_OK, bag->SetLong(5, -7));
    EXPECT_EQ(S_OK, bag->SetString(1, L"kest"));
    EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, bag->SetULong(5, 7));
    EXPECT_EQ(E_POINTER, bag->SetString(1, nullptr));

    uint32_t unsignedValue = 99;
    EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, bag->GetULong(5, &unsignedValue));
    EXPECT_EQ(99u, unsignedValue);
    int32_t flag = 7;
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->GetBool(2, &flag));
    EXPECT_EQ(0, flag);
    CvqBStr text = CvqBStrAlloc(L"stale");
    CvqBStrFree(text);
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->GetString(2, &text));
    EXPECT_EQ(nullptr, text);
    PropertyValue value;
    ASSERT_EQ(S_OK, ReadBagValue(bag.Get(), 1, &value));
    EXPECT_EQ(L"kest", std::get<std::wstring>(value));

    EXPECT_EQ((std::vector<uint32_t>{1, 5}), ModifiedTags(bag.Get()));
    int32_t stillModified = -1;
    EXPECT_EQ(S_OK, bag->ClearModified(1, &stillModified));
    EXPECT_EQ(1, stillModified);
    EXPECT_EQ(S_FALSE, bag->ClearModified(1, &stillModified));
    EXPECT_EQ(S_OK, bag->RemoveTag(5));
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->MarkModified(5));
    EXPECT_EQ(std::vector<uint32_t>{}, ModifiedTags(bag.Get()));
}

TEST(HostPropertyBagTest, CloneCopiesValuesWithoutModifiedMarks) {
    const InterfaceRef<IuxSysPropertyBag4> bag = HostPropertyBag::Create();
    ASSERT_EQ(S_OK, bag->SetTimestamp(0x0D11F000, {1, 2}));
    ASSERT_EQ(S_OK, bag->SetULong(0x0D11B000, 250));
    InterfaceRef<IuxSysPropertyBag> copy;
    ASSERT_EQ(S_OK, bag->Clone(copy.Receive()));
    ASSERT_EQ(S_OK, bag->SetULong(0x0D11B000, 300));

    const InterfaceRef<IuxSysPropertyBag2> copy2 =
        QueryInterfaceAs<IuxSysPropertyBag2>(copy.Get(), IID_IuxSysPropertyBag2);
    ASSERT_TRUE(copy2);
    EXPECT_EQ(std::vector<uint32_t>{}, ModifiedTags(copy2.Get()));
    EXPECT_EQ((std::vector<uint32_t>{0x0D11B000, 0x0D11F000}), AllTags(copy2.Get()));
    uint32_t interval = 0;
    EXPECT_EQ(S_OK, copy2->GetULong(0x0D11B000, &interval));
    EXPECT_EQ(250u, interval);
    uxSysAttrTimestampUTC time{};
    EXPECT_EQ(S_OK, copy2->GetTimestamp(0x0D11F000, &time));
    EXPECT_EQ(1u, time.fraction);
    EXPECT_EQ(2, time.seconds);
    // No time has no fields.
    ASSERT_EQ(S_OK, bag->SetTimestamp(0x0D11F000, {0, 0}));
    int32_t fields[6] = {};
    EXPECT_EQ(S_OK, bag->GetTimestampFields(0x0D11F000, fields));
    EXPECT_EQ((std::vector<int32_t>{-1, -1, -1, -1, -1, -1}),
              std::vector<int32_t>(fields, fields + 6));
}

TEST(HostPropertyBagTest, EnumeratorsFollowTheEnumeratorContract) {
    const InterfaceRef<IuxSysPropertyBag4> bag = HostPropertyBag::Create();
    InterfaceRef<IuxSysEnumPropertyTag> none;
    EXPECT_EQ(S_FALSE, bag->GetTagEnumerator(none.Receive()));
    EXPECT_FALSE(none);
    for (const uint32_t tag : {5u, 1u, 3u}) {
        bag->SetBool(tag, 1);
    }
    InterfaceRef<IuxSysEnumPropertyTag> tags;
    ASSERT_EQ(S_OK, bag->GetTagEnumerator(tags.Receive()));
    uint32_t out[5] = {};
    EXPECT_EQ(E_POINTER, tags->Next(2, out, nullptr));
    EXPECT_EQ(S_OK, tags->Next(1, out, nullptr));
    InterfaceRef<IuxSysEnumPropertyTag> clone;
    ASSERT_EQ(S_OK, tags->Clone(clone.Receive()));
    uint32_t fetched = 0;
    EXPECT_EQ(S_FALSE, tags->Next(5, out, &fetched));
    EXPECT_EQ(2u, fetched);
    EXPECT_EQ(3u, out[0]);
    EXPECT_EQ(5u, out[1]);
    EXPECT_EQ(S_FALSE, clone->Skip(3));
    EXPECT_EQ(S_OK, clone->Reset());
    EXPECT_EQ((std::vector<uint32_t>{1, 3, 5}), RemainingTags(clone.Get()));
}

TEST(HostPropertyBagTest, CallerLockKeepsOtherThreadsOutUntilUnlocked) {
    const InterfaceRef<IuxSysPropertyBag4> bag = HostPropertyBag::Create();
    EXPECT_EQ(E_FAIL, bag->UnlockBag());
    ASSERT_EQ(S_OK, bag->LockBag());
    ASSERT_EQ(S_OK, bag->SetLong(1, 1));
    std::thread writer([&bag] { bag->SetLong(1, 2); });
    // The writer waits for the lock, so the value seen here is the locker's own.
    int32_t value = 0;
    EXPECT_EQ(S_OK, bag->GetLong(1, &value));
    EXPECT_EQ(1, value);
    EXPECT_EQ(S_OK, bag->UnlockBag());
    writer.join();
    EXPECT_EQ(S_OK, bag->GetLong(1, &value));
    EXPECT_EQ(2, value);
}

}  // namespace

}  // namespace kest::cfg
