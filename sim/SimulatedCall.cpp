#include "SimulatedCall.h"

#include <time.h>

#include <cstdio>
#include <mutex>
#include <new>
#include <optional>
#include <string>

#include "StateStore.h"
#include "vq/targetcfg/Types.h"

namespace kest::sim {
namespace {

namespace status = vq::targetcfg::status;

void ReportFailure(const char* callName, const char* reason) noexcept {
    std::fprintf(stderr, "vqtargetcfg: %s: %s\n", callName, reason);
}

// Loads the state, applies a fault or executes the call, and saves a changed state.
int32_t Perform(const char* callName, SimulatedCall& call, const StateStore& store) {
    ControllerState state(store.Load());
    int32_t fault = 0;
    if (state.GetSigned("Faults", callName, fault)) {
        return fault;
    }
    const int32_t result = call.Execute(state);
    if (result >= 0 && state.Modified()) {
        store.Save(state.Document());
    }
    return result;
}

int32_t RunWithSysroot(const char* callName, SimulatedCall& call, const std::string& sysroot) {
    static std::mutex callMutex;
    const std::lock_guard<std::mutex> guard(callMutex);
    CallArguments arguments;
    call.DescribeInputs(arguments);
    const StateStore store(sysroot);
    std::optional<FileLock> lock;
    int32_t result = status::kUnexpected;
    try {
        store.EnsureDirectory();
        lock.emplace(store.LockPath());
        result = Perform(callName, call, store);
    } catch (const std::bad_alloc&) {
        result = status::kOutOfMemory;
    } catch (const std::exception& failure) {
        ReportFailure(callName, failure.what());
    }
    timespec now{};
    ::clock_gettime(CLOCK_MONOTONIC, &now);
    try {
        store.AppendCallLog(CallLogLine(now, callName, result, arguments));
    } catch (const std::exception& failure) {
        ReportFailure(callName, failure.what());
    }
    return result;
}

}  // namespace

int32_t RunCall(const char* callName, SimulatedCall& call) noexcept {
    try {
        const std::optional<std::string> sysroot = CurrentSysroot();
        if (!sysroot) {
            ReportFailure(callName, "KEST_SYSROOT does not hold an absolute path");
            return status::kUnexpected;
        }
        return RunWithSysroot(callName, call, *sysroot);
    } catch (const std::bad_alloc&) {
        return status::kOutOfMemory;
    } catch (const std::exception& failure) {
        ReportFailure(callName, failure.what());
        return status::kUnexpected;
    }
}

}  // namespace kest::sim
