// The deferred interface restart: its delays, the order of its library calls, the disabled
// adapter, failures on its thread, and waiting for it when the last reference goes.
#include <gmock/gmock.h>
#include <pthread.h>
#include <chrono>
#include <cstdlib>

#include "NetworkTestSupport.h"
#include "items/DeferredPersistTask.h"

using namespace kest::items;

namespace kest::test::network {
namespace {

using ::testing::ElementsAre;

// Milliseconds on the clock the call log uses (CLOCK_MONOTONIC).
double MonotonicMs() {
    return std::chrono::duration<double, std::milli>(
               std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

// The log keeps three decimals, so a logged time may lie up to 1 µs before the call.
constexpr double kLogResolutionMs = 0.001;

// A handler that records when and on which thread its deferred-persist hook runs.
class RecordingHandler : public ItemHandler {
  public:
    RecordingHandler() : ItemHandler(L"eth0", L"", kNumericAttribute) {}

    HRESULT OnDeferredPersist(IuxSysPropertyBag* changes,
                              CountedPtr<vq::targetcfg::IDeviceHandler>& device) override {
        hookMs = MonotonicMs();
        char name[16] = {};
        pthread_getname_np(pthread_self(), name, sizeof(name));
        threadName = name;
        sawChangesAndDevice = changes != nullptr && device;
        if (hookFailure < 0) {
            throw static_cast<long>(hookFailure);
        }
        return S_OK;
    }

    double hookMs = 0;
    std::string threadName;
    bool sawChangesAndDevice = false;
    HRESULT hookFailure = S_OK;  // thrown by the hook when negative
};

class DeferredTaskTest : public NetworkTest {
  protected:
    // Runs a task to its end (dropping the last reference waits for its thread) and returns the
    // handler it called.
    CountedPtr<RecordingHandler> RunTask(bool withDevice, bool adapterDisabled,
                                         const std::string& changes, HRESULT hookFailure = S_OK) {
        WriteState(AdapterState());
        CountedPtr<vq::targetcfg::IDeviceHandler> device = FirstDevice();
        CountedPtr<RecordingHandler> handler = MakeCounted<RecordingHandler>();
        handler->hookFailure = hookFailure;
        ClearCallLog();
        startMs_ = MonotonicMs();
        MakeCounted<DeferredPersistTask>(withDevice ? device : nullptr, adapterDisabled,
                                         CountedPtr<ItemHandler>(handler),
                                         CountedPtr<IuxSysPropertyBag2>(MakeBag(changes)));
        endMs_ = MonotonicMs();
        return handler;
    }

    // The logged calls with their CLOCK_MONOTONIC times.
    std::vector<std::pair<double, std::string>> TimedCallLog() const {
        std::vector<std::pair<double, std::string>> calls;
        std::istringstream log(sysroot_.ReadFile(kest::test::sim::kCallLogPath));
        for (std::string line; std::getline(log, line);) {
            calls.push_back({std::strtod(line.c_str(), nullptr), line.substr(line.find('\t') + 1)});
        }
        return calls;
    }

    double startMs_ = 0;
    double endMs_ = 0;
};

TEST_F(DeferredTaskTest, TogglesTheInterfaceAfterItsDelaysAndReappliesTheLinkSpeed) {
    CountedPtr<RecordingHandler> handler = RunTask(true, false, "mode=2 media=8");
    const auto calls = TimedCallLog();
    ASSERT_EQ(3u, calls.size());
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t0", calls[0].second);
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t1", calls[1].second);
    EXPECT_EQ("SetDeviceSettings\t0\t0\t8\t0\t0", calls[2].second);
    EXPECT_GE(handler->hookMs, startMs_ + 100);
    EXPECT_GE(calls[0].first + kLogResolutionMs, handler->hookMs);
    EXPECT_GE(calls[1].first, calls[0].first + 900);
    EXPECT_GE(endMs_, calls[2].first);
    EXPECT_EQ("ToggleNIC", handler->threadName);
    EXPECT_TRUE(handler->sawChangesAndDevice);
}

TEST_F(DeferredTaskTest, DisabledAdapterStaysDownAndNoAdapterMeansNoToggle) {
    RunTask(true, true, "mode=1 media=8");
    const auto calls = TimedCallLog();
    ASSERT_EQ(1u, calls.size());
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t0", calls[0].second);
    EXPECT_GE(calls[0].first + kLogResolutionMs, startMs_ + 100);

    EXPECT_GE(RunTask(false, false, "mode=2 media=8")->hookMs, startMs_ + 100);
    EXPECT_TRUE(CallLog().empty());
}

TEST_F(DeferredTaskTest, FailuresOnTheTaskThreadAreOnlyTraced) {
    CaptureTraces(kTraceErrors);
    RunTask(true, false, "mode=2", E_INVALIDARG);
    EXPECT_TRUE(CallLog().empty());
    // Without a media mode in the changes, the link speed cannot be set after the toggle.
    RunTask(true, false, "mode=2");
    EXPECT_THAT(CallLog(), ElementsAre("SetNetworkInterfaceState\t0\teth0\t0",
                                       "SetNetworkInterfaceState\t0\teth0\t1"));
    EXPECT_THAT(Traces(), ElementsAre("Failed to save changes(-2147024809) +",
                                      "Failed to set link speed (-2147220623) +"));
}

}  // namespace
}  // namespace kest::test::network
