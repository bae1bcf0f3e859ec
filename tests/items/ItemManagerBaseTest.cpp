// The item manager base: the process-wide instance, lookups with re-discovery, snapshots and
// clearing, and the refresh-tag test.
#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "ItemTestSupport.h"
#include "property/CuxDynamicPropertyBag.h"

namespace kest::test::items {
namespace {

class ItemManagerBaseTest : public ::testing::Test {
  protected:
    void SetUp() override {
        TestManager::itemNames = {L"VQ KEST Chassis", L"eth0"};
        manager = ItemManagerBase::GetInstance<TestManager>(true);
        ASSERT_TRUE(manager);
    }

    TestManager& Manager() { return static_cast<TestManager&>(*manager); }

    CountedPtr<ItemManagerBase> manager;
};

TEST_F(ItemManagerBaseTest, InstanceIsSharedAndForgottenWithItsLastReference) {
    const int constructed = TestManager::constructedManagers;
    CountedPtr<ItemManagerBase> second = ItemManagerBase::GetInstance<TestManager>(true);
    EXPECT_EQ(manager, second);
    EXPECT_EQ(manager, ItemManagerBase::GetInstance<TestManager>(false));
    EXPECT_EQ(constructed, TestManager::constructedManagers);
    EXPECT_EQ(3u, second->AddRef()) << "AddRef and Release return the new count";
    EXPECT_EQ(2u, second->Release());

    manager.Reset();
    EXPECT_TRUE(ItemManagerBase::GetInstance<TestManager>(false));
    second.Reset();
    EXPECT_FALSE(ItemManagerBase::GetInstance<TestManager>(false));
    manager = ItemManagerBase::GetInstance<TestManager>(true);
    EXPECT_EQ(constructed + 1, TestManager::constructedManagers);
    manager->GetItemHandlers(true);
    const int destroyed = TestManager::destroyedHandlers;
    manager.Reset();
    EXPECT_EQ(destroyed + 2, TestManager::destroyedHandlers) << "its handlers go with it";
}

TEST_F(ItemManagerBaseTest, FindDoesNotDiscoverGetDoesOnAMissAndThrowsForAnUnknownName) {
    EXPECT_FALSE(manager->FindItemHandler(L"eth0"));
    EXPECT_EQ(0, Manager().enumerations);

    CountedPtr<ItemHandler> found = manager->GetItemHandler(L"ETH0");
    ASSERT_TRUE(found);
    EXPECT_EQ(L"eth0", found->ItemName());
    EXPECT_EQ(found, manager->GetItemHandler(L"Eth0"));
    EXPECT_EQ(1, Manager().enumerations);

    try {
        manager->GetItemHandler(L"eth1");
        FAIL() << "no status thrown";
    } catch (long status) {
        EXPECT_EQ(UX_E_ITEM_NOT_FOUND, status);
    }
    EXPECT_EQ(2, Manager().enumerations) << "one more discovery on the miss";
    EXPECT_EQ(2u, manager->GetItemHandlers(false).size());
}

TEST_F(ItemManagerBaseTest, SnapshotKeepsItsHandlersAcrossClearItems) {
    const ItemHandlerList before = manager->GetItemHandlers(true);
    EXPECT_EQ(S_FALSE, manager->EnumerateItems());
    ASSERT_EQ(2u, before.size());
    EXPECT_EQ(L"VQ KEST Chassis", before[0]->ItemName());
    EXPECT_EQ(L"eth0", before[1]->ItemName());
    const int destroyed = TestManager::destroyedHandlers;

    manager->ClearItems();
    EXPECT_TRUE(manager->GetItemHandlers(false).empty());
    EXPECT_EQ(destroyed, TestManager::destroyedHandlers);
    CountedPtr<IuxSysPropertyBag4> bag = CreatePropertyBag();
    EXPECT_EQ(S_OK, before[1]->GetItemProperties(bag.Get()));

    EXPECT_EQ(S_OK, manager->EnumerateItems());
    const ItemHandlerList after = manager->GetItemHandlers(true);
    ASSERT_EQ(2u, after.size());
    EXPECT_NE(before[0], after[0]);
    EXPECT_NE(before[1], after[1]);
}

TEST(ItemManagerInstanceTest, ConcurrentAcquireAndReleaseNeverReviveADyingManager) {
    TestManager::itemNames = {L"VQ KEST Chassis"};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([] {
            for (int i = 0; i < 2000; ++i) {
                CountedPtr<ItemManagerBase> manager =
                    ItemManagerBase::GetInstance<TestManager>(true);
                ASSERT_TRUE(manager);
                ASSERT_EQ(1u, manager->GetItemHandlers(true).size());
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_FALSE(ItemManagerBase::GetInstance<TestManager>(false));
}

struct RequestCase {
    const char* name;
    std::vector<uint32_t> tags;
    bool requested;
};

class AreTagsRequestedTest : public ::testing::TestWithParam<RequestCase> {};

TEST_P(AreTagsRequestedTest, IgnoresTheLowTwelveBits) {
    const PropertyTagSet refreshTags = {0x0D107000, 0x0D118000};
    const RequestCase& c = GetParam();
    EXPECT_EQ(c.requested, ItemManagerBase::AreTagsRequested(
                               static_cast<uint32_t>(c.tags.size()),
                               c.tags.empty() ? nullptr : c.tags.data(), refreshTags));
}

INSTANTIATE_TEST_SUITE_P(
    Requests, AreTagsRequestedTest,
    ::testing::Values(RequestCase{"Exact", {0x0D107000}, true},
                      RequestCase{"LowBitsDiffer", {0x0D107FFF}, true},
                      RequestCase{"LaterTagMatches", {0x01001000, 0x0D118001}, true},
                      RequestCase{"NextTagAbove", {0x0D108000}, false},
                      RequestCase{"Empty", {}, false}),
    [](const ::testing::TestParamInfo<RequestCase>& param) { return param.param.name; });

}  // namespace
}  // namespace kest::test::items
