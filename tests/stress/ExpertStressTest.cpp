// Experts under concurrency, through the loaded plug-in as a host uses it: many threads create,
// initialise, query and release experts at once, and searches and reads run while another
// thread persists changes. Every call must succeed and every value read must be one that was
// written at some point.
#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "e2e/ExpertHost.h"

namespace kest::test::stress {

namespace {

using kest::test::e2e::InterfaceRef;
using kest::test::e2e::kSystemItemName;

constexpr uint32_t kHostNameTag = 0x0101F000;
constexpr uint32_t kCommentTag = 0x0103D000;
constexpr uint32_t kWebServiceTag = 0x21004000;
constexpr int kLifecycleThreads = 6;
constexpr int kLifecycleRounds = 20;
constexpr int kReaderThreads = 4;
constexpr int kPersists = 40;

// Counts the calls that did not give the expected result, by name.
class Failures {
  public:
    void Check(bool ok, const char* what) {
        if (!ok) {
            std::lock_guard<std::mutex> hold(lock_);
            failed_.insert(what);
        }
    }
    std::set<std::string> Failed() const { return failed_; }

  private:
    std::mutex lock_;
    std::set<std::string> failed_;
};

class StressExpertTest : public kest::test::e2e::ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(std::string(kest::test::e2e::kSystemState) +
                             "UserComment = initial\n[Device0]\nType = 1\nInterfaceName = eth0\n");
        sysroot.MakeDirectory("/etc/korvane/share");
        ExpertHostTest::SetUp();
    }

    // The system item's string property `tag`, read through `from`; empty when a call fails.
    static std::wstring ReadText(IuxSysExpert3* from, uint32_t tag, Failures& failures) {
        InterfaceRef<IuxSysPropertyBag> bag;
        const HRESULT got = from->GetPropertiesOfItem(kSystemItemName, bag.Receive());
        failures.Check(got == S_OK && bag, "GetPropertiesOfItem");
        if (!bag) {
            return std::wstring();
        }
        CvqBStr text = nullptr;
        failures.Check(bag->GetString(tag, &text) == S_OK, "GetString");
        return kest::test::e2e::TakeWideHostString(text);
    }

    // A bag of changes made from the system item's properties with `write` applied.
    template <class Write>
    static InterfaceRef<IuxSysPropertyBag> Changes(IuxSysExpert3* from, Failures& failures,
                                                   Write&& write) {
        InterfaceRef<IuxSysPropertyBag> current;
        InterfaceRef<IuxSysPropertyBag> changes;
        failures.Check(from->GetPropertiesOfItem(kSystemItemName, current.Receive()) == S_OK,
                       "GetPropertiesOfItem");
        if (!current) {
            return changes;
        }
        failures.Check(current->Clone(changes.Receive()) == S_OK, "Clone");
        if (changes) {
            write(changes.Get());
        }
        return changes;
    }
};

TEST_F(StressExpertTest, ThreadsCreateQueryAndReleaseExperts) {
    Failures failures;
    const std::vector<std::wstring> expectedNames = {kSystemItemName, L"eth0"};
    std::vector<std::thread> threads;
    for (int t = 0; t < kLifecycleThreads; ++t) {
        threads.emplace_back([&, t] {
            for (int round = 0; round < kLifecycleRounds; ++round) {
                IuxSysExpert3* own = nullptr;
                failures.Check(plugin.Factory()(&own) == S_OK && own != nullptr, "factory");
                if (own == nullptr) {
                    continue;
                }
                failures.Check(own->Initialize() == S_OK, "Initialize");
                IuxSysEnumStringList* names = nullptr;
                failures.Check(own->SearchForItemNames(&names) == S_OK, "SearchForItemNames");
                if (names != nullptr) {
                    failures.Check(kest::test::e2e::TakeNames(names) == expectedNames,
                                   "item names");
                }
                failures.Check(ReadText(own, kHostNameTag, failures) == L"kest-1", "host name");
                const InterfaceRef<IuxSysPropertyBag> changes =
                    Changes(own, failures, [&](IuxSysPropertyBag* bag) {
                        bag->SetString(kHostNameTag, (L"kest-" + std::to_wstring(t + 2)).c_str());
                    });
                if (changes) {
                    InterfaceRef<IuxSysEnumPropertyTag> validated;
                    CvqBStr message = nullptr;
                    failures.Check(
                        own->ValidatePropertyChanges(kSystemItemName, changes.Get(),
                                                     validated.Receive(), &message) == S_OK,
                        "ValidatePropertyChanges");
                    CvqBStrFree(message);
                }
                // Uninitialize drops the shared item handlers that other threads are using.
                failures.Check(own->Uninitialize() == S_OK, "Uninitialize");
                failures.Check(own->Release() == 0, "last reference");
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(failures.Failed(), std::set<std::string>());
}

TEST_F(StressExpertTest, SearchesAndReadsRacePersists) {
    Failures failures;
    std::set<std::wstring> written = {L"initial"};
    for (int i = 0; i < kPersists; ++i) {
        written.insert(L"comment " + std::to_wstring(i));
    }
    std::atomic<bool> persisting{true};
    std::vector<std::thread> readers;
    for (int r = 0; r < kReaderThreads; ++r) {
        readers.emplace_back([&, r] {
            const InterfaceRef<IuxSysExpert3> own = plugin.CreateExpert();
            int rounds = 0;
            // At least a few rounds each, however quickly the persists end.
            while (persisting || rounds < 5) {
                ++rounds;
                if (r % 2 == 0) {
                    kest::test::e2e::RecordingSink sink(S_OK);
                    failures.Check(own->SearchForItemsAndProperties(&sink) == S_OK, "search");
                    failures.Check(sink.names.size() == 2, "items found");
                }
                failures.Check(written.count(ReadText(own.Get(), kCommentTag, failures)) == 1,
                               "comment read is one that was written");
            }
        });
    }
    for (int i = 0; i < kPersists; ++i) {
        const InterfaceRef<IuxSysPropertyBag> changes =
            Changes(expert.Get(), failures, [&](IuxSysPropertyBag* bag) {
                bag->SetString(kCommentTag, (L"comment " + std::to_wstring(i)).c_str());
                bag->SetBool(kWebServiceTag, i % 2);
            });
        if (changes) {
            int32_t restart = -1;
            failures.Check(
                expert->PersistPropertyChanges(kSystemItemName, changes.Get(), &restart) == S_OK,
                "PersistPropertyChanges");
        }
    }
    persisting = false;
    for (std::thread& thread : readers) {
        thread.join();
    }
    EXPECT_EQ(failures.Failed(), std::set<std::string>());
    EXPECT_EQ(ReadText(expert.Get(), kCommentTag, failures),
              L"comment " + std::to_wstring(kPersists - 1));
}

}  // namespace

}  // namespace kest::test::stress
