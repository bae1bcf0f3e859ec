#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "PropertyTestSupport.h"
#include "property/CuxDynamicPropertyBag.h"
#include "uxsys/HostString.h"

namespace {

constexpr GUID kGuid = {0x12345678, 0x9abc, 0xdef0, {1, 2, 3, 4, 5, 6, 7, 8}};
constexpr uxSysAttrTimestampUTC kTime = {0x8000000000000000ull, 3786825600};

// One type code with a setter and a check that the tag still holds the value that setter wrote.
struct TypedAccess {
    uint32_t typeCode;
    std::function<HRESULT(IuxSysPropertyBag4*, uint32_t)> set;
    std::function<HRESULT(IuxSysPropertyBag4*, uint32_t)> getAndCheck;
};

std::vector<TypedAccess> AllTypes() {
    return {
        {UX_PROPERTY_TYPE_BOOL, [](auto* b, uint32_t t) { return b->SetBool(t, -7); },
         [](auto* b, uint32_t t) {
             int32_t v = 5;
             const HRESULT s = b->GetBool(t, &v);
             return s == S_OK && v != 1 ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_LONG, [](auto* b, uint32_t t) { return b->SetLong(t, -42); },
         [](auto* b, uint32_t t) {
             int32_t v = 0;
             const HRESULT s = b->GetLong(t, &v);
             return s == S_OK && v != -42 ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_ULONG, [](auto* b, uint32_t t) { return b->SetULong(t, 0xFFFFFFF0u); },
         [](auto* b, uint32_t t) {
             uint32_t v = 0;
             const HRESULT s = b->GetULong(t, &v);
             return s == S_OK && v != 0xFFFFFFF0u ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_DOUBLE, [](auto* b, uint32_t t) { return b->SetDouble(t, 2.5); },
         [](auto* b, uint32_t t) {
             double v = 0;
             const HRESULT s = b->GetDouble(t, &v);
             return s == S_OK && v != 2.5 ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_GUID, [](auto* b, uint32_t t) { return b->SetGuid(t, kGuid); },
         [](auto* b, uint32_t t) {
             GUID v{};
             const HRESULT s = b->GetGuid(t, &v);
             return s == S_OK && v != kGuid ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_STRING, [](auto* b, uint32_t t) { return b->SetString(t, L"eth0"); },
         [](auto* b, uint32_t t) {
             CvqBStrHolder v;
             const HRESULT s = b->GetString(t, v.Receive());
             return s == S_OK && std::wstring(v.Get()) != L"eth0" ? E_UNEXPECTED : s;
         }},
        {UX_PROPERTY_TYPE_TIMESTAMP, [](auto* b, uint32_t t) { return b->SetTimestamp(t, kTime); },
         [](auto* b, uint32_t t) {
             uxSysAttrTimestampUTC v{};
             const HRESULT s = b->GetTimestamp(t, &v);
             return s == S_OK && std::memcmp(&v, &kTime, sizeof v) != 0 ? E_UNEXPECTED : s;
         }},
    };
}

std::vector<uint32_t> ModifiedTags(IuxSysPropertyBag4* bag) {
    CountedPtr<IuxSysEnumPropertyTag> tags;
    bag->GetModifiedTagEnumerator(tags.Receive());
    return DrainTags(tags.Get());
}

TEST(PropertyBagTest, EveryIdentifierYieldsTheSameInterface) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    for (const IID* iid : {&IID_IuxSysPropertyBag, &IID_IuxSysPropertyBag2, &IID_IuxSysPropertyBag3,
                           &IID_IuxSysPropertyBag4, &IID_IUnknown}) {
        CountedPtr<IUnknown> answer = QueryCounted<IUnknown>(bag, *iid);
        EXPECT_EQ(static_cast<void*>(bag.Get()), static_cast<void*>(answer.Get()));
    }
    EXPECT_EQ(E_NOTIMPL, bag->Reserved14());
}

TEST(PropertyBagTest, TypeMismatchNeverChangesAStoredValueOrItsType) {
    const std::vector<TypedAccess> types = AllTypes();
    for (const TypedAccess& stored : types) {
        const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
        ASSERT_EQ(S_OK, stored.set(bag.Get(), 9));
        ASSERT_EQ(S_OK, bag->ClearAllModified());
        for (const TypedAccess& other : types) {
            if (other.typeCode == stored.typeCode) {
                continue;
            }
            SCOPED_TRACE(testing::Message() << stored.typeCode << " <- " << other.typeCode);
            EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, other.set(bag.Get(), 9));
            EXPECT_EQ(UX_E_PROPERTY_TYPE_MISMATCH, other.getAndCheck(bag.Get(), 9));
            EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, other.getAndCheck(bag.Get(), 10));
        }
        uint32_t type = 0;
        EXPECT_EQ(S_OK, bag->GetTagType(9, &type));
        EXPECT_EQ(stored.typeCode, type);
        EXPECT_EQ(S_OK, stored.getAndCheck(bag.Get(), 9));
        EXPECT_TRUE(ModifiedTags(bag.Get()).empty()) << "a refused set marked the tag";
    }
}

TEST(PropertyBagTest, GettersWriteOnFailureOnlyWhereTheContractSaysSo) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, bag->SetDouble(1, 1.0));
    for (uint32_t tag : {1u, 2u}) {
        int32_t flag = 7;
        EXPECT_NE(S_OK, bag->GetBool(tag, &flag));
        EXPECT_EQ(0, flag);
        CvqBStr text = reinterpret_cast<CvqBStr>(&flag);
        EXPECT_NE(S_OK, bag->GetString(tag, &text));
        EXPECT_EQ(nullptr, text);
        int32_t number = 7;
        EXPECT_NE(S_OK, bag->GetLong(tag, &number));
        EXPECT_EQ(7, number);
        uxSysAttrTimestampUTC time = kTime;
        EXPECT_NE(S_OK, bag->GetTimestamp(tag, &time));
        EXPECT_EQ(kTime.seconds, time.seconds);
    }
    EXPECT_EQ(E_POINTER, bag->GetBool(1, nullptr));
    EXPECT_EQ(E_POINTER, bag->GetString(1, nullptr));
    EXPECT_EQ(E_POINTER, bag->GetTagType(1, nullptr));
    EXPECT_EQ(E_POINTER, bag->SetString(1, nullptr));
}

TEST(PropertyBagTest, StringsAreCopiedInAndOut) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    std::wstring source = L"first";
    ASSERT_EQ(S_OK, bag->SetString(3, source.c_str()));
    source = L"XXXXX";
    CvqBStrHolder first;
    ASSERT_EQ(S_OK, bag->GetString(3, first.Receive()));
    ASSERT_EQ(S_OK, bag->SetString(3, L"a longer second value"));
    CvqBStrHolder second;
    ASSERT_EQ(S_OK, bag->GetString(3, second.Receive()));
    EXPECT_STREQ(L"first", first.Get());
    EXPECT_EQ(5u, CvqBStrLength(first.Get()));
    EXPECT_STREQ(L"a longer second value", second.Get());
}

