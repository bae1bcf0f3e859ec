#include <gtest/gtest.h>

#include <atomic>
#include <stdexcept>
#include <utility>

#include "com/CVQComMultiThreadModelNoCS.h"
#include "com/CVQComObject.h"
#include "com/CVQComObjectRootEx.h"
#include "com/CountedPtr.h"
#include "uxsys/IUnknown.h"

namespace kest::test::com {

namespace {

constexpr IID TestIid(uint8_t last) {
    return {0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, last}};
}
constexpr IID IID_ITestPrimaryAlias = TestIid(1);
constexpr IID IID_ITestPrimary = TestIid(2);
constexpr IID IID_ITestSecondary = TestIid(3);
constexpr IID IID_ITestUnanswered = TestIid(4);

class ITestPrimary : public IUnknown {
  public:
    virtual int Primary() = 0;

  protected:
    ~ITestPrimary() = default;
};

class ITestSecondary : public IUnknown {
  public:
    virtual int Secondary() = 0;

  protected:
    ~ITestSecondary() = default;
};

// A primary interface answering two identifiers plus a secondary one; counts its destructions.
class TestComponent : public ITestPrimary,
                      public ITestSecondary,
                      public virtual CVQComObjectRootEx<CVQComMultiThreadModelNoCS> {
  public:
    using InterfaceMap = ComInterfaceMap<ComInterface<&IID_ITestPrimaryAlias, ITestPrimary>,
                                         ComInterface<&IID_ITestPrimary, ITestPrimary>,
                                         ComInterface<&IID_ITestSecondary, ITestSecondary>>;

    explicit TestComponent(std::atomic<int>* destructions, bool failConstruction = false)
        : destructions_(destructions) {
        if (failConstruction) {
            throw std::runtime_error("construction refused");
        }
    }
    ~TestComponent() override {
        // The dying object's count stands at 1, so a reference taken and dropped while it dies
        // cannot bring it to 0 a second time.
        countDuringDestruction = InternalAddRef();
        InternalRelease();
        ++*destructions_;
    }

    int Primary() override { return 2; }
    int Secondary() override { return 3; }

    // The count seen by the last destructor after taking one more reference (2 when sound).
    static inline std::atomic<int> countDuringDestruction{0};

  private:
    std::atomic<int>* destructions_;
};

using TestObject = CVQComObject<TestComponent>;

TEST(ComObjectTest, EveryMappedInterfaceSharesOneIdentityAndOneCount) {
    std::atomic<int> destructions{0};
    TestObject* object = nullptr;
    ASSERT_EQ(S_OK, CreateComObjectInstance<TestComponent>(&object, &destructions));
    EXPECT_EQ(1u, object->AddRef());
    ITestPrimary* primary = object;
    void* unknown = nullptr;
    ASSERT_EQ(S_OK, primary->QueryInterface(IID_IUnknown, &unknown));
    EXPECT_EQ(static_cast<void*>(primary), unknown);

    void* secondary = nullptr;
    ASSERT_EQ(S_OK, primary->QueryInterface(IID_ITestSecondary, &secondary));
    auto* second = static_cast<ITestSecondary*>(secondary);
    EXPECT_EQ(3, second->Secondary());
    EXPECT_NE(static_cast<void*>(primary), secondary);

    for (const IID* iid : {&IID_ITestPrimaryAlias, &IID_ITestPrimary, &IID_IUnknown}) {
        void* back = nullptr;
        ASSERT_EQ(S_OK, second->QueryInterface(*iid, &back));
        EXPECT_EQ(static_cast<void*>(primary), back);
        EXPECT_EQ(2, static_cast<ITestPrimary*>(back)->Primary());
        static_cast<ITestPrimary*>(back)->Release();
    }
    void* result = &result;
    EXPECT_EQ(E_NOINTERFACE, second->QueryInterface(IID_ITestUnanswered, &result));
    EXPECT_EQ(nullptr, result);
    EXPECT_EQ(E_POINTER, primary->QueryInterface(IID_ITestPrimaryAlias, nullptr));
    // Three references: the creator's, the IUnknown one and the secondary one.
    EXPECT_EQ(4u, second->AddRef());
    EXPECT_EQ(3u, primary->Release());
    EXPECT_EQ(2u, second->Release());
    EXPECT_EQ(1u, static_cast<ITestPrimary*>(unknown)->Release());
    EXPECT_EQ(0, destructions.load());
    EXPECT_EQ(0u, primary->Release());
    EXPECT_EQ(1, destructions.load());
    EXPECT_EQ(2, TestComponent::countDuringDestruction.load());
}

TEST(ComObjectTest, CountedCreationHoldsTheOnlyReferenceAndFailsWithOutOfMemory) {
    std::atomic<int> destructions{0};
    {
        CountedPtr<ITestPrimary> primary = CreateCountedComObject<TestComponent>(&destructions);
        CountedPtr<ITestSecondary> second =
            QueryCounted<ITestSecondary>(primary, IID_ITestSecondary);
        ASSERT_TRUE(second);
        EXPECT_EQ(3, second->Secondary());
        EXPECT_FALSE(QueryCounted<ITestSecondary>(primary, IID_ITestUnanswered));
        EXPECT_EQ(3u, primary->AddRef());
        EXPECT_EQ(2u, primary->Release());
    }
    EXPECT_EQ(1, destructions.load());
    TestObject* object = reinterpret_cast<TestObject*>(&destructions);
    EXPECT_EQ(E_OUTOFMEMORY, CreateComObjectInstance<TestComponent>(&object, &destructions, true));
    EXPECT_EQ(nullptr, object);
    try {
        CreateCountedComObject<TestComponent>(&destructions, true);
        FAIL() << "no status thrown";
    } catch (long status) {
        EXPECT_EQ(E_OUTOFMEMORY, status);
    }
    EXPECT_EQ(1, destructions.load());
}

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

TEST(CountedPtrTest, AdoptingKeepsTheCountSharingAddsOneDetachHandsItOn) {
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

    // Detach hands the reference on; Receive drops the old one.
    CountedPtr<CountedThing> first(new CountedThing(&destroyed), kAdoptReference);
    CountedThing* raw = first.Detach();
    EXPECT_EQ(nullptr, first.Get());
    EXPECT_EQ(1, raw->Count());

    CountedPtr<CountedThing> holder(raw, kAdoptReference);
    CountedThing** slot = holder.Receive();
    EXPECT_EQ(2, destroyed);
    EXPECT_EQ(nullptr, *slot);
    *slot = new CountedThing(&destroyed);
    EXPECT_TRUE(holder);
    holder = nullptr;
    EXPECT_EQ(3, destroyed);
}

}  // namespace

}  // namespace kest::test::com
