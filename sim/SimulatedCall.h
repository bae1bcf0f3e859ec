// The frame every simulated library call runs in: sysroot check, serialisation, state loading,
// faults, saving and the call-log line.
// Thread safety: RunCall may be called from any thread at once; the calls of a process run one at
// a time and hold the state's file lock against other processes. A SimulatedCall, its
// CallArguments and its ControllerState belong to the one call that runs them.
#pragma once

#include <cstdint>
#include <utility>

#include "CallLog.h"
#include "ControllerState.h"

namespace kest::sim {

// One library call: its logged inputs and its work on the controller state.
class SimulatedCall {
  public:
    // Adds the call's input arguments (never its outputs) for the log line.
    virtual void DescribeInputs(CallArguments& arguments) const = 0;
    // Does the call's work and returns its status; outputs are written only here. Changes made
    // to `state` are saved only when the status is not negative.
    virtual int32_t Execute(ControllerState& state) = 0;

  protected:
    ~SimulatedCall() = default;
};

// Runs `call` named `callName`:
// 1. without a sysroot (KEST_SYSROOT unset or not absolute), writes one line to standard error and
// returns -375501;
// 2. otherwise, serialised within the process by a mutex and across processes by an flock on
//    the lock file beside state.ini, loads the state (missing file: empty controller);
// 3. a [Faults] entry for `callName` gives the status and nothing else is done; otherwise the
//    call executes and a changed state is saved atomically;
// 4. appends the call-log line. Unreadable or malformed state and failed writes give -375501
//    (with a line on standard error), exhausted memory -375500. Never throws.
int32_t RunCall(const char* callName, SimulatedCall& call) noexcept;

// A SimulatedCall made of two function objects: inputs(CallArguments&) and body(ControllerState&).
template <class Inputs, class Body>
class LambdaCall final : public SimulatedCall {
  public:
    LambdaCall(Inputs inputs, Body body) : inputs_(std::move(inputs)), body_(std::move(body)) {}
    void DescribeInputs(CallArguments& arguments) const override { inputs_(arguments); }
    int32_t Execute(ControllerState& state) override { return body_(state); }

  private:
    Inputs inputs_;
    Body body_;
};

// RunCall with the call given as two lambdas (capturing by reference, so nothing allocates).
template <class Inputs, class Body>
int32_t RunCall(const char* callName, Inputs inputs, Body body) noexcept {
    LambdaCall<Inputs, Body> call(std::move(inputs), std::move(body));
    return RunCall(callName, call);
}

// The inputs of a call without input arguments.
inline void NoInputs(CallArguments&) {}

}  // namespace kest::sim
