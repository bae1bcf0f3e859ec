// Experts under concurrency, through the loaded plug-in as a host uses it: many threads create,
// initialise, query and release experts at once, and searches and reads run while another
// thread persists changes. Every call must succeed and every value read must be one that was
// written at some point.
#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "e2e/ExpertHost.h"

namespace kest::test::stress {

namespace {

using kest::test::e2e::InterfaceRef;
using kest::test::e2e::kSystemItemName;
using kest::test::e2e::TakeNames;

constexpr uint32_t kHostNameTag = 0x0101F000;
constexpr uint32_t kCommentTag = 0x0103D000;
constexpr uint32_t kWebServiceTag = 0x21004000;
constexpr int kLifecycleThreads = 6;
constexpr int kLifecycleRounds = 20;
constexpr int kReaderThreads = 4;
constexpr int kPersists = 40;

class StressExpertTest : public kest::test::e2e::ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(std::string(kest::test::e2e::kSystemState) +
                             "UserComment = initial\n[Device0]\nType = 1\nInterfaceName = eth0\n");
        sysroot.MakeDirectory("/etc/korvane/share");
        ExpertHostTest::SetUp();
    }

    // The system item's string property `tag`, read through `from`; empty when a call fails.
    static std::wstring ReadText(IuxSysExpert3* from, uint32_t tag) {
        InterfaceRef<IuxSysPropertyBag> bag;
        EXPECT_EQ(from->GetPropertiesOfItem(kSystemItemName, bag.Receive()), S_OK);
        CvqBStr text = nullptr;
        EXPECT_TRUE(bag && bag->GetString(tag, &text) == S_OK);
        return kest::test::e2e::TakeWideHostString(text);
    }

    // A bag of changes made from the system item's properties with `write` applied.
    template <class Write>
    static InterfaceRef<IuxSysPropertyBag> Changes(IuxSysExpert3* from, Write&& write) {
        InterfaceRef<IuxSysPropertyBag> current;
        InterfaceRef<IuxSysPropertyBag> changes;
        EXPECT_EQ(from->GetPropertiesOfItem(kSystemItemName, current.Receive()), S_OK);
        EXPECT_TRUE(current && current->Clone(changes.Receive()) == S_OK);
        if (changes) {
            write(changes.Get());
        }
        return changes;
    }
};

TEST_F(StressExpertTest, ThreadsCreateQueryAndReleaseExperts) {
    const std::vector<std::wstring> expectedNames = {kSystemItemName, L"eth0"};
    std::vector<std::thread> threads;
    for (int t = 0; t < kLifecycleThreads; ++t) {
        threads.emplace_back([&, t] {
            for (int round = 0; round < kLifecycleRounds; ++round) {
                IuxSysExpert3* own = nullptr;
                ASSERT_EQ(plugin.Factory()(&own), S_OK);
                ASSERT_NE(own, nullptr);
                EXPECT_EQ(own->Initialize(), S_OK);
                IuxSysEnumStringList* names = nullptr;
                ASSERT_EQ(own->SearchForItemNames(&names), S_OK);
                EXPECT_EQ(TakeNames(names), expectedNames);
                EXPECT_EQ(ReadText(own, kHostNameTag), L"kest-1");
                const InterfaceRef<IuxSysPropertyBag> changes =
                    Changes(own, [&](IuxSysPropertyBag* bag) {
                        bag->SetString(kHostNameTag, (L"kest-" + std::to_wstring(t + 2)).c_str());
                    });
                InterfaceRef<IuxSysEnumPropertyTag> validated;
                CvqBStr message = nullptr;
                EXPECT_TRUE(changes &&
                            own->ValidatePropertyChanges(kSystemItemName, changes.Get(),
                                                         validated.Receive(), &message) == S_OK);
                CvqBStrFree(message);
                // Uninitialize drops the shared item handlers that other threads are using.
                EXPECT_EQ(own->Uninitialize(), S_OK);
                EXPECT_EQ(own->Release(), 0u) << "the last reference";
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

TEST_F(StressExpertTest, SearchesAndReadsRacePersists) {
    std::set<std::wstring> written = {L"initial"};
    for (int i = 0; i < kPersists; ++i) {
        written.insert(L"comment " + std::to_wstring(i));
    }
    std::atomic<bool> persisting{true};
    std::vector<std::thread> readers;
    for (int r = 0; r < kReaderThreads; ++r) {
        readers.emplace_back([&, r] {
            const InterfaceRef<IuxSysExpert3> own = plugin.CreateExpert();
            // At least a few rounds each, however quickly the persists end.
            for (int rounds = 0; persisting || rounds < 5; ++rounds) {
                if (r % 2 == 0) {
                    kest::test::e2e::RecordingSink sink(S_OK);
                    EXPECT_EQ(own->SearchForItemsAndProperties(&sink), S_OK);
                    EXPECT_EQ(sink.names.size(), 2u);
                }
                const std::wstring comment = ReadText(own.Get(), kCommentTag);
                EXPECT_EQ(written.count(comment), 1u) << "a comment that was never written";
            }
        });
    }
    for (int i = 0; i < kPersists; ++i) {
        const InterfaceRef<IuxSysPropertyBag> changes =
            Changes(expert.Get(), [&](IuxSysPropertyBag* bag) {
                bag->SetString(kCommentTag, (L"comment " + std::to_wstring(i)).c_str());
                bag->SetBool(kWebServiceTag, i % 2);
            });
        int32_t restart = -1;
        EXPECT_TRUE(changes && expert->PersistPropertyChanges(kSystemItemName, changes.Get(),
                                                              &restart) == S_OK);
    }
    persisting = false;
    for (std::thread& thread : readers) {
        thread.join();
    }
    EXPECT_EQ(ReadText(expert.Get(), kCommentTag), L"comment " + std::to_wstring(kPersists - 1));
}

}  // namespace

}  // namespace kest::test::stress
