// The deferred interface restart: its delays, the order of its library calls, the adapter
// disabled case, failures on its thread, and waiting for it when the last reference goes.
#include <gmock/gmock.h>
#include <pthread.h>
#include <time.h>

#include "NetworkTestSupport.h"
#include "network/DeferredPersistTask.h"
#include "network/NetworkTags.h"
#include "uxsys/StatusCodes.h"

namespace network_test {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
namespace tag = NetworkTag;

// Monotonic milliseconds, on the clock the call log uses.
double MonotonicMs() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec) * 1000.0 + static_cast<double>(now.tv_nsec) / 1e6;
}

// The log's three decimals cut the time, so a logged time may lie up to 1 µs before the call.
constexpr double kLogResolutionMs = 0.001;

// A handler that records when and on which thread its deferred-persist hook runs.
class RecordingHandler : public ItemHandler {
  public:
    explicit RecordingHandler(HRESULT hookFailure = S_OK)
        : ItemHandler(L"eth0", L"Ethernet Adapter eth0", kNumericAttribute),
          hookFailure_(hookFailure) {}

    HRESULT OnDeferredPersist(IuxSysPropertyBag* changes,
                              CountedPtr<vq::targetcfg::IDeviceHandler>& deviceHandler) override {
        hookTimeMs = MonotonicMs();
        char name[16] = {};
        pthread_getname_np(pthread_self(), name, sizeof(name));
        threadName = name;
        sawChanges = changes != nullptr;
        sawDevice = static_cast<bool>(deviceHandler);
        if (hookFailure_ < 0) {
            throw static_cast<long>(hookFailure_);
        }
        return S_OK;
    }

    double hookTimeMs = 0;
    std::string threadName;
    bool sawChanges = false;
    bool sawDevice = false;

  private:
    HRESULT hookFailure_;
};

class DeferredTaskTest : public NetworkTest {
  protected:
    void SetUp() override {
        WriteState(AdapterState());
        vq::dsc::Vector<vq::targetcfg::IDeviceHandler*> devices;
        vq::targetcfg::GetDeviceHandlers(devices);
        ASSERT_EQ(1u, devices.size());
        device_ = CountedPtr<vq::targetcfg::IDeviceHandler>(devices[0], kAdoptReference);
        ClearCallLog();
    }

    // Runs a task to its end: the last reference waits for the thread.
    void RunTask(CountedPtr<vq::targetcfg::IDeviceHandler> device, bool adapterDisabled,
                 const CountedPtr<RecordingHandler>& handler, const BagRows& changes) {
        CountedPtr<IuxSysPropertyBag4> bag = MakeBag(changes);
        startMs_ = MonotonicMs();
        CountedPtr<DeferredPersistTask> task = MakeCounted<DeferredPersistTask>(
            std::move(device), adapterDisabled, CountedPtr<ItemHandler>(handler),
            CountedPtr<IuxSysPropertyBag2>(bag));
        task.Reset();
        endMs_ = MonotonicMs();
    }

    CountedPtr<vq::targetcfg::IDeviceHandler> device_;
    double startMs_ = 0;
    double endMs_ = 0;
};

TEST_F(DeferredTaskTest, TogglesTheInterfaceAfterItsDelaysAndReappliesTheLinkSpeed) {
    CountedPtr<RecordingHandler> handler = MakeCounted<RecordingHandler>();
    RunTask(
        device_, false, handler,
        {{tag::kAdapterMode, BagValue::ULong(2)}, {tag::kPreferredMediaMode, BagValue::ULong(8)}});

    const std::vector<LoggedCall> calls = TimedCallLog();
    ASSERT_EQ(3u, calls.size());
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t0", calls[0].call);
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t1", calls[1].call);
    EXPECT_EQ("SetDeviceSettings\t0\t0\t8\t0\t0", calls[2].call);
    EXPECT_GE(handler->hookTimeMs, startMs_ + 100);
    EXPECT_GE(calls[0].milliseconds + kLogResolutionMs, handler->hookTimeMs);
    EXPECT_GE(calls[1].milliseconds, calls[0].milliseconds + 900);
    // Releasing the last reference waited for the whole toggle.
    EXPECT_GE(endMs_, calls[2].milliseconds);
    EXPECT_EQ("ToggleNIC", handler->threadName);
    EXPECT_TRUE(handler->sawChanges);
    EXPECT_TRUE(handler->sawDevice);
}

TEST_F(DeferredTaskTest, DisabledAdapterStaysDown) {
    CountedPtr<RecordingHandler> handler = MakeCounted<RecordingHandler>();
    RunTask(
        device_, true, handler,
        {{tag::kAdapterMode, BagValue::ULong(1)}, {tag::kPreferredMediaMode, BagValue::ULong(8)}});

    const std::vector<LoggedCall> calls = TimedCallLog();
    ASSERT_EQ(1u, calls.size());
    EXPECT_EQ("SetNetworkInterfaceState\t0\teth0\t0", calls[0].call);
    EXPECT_GE(calls[0].milliseconds + kLogResolutionMs, startMs_ + 100);
}

TEST_F(DeferredTaskTest, WithoutAnAdapterOnlyTheHookRuns) {
    CountedPtr<RecordingHandler> handler = MakeCounted<RecordingHandler>();
    RunTask(nullptr, false, handler, {});
    EXPECT_GE(handler->hookTimeMs, startMs_ + 100);
    EXPECT_FALSE(handler->sawDevice);
    EXPECT_THAT(CallLog(), IsEmpty());
}

TEST_F(DeferredTaskTest, FailuresOnTheTaskThreadAreOnlyTraced) {
    CaptureTraces(kTraceErrors);
    RunTask(device_, false, MakeCounted<RecordingHandler>(E_INVALIDARG),
            {{tag::kAdapterMode, BagValue::ULong(2)}});
    EXPECT_THAT(CallLog(), IsEmpty());

    // The changes lack the media mode, so setting the link speed fails after the toggle.
    RunTask(device_, false, MakeCounted<RecordingHandler>(),
            {{tag::kAdapterMode, BagValue::ULong(2)}});
    EXPECT_THAT(CallLog(), ElementsAre("SetNetworkInterfaceState\t0\teth0\t0",
                                       "SetNetworkInterfaceState\t0\teth0\t1"));

    std::vector<std::string> texts;
    for (const TraceRecord& trace : Traces()) {
        texts.push_back(trace.text);
    }
    EXPECT_THAT(texts, ElementsAre("Failed to save changes(" + std::to_string(E_INVALIDARG) + ")",
                                   "Failed to set link speed (" +
                                       std::to_string(UX_E_PROPERTY_NOT_FOUND) + ")"));
}

}  // namespace
}  // namespace network_test
