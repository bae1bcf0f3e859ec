// Handlers and a manager for testing the item-management base classes without a controller.
#pragma once

#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "items/ItemHandler.h"
#include "items/ItemManagerBase.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::items {

// A handler with the base behaviour that counts its destructions.
class TestHandler : public ItemHandler {
  public:
    TestHandler(const std::wstring& name, std::atomic<int>* destroyed = nullptr)
        : ItemHandler(name, L"Second " + name, kNumericAttribute), destroyed_(destroyed) {}

  protected:
    ~TestHandler() override {
        if (destroyed_ != nullptr) {
            ++*destroyed_;
        }
    }

  private:
    std::atomic<int>* destroyed_;
};

// A manager whose discovery appends one handler per configured name and counts its calls.
class TestManager : public ItemManagerBase {
  public:
    // Names of the handlers the next discovery appends.
    static inline std::vector<std::wstring> itemNames;
    // Handlers destroyed and managers constructed so far in this process.
    static inline std::atomic<int> destroyedHandlers{0};
    static inline std::atomic<int> constructedManagers{0};

    TestManager() { ++constructedManagers; }
    // Lingers before the base destructor forgets the process-wide manager, so that a dying
    // manager stays visible to other threads for a while.
    ~TestManager() override { std::this_thread::sleep_for(std::chrono::microseconds(200)); }

    HRESULT ReservedManagerOperation() override { return E_NOTIMPL; }
    HRESULT RefreshItems() override { return EnumerateItems(); }
    HRESULT EnumerateItems() override {
        ++enumerations;
        vq::dsc::ScopedLock lock(ItemLock());
        if (!HasNoHandlers()) {
            return S_FALSE;
        }
        for (const std::wstring& name : itemNames) {
            AppendHandler(MakeCounted<TestHandler>(name, &destroyedHandlers));
        }
        return S_OK;
    }

    std::atomic<int> enumerations{0};
};

}  // namespace kest::test::items
