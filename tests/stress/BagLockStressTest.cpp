// One property bag locked and written from several threads at once: each locker writes a group of
// tags under the caller lock (taken twice, as nested callers do), writers add tags without the
// lock, other threads copy the bag and enumerate its tags. Every copy and every look inside a
// locked section sees a whole group, no unlocked write lands inside a locked section,
// enumerations are ascending snapshots, and no write is lost.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "com/CountedPtr.h"
#include "property/CuxDynamicPropertyBag.h"

namespace kest::test::stress {

namespace {

constexpr uint32_t kGroupTags[] = {0x100, 0x200, 0x300, 0x400};
constexpr uint32_t kCounterTag = 0x10;
constexpr int kLockers = 4;
constexpr int kRoundsPerLocker = 400;
constexpr int kObservers = 2;
constexpr uint32_t kWriters = 2;
constexpr uint32_t kWritesPerWriter = 500;

// True when every group tag holds the same value.
bool GroupIsWhole(IuxSysPropertyBag* bag) {
    uint32_t first = 0;
    if (bag->GetULong(kGroupTags[0], &first) != S_OK) {
        return false;
    }
    for (uint32_t tag : kGroupTags) {
        uint32_t value = 0;
        if (bag->GetULong(tag, &value) != S_OK || value != first) {
            return false;
        }
    }
    return true;
}

// The number of tags the enumerator yields, or -1 when they are not strictly ascending.
int CountAscending(IuxSysEnumPropertyTag* tags) {
    int count = 0;
    uint32_t previous = 0;
    bool first = true;
    uint32_t batch[3];
    uint32_t fetched = 0;
    HRESULT status = S_OK;
    do {
        status = tags->Next(3, batch, &fetched);
        for (uint32_t i = 0; i < fetched; ++i) {
            if (!first && batch[i] <= previous) {
                return -1;
            }
            ++count;
            previous = batch[i];
            first = false;
        }
    } while (status == S_OK);
    return status == S_FALSE ? count : -1;
}

int CountTags(IuxSysPropertyBag4* bag) {
    CountedPtr<IuxSysEnumPropertyTag> tags;
    return bag->GetTagEnumerator(tags.Receive()) == S_OK ? CountAscending(tags.Get()) : -1;
}

TEST(StressBagLockTest, LockedGroupsStayWholeAndNoWriteIsLost) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, bag->SetULong(kCounterTag, 0));
    for (uint32_t tag : kGroupTags) {
        ASSERT_EQ(S_OK, bag->SetULong(tag, 0));
    }
    std::atomic<int> lockersRunning{kLockers};

    std::vector<std::thread> threads;
    for (int locker = 0; locker < kLockers; ++locker) {
        threads.emplace_back([&, locker] {
            const uint32_t privateTag = 0x1000 + static_cast<uint32_t>(locker);
            for (int round = 1; round <= kRoundsPerLocker; ++round) {
                const uint32_t value = static_cast<uint32_t>(locker * 100000 + round);
                EXPECT_EQ(S_OK, bag->LockBag());
                EXPECT_EQ(S_OK, bag->LockBag());
                const int tagsBefore = CountTags(bag.Get());
                for (uint32_t tag : kGroupTags) {
                    EXPECT_EQ(S_OK, bag->SetULong(tag, value));
                    std::this_thread::yield();
                }
                EXPECT_TRUE(GroupIsWhole(bag.Get())) << "a locked section saw a broken group";
                uint32_t counter = 0;
                EXPECT_EQ(S_OK, bag->GetULong(kCounterTag, &counter));
                EXPECT_EQ(S_OK, bag->SetULong(kCounterTag, counter + 1));
                EXPECT_EQ(CountTags(bag.Get()), tagsBefore)
                    << "an unlocked write landed inside a locked section";
                // One level of the lock given back, the other still held: a tag of this locker
                // appears, and outside the lock every other round it goes again.
                EXPECT_EQ(S_OK, bag->UnlockBag());
                EXPECT_EQ(S_OK, bag->SetLong(privateTag, round));
                EXPECT_EQ(S_OK, bag->UnlockBag());
                if (round % 2 == 0) {
                    EXPECT_EQ(S_OK, bag->RemoveTag(privateTag));
                }
            }
            --lockersRunning;
        });
    }
    for (uint32_t writer = 0; writer < kWriters; ++writer) {
        threads.emplace_back([&, writer] {
            for (uint32_t i = 0; i < kWritesPerWriter; ++i) {
                EXPECT_EQ(S_OK, bag->SetULong(0x10000 * (writer + 1) + i, i));
            }
        });
    }
    for (int observer = 0; observer < kObservers; ++observer) {
        threads.emplace_back([&] {
            while (lockersRunning > 0) {
                CountedPtr<IuxSysPropertyBag> copy;
                EXPECT_EQ(S_OK, bag->Clone(copy.Receive()));
                EXPECT_TRUE(GroupIsWhole(copy.Get())) << "a copy holds a broken group";
                CountedPtr<IuxSysEnumPropertyTag> tags;
                EXPECT_EQ(S_OK, bag->GetTagEnumerator(tags.Receive()));
                EXPECT_GE(CountAscending(tags.Get()), 0);
                CountedPtr<IuxSysEnumPropertyTag> modified;
                EXPECT_EQ(S_OK, bag->GetModifiedTagEnumerator(modified.Receive()));
                EXPECT_GE(CountAscending(modified.Get()), 0);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }

    EXPECT_TRUE(GroupIsWhole(bag.Get()));
    uint32_t group = 0;
    EXPECT_EQ(S_OK, bag->GetULong(kGroupTags[0], &group));
    EXPECT_EQ(static_cast<uint32_t>(kRoundsPerLocker), group % 100000) << "a last round was lost";
    uint32_t counter = 0;
    EXPECT_EQ(S_OK, bag->GetULong(kCounterTag, &counter));
    EXPECT_EQ(static_cast<uint32_t>(kLockers * kRoundsPerLocker), counter);
    EXPECT_EQ(E_FAIL, bag->UnlockBag()) << "every caller lock was given back";
    for (int locker = 0; locker < kLockers; ++locker) {
        EXPECT_EQ(S_FALSE, bag->HasTag(0x1000 + static_cast<uint32_t>(locker)));
    }
    EXPECT_EQ(static_cast<int>(1 + 4 + kWriters * kWritesPerWriter), CountTags(bag.Get()));
}

}  // namespace

}  // namespace kest::test::stress
