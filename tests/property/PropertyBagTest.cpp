#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <limits>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "property/CuxDynamicPropertyBag.h"
#include "uxsys/HostString.h"

namespace kest::test::property {

namespace {

constexpr uxSysAttrTimestampUTC kTime = {0x8000000000000000ull, 3786825600};

// The tags an enumerator yields from its position to the end.
std::vector<uint32_t> DrainTags(IuxSysEnumPropertyTag* tags) {
    std::vector<uint32_t> drained;
    for (uint32_t tag = 0; tags->Next(1, &tag, nullptr) == S_OK;) {
        drained.push_back(tag);
    }
    return drained;
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
        uxSysAttrTimestampUTC time = kTime;
        EXPECT_NE(S_OK, bag->GetTimestamp(tag, &time));
        EXPECT_EQ(kTime.seconds, time.seconds);
    }
    EXPECT_EQ(E_POINTER, bag->GetString(1, nullptr));
    EXPECT_EQ(E_POINTER, bag->GetTagType(1, nullptr));
    EXPECT_EQ(E_POINTER, bag->SetString(1, nullptr));
    EXPECT_EQ(E_NOTIMPL, bag->Reserved14());
    for (const IID* iid : {&IID_IuxSysPropertyBag, &IID_IuxSysPropertyBag2, &IID_IuxSysPropertyBag3,
                           &IID_IuxSysPropertyBag4}) {
        EXPECT_EQ(static_cast<IUnknown*>(bag.Get()), QueryCounted<IUnknown>(bag, *iid).Get());
    }
}

// A TZ value and the local fields of 2024-02-29 23:30:15 UTC in that zone.
using ZoneFields = std::pair<const char*, std::vector<int32_t>>;

class TimestampFieldsTest : public ::testing::TestWithParam<ZoneFields> {
  protected:
    void SetUp() override {
        const char* previous = std::getenv("TZ");
        hadZone_ = previous != nullptr;
        previousZone_ = hadZone_ ? previous : "";
        setenv("TZ", GetParam().first, 1);
        tzset();
    }
    void TearDown() override {
        hadZone_ ? setenv("TZ", previousZone_.c_str(), 1) : unsetenv("TZ");
        tzset();
    }

  private:
    bool hadZone_ = false;
    std::string previousZone_;
};

TEST_P(TimestampFieldsTest, RealTimesBreakDownInLocalTimeAndNoTimeGivesMinusOne) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    // A fraction just below one second must not round the time up.
    ASSERT_EQ(S_OK, bag->SetTimestamp(1, {~0ull, 1709249415LL + 2082844800LL}));
    ASSERT_EQ(S_OK, bag->SetTimestamp(2, {0, 0}));
    ASSERT_EQ(S_OK, bag->SetTimestamp(3, {0, std::numeric_limits<int64_t>::min()}));
    ASSERT_EQ(S_OK, bag->SetLong(4, 1));

    int32_t fields[6] = {};
    ASSERT_EQ(S_OK, bag->GetTimestampFields(1, fields));
    EXPECT_EQ(GetParam().second, std::vector<int32_t>(fields, fields + 6));

    const std::pair<uint32_t, HRESULT> unconverted[] = {
        {2, S_OK}, {3, S_OK}, {4, UX_E_PROPERTY_TYPE_MISMATCH}, {5, UX_E_PROPERTY_NOT_FOUND}};
    for (const auto& [tag, status] : unconverted) {
        std::fill(fields, fields + 6, 0);
        EXPECT_EQ(status, bag->GetTimestampFields(tag, fields)) << tag;
        EXPECT_EQ(std::vector<int32_t>(6, -1), std::vector<int32_t>(fields, fields + 6)) << tag;
    }
}

INSTANTIATE_TEST_SUITE_P(Zones, TimestampFieldsTest,
                         ::testing::Values(ZoneFields{"UTC", {2024, 2, 29, 23, 30, 15}},
                                           ZoneFields{"ABC-2", {2024, 3, 1, 1, 30, 15}},
                                           ZoneFields{"XYZ5", {2024, 2, 29, 18, 30, 15}}));

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

    EXPECT_EQ(std::vector<uint32_t>({1, 3, 5, 0x80000000u, 0xFFFFFFFFu}), DrainTags(tags.Get()));
    EXPECT_EQ(std::vector<uint32_t>({3, 5, 0x80000000u, 0xFFFFFFFFu}), DrainTags(modified.Get()));
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

}  // namespace kest::test::property
