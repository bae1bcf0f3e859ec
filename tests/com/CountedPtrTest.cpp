#include <gtest/gtest.h>

#include <atomic>
#include <utility>

#include "com/CountedPtr.h"

namespace kest::test::com {

namespace {

// A counted object outside the component model: the counter types of the plug-in look like this.
class CountedThing {
  public:
    explicit CountedThing(int* destroyed) : destroyed_(destroyed) {}
    void AddRef() { ++count_; }
    void Release() {
        if (--count_ == 0) {
            ++*destroyed_;
            delete this;
        }
    }
    int Count() const { return count_; }

  private:
    ~CountedThing() = default;
    std::atomic<int> count_{1};
    int* destroyed_;
};

TEST(CountedPtrTest, AdoptingKeepsTheCountSharingAddsOne) {
    int destroyed = 0;
    auto* thing = new CountedThing(&destroyed);
    {
        CountedPtr<CountedThing> adopted(thing, kAdoptReference);
        EXPECT_EQ(1, thing->Count());
        CountedPtr<CountedThing> shared(thing);
        EXPECT_EQ(2, thing->Count());
        CountedPtr<CountedThing> copy = shared;
        EXPECT_EQ(3, thing->Count());
        CountedPtr<CountedThing> moved = std::move(copy);
        EXPECT_EQ(3, thing->Count());
        EXPECT_FALSE(copy);  // NOLINT(bugprone-use-after-move): the moved-from state is tested
        EXPECT_EQ(moved, shared);
        shared = moved;  // assignment of the same object keeps the count
        EXPECT_EQ(3, thing->Count());
        moved.Reset();
        EXPECT_EQ(2, thing->Count());
        EXPECT_EQ(0, destroyed);
    }
    EXPECT_EQ(1, destroyed);
}

TEST(CountedPtrTest, DetachHandsTheReferenceOnAndReceiveDropsTheOldOne) {
    int destroyed = 0;
    CountedPtr<CountedThing> first(new CountedThing(&destroyed), kAdoptReference);
    CountedThing* raw = first.Detach();
    EXPECT_EQ(nullptr, first.Get());
    EXPECT_EQ(1, raw->Count());

    CountedPtr<CountedThing> holder(raw, kAdoptReference);
    CountedThing** slot = holder.Receive();
    EXPECT_EQ(1, destroyed);
    EXPECT_EQ(nullptr, *slot);
    *slot = new CountedThing(&destroyed);
    EXPECT_TRUE(holder);
    holder = nullptr;
    EXPECT_EQ(2, destroyed);
}

}  // namespace

}  // namespace kest::test::com
