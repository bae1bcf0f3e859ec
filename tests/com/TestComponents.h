// Small components for the object-model tests: a primary chain of two interfaces plus a
// secondary interface, and a destruction counter.
#pragma once

#include <atomic>
#include <stdexcept>

#include "com/CVQComMultiThreadModelNoCS.h"
#include "com/CVQComObject.h"
#include "com/CVQComObjectRootEx.h"
#include "uxsys/IUnknown.h"

namespace kest::test::com {

inline constexpr IID IID_ITestBase = {
    0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, 0x01}};
inline constexpr IID IID_ITestDerived = {
    0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, 0x02}};
inline constexpr IID IID_ITestSecondary = {
    0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, 0x03}};
inline constexpr IID IID_ITestUnanswered = {
    0x11111111, 0x2222, 0x3333, {0x44, 0x44, 0x55, 0x55, 0x55, 0x55, 0x55, 0x04}};

class ITestBase : public IUnknown {
  public:
    virtual int Base() = 0;

  protected:
    ~ITestBase() = default;
};

class ITestDerived : public ITestBase {
  public:
    virtual int Derived() = 0;

  protected:
    ~ITestDerived() = default;
};

class ITestSecondary : public IUnknown {
  public:
    virtual int Secondary() = 0;

  protected:
    ~ITestSecondary() = default;
};

class TestComponent : public ITestDerived,
                      public ITestSecondary,
                      public virtual CVQComObjectRootEx<CVQComMultiThreadModelNoCS> {
  public:
    using InterfaceMap = ComInterfaceMap<ComInterface<&IID_ITestBase, ITestDerived>,
                                         ComInterface<&IID_ITestDerived, ITestDerived>,
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

    int Base() override { return 1; }
    int Derived() override { return 2; }
    int Secondary() override { return 3; }

    // The count seen by the last destructor after taking one more reference (2 when sound).
    static inline std::atomic<int> countDuringDestruction{0};

  private:
    std::atomic<int>* destructions_;
};

}  // namespace kest::test::com