class TimestampFieldsTest : public ::testing::TestWithParam<std::pair<const char*, int32_t>> {
  protected:
    void SetUp() override {
        const char* previous = std::getenv("TZ");
        hadZone_ = previous != nullptr;
        previousZone_ = hadZone_ ? previous : "";
    }
    void TearDown() override {
        hadZone_ ? setenv("TZ", previousZone_.c_str(), 1) : unsetenv("TZ");
        tzset();
    }
    void UseZone(const char* zone) {
        setenv("TZ", zone, 1);
        tzset();
    }

  private:
    bool hadZone_ = false;
    std::string previousZone_;
};

TEST_P(TimestampFieldsTest, RealTimesBreakDownInLocalTimeAndNoTimeGivesMinusOne) {
    UseZone(GetParam().first);
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    // 2024-02-29 23:30:15 UTC, with a fraction that must not round anything.
    const int64_t seconds = 1709249415LL + 2082844800LL;
    ASSERT_EQ(S_OK, bag->SetTimestamp(1, {0xFFFFFFFFFFFFFFFFull, seconds}));
    ASSERT_EQ(S_OK, bag->SetTimestamp(2, {0, 0}));
    ASSERT_EQ(S_OK, bag->SetTimestamp(3, {0, std::numeric_limits<int64_t>::min()}));
    ASSERT_EQ(S_OK, bag->SetLong(4, 1));

    int32_t fields[6] = {};
    ASSERT_EQ(S_OK, bag->GetTimestampFields(1, fields));
    const int32_t hour = GetParam().second;
    const std::vector<int32_t> expected = hour < 24
                                              ? std::vector<int32_t>{2024, 2, 29, hour, 30, 15}
                                              : std::vector<int32_t>{2024, 3, 1, hour - 24, 30, 15};
    EXPECT_EQ(expected, std::vector<int32_t>(fields, fields + 6));

    const std::vector<int32_t> unset(6, -1);
    const std::pair<uint32_t, HRESULT> failures[] = {
        {2, S_OK}, {3, S_OK}, {4, UX_E_PROPERTY_TYPE_MISMATCH}, {5, UX_E_PROPERTY_NOT_FOUND}};
    for (const auto& [tag, status] : failures) {
        std::fill(fields, fields + 6, 0);
        EXPECT_EQ(status, bag->GetTimestampFields(tag, fields)) << tag;
        EXPECT_EQ(unset, std::vector<int32_t>(fields, fields + 6)) << tag;
    }
}

