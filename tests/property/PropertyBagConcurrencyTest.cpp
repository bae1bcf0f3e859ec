#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "PropertyTestSupport.h"
#include "property/CuxDynamicPropertyBag.h"

namespace kest::test::property {

namespace {

constexpr uint32_t kCounterTag = 1;
constexpr uint32_t kGroupTags[] = {0xA, 0xB, 0xC};
constexpr uint32_t kWriters = 3;
constexpr uint32_t kWritesPerWriter = 1000;
constexpr uint32_t kLockedRounds = 300;

uint32_t WriterTag(uint32_t writer, uint32_t index) {
    return 0x10000 * (writer + 1) + index;
}

uint32_t CountTags(IuxSysPropertyBag4* bag) {
    CountedPtr<IuxSysEnumPropertyTag> tags;
    bag->GetTagEnumerator(tags.Receive());
    return static_cast<uint32_t>(DrainTags(tags.Get()).size());
}

// True when the three group tags of `bag` hold one value.
bool GroupIsWhole(IuxSysPropertyBag* bag) {
    uint32_t values[3] = {};
    for (int i = 0; i < 3; ++i) {
        bag->GetULong(kGroupTags[i], &values[i]);
    }
    return values[0] == values[1] && values[1] == values[2];
}

// One thread holds the caller lock across a group of writes while writers add tags and bump a
// counter under the lock, and an observer copies the bag: every copy shows the group whole, no
// foreign write lands inside the locked group, and every write survives.
TEST(PropertyBagConcurrencyTest, LockedSequencesAreSeenWholeAndNoWriteIsLost) {
    const CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    ASSERT_EQ(S_OK, bag->SetULong(kCounterTag, 0));
    for (uint32_t tag : kGroupTags) {
        ASSERT_EQ(S_OK, bag->SetULong(tag, 0));
    }
    std::atomic<bool> holderDone{false};
    std::atomic<int> interleavedWrites{0};
    std::atomic<int> brokenGroups{0};
    std::atomic<int> failedCalls{0};

    std::vector<std::thread> threads;
    threads.emplace_back([&] {
        for (uint32_t round = 1; round <= kLockedRounds; ++round) {
            bag->LockBag();
            const uint32_t before = CountTags(bag.Get());
            for (uint32_t tag : kGroupTags) {
                failedCalls += bag->SetULong(tag, round) != S_OK;
                std::this_thread::yield();
            }
            interleavedWrites += CountTags(bag.Get()) != before;
            bag->UnlockBag();
        }
        holderDone = true;
    });
    for (uint32_t writer = 0; writer < kWriters; ++writer) {
        threads.emplace_back([&, writer] {
            for (uint32_t i = 0; i < kWritesPerWriter; ++i) {
                failedCalls += bag->SetULong(WriterTag(writer, i), i) != S_OK;
                bag->LockBag();
                uint32_t counter = 0;
                failedCalls += bag->GetULong(kCounterTag, &counter) != S_OK;
                failedCalls += bag->SetULong(kCounterTag, counter + 1) != S_OK;
                bag->UnlockBag();
            }
        });
    }
    threads.emplace_back([&] {
        while (!holderDone) {
            CountedPtr<IuxSysPropertyBag> copy;
            failedCalls += bag->Clone(copy.Receive()) != S_OK;
            brokenGroups += !GroupIsWhole(copy.Get());
        }
    });
    for (std::thread& thread : threads) {
        thread.join();
    }

    EXPECT_EQ(0, failedCalls.load());
    EXPECT_EQ(0, interleavedWrites.load()) << "another thread wrote inside a locked sequence";
    EXPECT_EQ(0, brokenGroups.load()) << "a copy showed half of a locked sequence";
    uint32_t counter = 0;
    EXPECT_EQ(S_OK, bag->GetULong(kCounterTag, &counter));
    EXPECT_EQ(kWriters * kWritesPerWriter, counter);
    EXPECT_EQ(1 + 3 + kWriters * kWritesPerWriter, CountTags(bag.Get()));
    uint32_t value = 0;
    EXPECT_EQ(S_OK, bag->GetULong(kGroupTags[2], &value));
    EXPECT_EQ(kLockedRounds, value);
    EXPECT_EQ(E_FAIL, bag->UnlockBag());
}

}  // namespace

}  // namespace kest::test::property
