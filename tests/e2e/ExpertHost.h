// A host's view of one expert for end-to-end tests: a private sysroot with the simulated
// controller's state file, the loaded plug-in, and small helpers that read results the way a
// host does.
#pragma once

#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "common/TempSysroot.h"
#include "hostkit/DemoController.h"
#include "hostkit/HostText.h"
#include "hostkit/Plugin.h"
#include "uxsys/HostString.h"
#include "uxsys/Interfaces.h"

namespace kest::test::e2e {

using kest::hostkit::InterfaceRef;
using kest::hostkit::kControllerCallLogPath;
using kest::hostkit::TakeWideHostString;

constexpr uint32_t kItemNameTag = 0x0101D000;
constexpr wchar_t kSystemItemName[] = L"VQ KEST Chassis";

// The controller's system settings that every state of these tests carries.
constexpr char kSystemState[] =
    "[System]\nHostName = kest-1\nLanguageName = English\nSupportedLanguages = English,German\n"
    "TimeZone = Europe/Berlin\n";

// A controller state with one device of the given type and interface name.
inline std::string StateWithDevice(int type, const std::string& interfaceName) {
    return kSystemState + ("[Device0]\nType = " + std::to_string(type) +
                           "\nInterfaceName = " + interfaceName + "\nIndex = 3\n");
}

// The operation at `slot` of the virtual table of `object`, called with `arguments`: how a host
// reaches operations that no interface it knows declares.
template <class Result, class... Arguments>
Result CallSlot(void* object, int slot, Arguments... arguments) {
    using Operation = Result (*)(void*, Arguments...);
    return (*static_cast<Operation**>(object))[slot](object, arguments...);
}

// Every name an enumerator yields, which is released.
inline std::vector<std::wstring> TakeNames(IuxSysEnumStringList* names) {
    const InterfaceRef<IuxSysEnumStringList> held(names);
    std::vector<std::wstring> result;
    CvqBStr name = nullptr;
    uint32_t fetched = 0;
    while (names->Next(1, &name, &fetched) == S_OK && fetched == 1) {
        result.push_back(TakeWideHostString(name));
    }
    return result;
}

// The item name a property bag carries.
inline std::wstring ItemNameIn(IuxSysPropertyBag* bag) {
    CvqBStr name = nullptr;
    EXPECT_EQ(S_OK, bag->GetString(kItemNameTag, &name));
    return TakeWideHostString(name);
}

// A search sink that records the item name of every bag and answers with a fixed status; it
// counts its references, so it also stands for a host's callback object.
class RecordingSink : public IuxSysSearchSink {
  public:
    explicit RecordingSink(HRESULT answer) : answer_(answer) {}

    HRESULT QueryInterface(const IID& /*iid*/, void** object) override {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    uint32_t AddRef() override { return ++count_; }
    uint32_t Release() override { return --count_; }
    HRESULT Reserved3() override { return E_NOTIMPL; }
    HRESULT Reserved4() override { return E_NOTIMPL; }
    HRESULT OnItemFound(IuxSysPropertyBag* item) override {
        names.push_back(ItemNameIn(item));
        return answer_;
    }

    uint32_t References() const { return count_; }

    std::vector<std::wstring> names;

  private:
    HRESULT answer_;
    std::atomic<uint32_t> count_{1};
};

// A fixture with a sysroot, the plug-in and one expert from the factory.
class ExpertHostTest : public ::testing::Test {
  protected:
    void SetUp() override {
        sysroot.WriteFile("/etc/korvane/version", "22.5.0\n");
        expert = plugin.CreateExpert();
    }

    void WriteControllerState(const std::string& state) const {
        kest::hostkit::WriteControllerState(sysroot.Root(), state);
    }

    // The logged controller calls (name and arguments, tab-separated) that start with `prefix`,
    // and their times in milliseconds when `times` is given.
    std::vector<std::string> ControllerCalls(const std::string& prefix,
                                             std::vector<double>* times = nullptr) const {
        std::vector<std::string> calls;
        std::istringstream log(sysroot.ReadFile(kControllerCallLogPath));
        for (std::string line; std::getline(log, line);) {
            const std::string call = line.substr(line.find('\t') + 1);
            if (call.compare(0, prefix.size(), prefix) == 0) {
                calls.push_back(call);
                if (times != nullptr) {
                    times->push_back(std::strtod(line.c_str(), nullptr));
                }
            }
        }
        return calls;
    }

    kest::test::TempSysroot sysroot;
    kest::hostkit::Plugin plugin{KEST_PLUGIN_PATH};
    InterfaceRef<IuxSysExpert3> expert;
};

}  // namespace kest::test::e2e