INSTANTIATE_TEST_SUITE_P(Zones, TimestampFieldsTest,
                         ::testing::Values(std::make_pair("UTC", 23), std::make_pair("ABC-2", 25),
                                           std::make_pair("XYZ5", 18)));

TEST(PropertyBagTest, EnumeratorsAreAscendingSnapshots) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    CountedPtr<IuxSysEnumPropertyTag> tags;
    EXPECT_EQ(S_FALSE, bag->GetTagEnumerator(tags.Receive()));
    EXPECT_EQ(nullptr, tags.Get());
    EXPECT_EQ(S_FALSE, bag->GetModifiedTagEnumerator(tags.Receive()));
    EXPECT_EQ(E_POINTER, bag->GetTagEnumerator(nullptr));
    EXPECT_EQ(E_POINTER, bag->GetModifiedTagEnumerator(nullptr));

    for (uint32_t tag : {5u, 0xFFFFFFFFu, 1u, 0x80000000u, 3u}) {
        ASSERT_EQ(S_OK, bag->SetULong(tag, tag));
    }
    ASSERT_EQ(S_OK, bag->ClearModified(1, nullptr));
    ASSERT_EQ(S_OK, bag->GetTagEnumerator(tags.Receive()));
    CountedPtr<IuxSysEnumPropertyTag> modified;
    ASSERT_EQ(S_OK, bag->GetModifiedTagEnumerator(modified.Receive()));
    ASSERT_EQ(S_OK, bag->RemoveTag(3));
    ASSERT_EQ(S_OK, bag->SetULong(2, 2));

    const std::vector<uint32_t> all = {1, 3, 5, 0x80000000u, 0xFFFFFFFFu};
    EXPECT_EQ(all, DrainTags(tags.Get()));
    EXPECT_EQ(std::vector<uint32_t>({3, 5, 0x80000000u, 0xFFFFFFFFu}), DrainTags(modified.Get()));
}

TEST(PropertyBagTest, ModifiedSetFollowsSetsClearsAndRemovals) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, bag->SetString(7, L"x"));
    ASSERT_EQ(S_OK, bag->SetLong(8, 1));
    int32_t still = -1;
    EXPECT_EQ(S_OK, bag->ClearModified(7, &still));
    EXPECT_EQ(1, still);
    EXPECT_EQ(S_OK, bag->ClearModified(8, &still));
    EXPECT_EQ(0, still);
    still = -1;
    EXPECT_EQ(S_FALSE, bag->ClearModified(8, &still));
    EXPECT_EQ(0, still);
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->ClearModified(9, &still));
    EXPECT_EQ(S_FALSE, bag->ClearAllModified());

    EXPECT_EQ(S_OK, bag->MarkModified(8));
    EXPECT_EQ(S_OK, bag->MarkModified(8));
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->MarkModified(9));
    EXPECT_EQ(S_OK, bag->RemoveTag(8));
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->RemoveTag(8));
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, bag->MarkModified(8));
    EXPECT_EQ(S_FALSE, bag->ClearAllModified()) << "the removed tag stayed modified";
    EXPECT_EQ(S_FALSE, bag->HasTag(8));
    EXPECT_EQ(S_OK, bag->HasTag(7));

    ASSERT_EQ(S_OK, bag->MarkModified(7));
    EXPECT_EQ(S_OK, bag->RemoveAllTags());
    EXPECT_EQ(S_FALSE, bag->HasTag(7));
    EXPECT_EQ(S_FALSE, bag->ClearAllModified());
}

TEST(PropertyBagTest, CloneCopiesEveryTypeWithAnEmptyModifiedSet) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    const std::vector<TypedAccess> types = AllTypes();
    for (const TypedAccess& type : types) {
        ASSERT_EQ(S_OK, type.set(bag.Get(), type.typeCode * 100));
    }
    CountedPtr<IuxSysPropertyBag> copied;
    ASSERT_EQ(S_OK, bag->Clone(copied.Receive()));
    CountedPtr<IuxSysPropertyBag4> copy =
        QueryCounted<IuxSysPropertyBag4>(copied, IID_IuxSysPropertyBag4);
    ASSERT_NE(nullptr, copy.Get());
    ASSERT_EQ(S_OK, bag->RemoveAllTags());
    for (const TypedAccess& type : types) {
        uint32_t code = 0;
        EXPECT_EQ(S_OK, copy->GetTagType(type.typeCode * 100, &code));
        EXPECT_EQ(type.typeCode, code);
        EXPECT_EQ(S_OK, type.getAndCheck(copy.Get(), type.typeCode * 100)) << type.typeCode;
    }
    EXPECT_EQ(S_FALSE, copy->ClearAllModified());
    EXPECT_EQ(E_POINTER, bag->Clone(nullptr));

    ASSERT_EQ(S_OK, bag->Clone(copied.Receive()));
    EXPECT_EQ(S_FALSE, copied->HasTag(100));
}

TEST(PropertyBagTest, CallerLockMustBeHeldToBeReleased) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    EXPECT_EQ(E_FAIL, bag->UnlockBag());
    ASSERT_EQ(S_OK, bag->LockBag());
    ASSERT_EQ(S_OK, bag->LockBag());
    EXPECT_EQ(S_OK, bag->SetLong(1, 1)) << "the locking thread keeps full access";

    HRESULT foreignUnlock = S_OK;
    std::thread foreign([&] { foreignUnlock = bag->UnlockBag(); });
    // Gives the foreign call time to arrive while the lock is held; it must wait or fail.
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    EXPECT_EQ(S_OK, bag->UnlockBag());
    EXPECT_EQ(S_OK, bag->UnlockBag());
    foreign.join();
    EXPECT_EQ(E_FAIL, foreignUnlock) << "a thread that holds no caller lock released one";
    EXPECT_EQ(E_FAIL, bag->UnlockBag());
}

}  // namespace
