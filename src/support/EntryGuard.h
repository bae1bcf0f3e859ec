// The one guard that every host-facing operation wraps around its body: it converts whatever the
// body throws into a status code, so no exception ever reaches the host.
#pragma once

#include <exception>
#include <new>

#include "support/Exceptions.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"

// Runs `body` (returning HRESULT). A thrown status (a long) is traced with `failureText` and
// returned; std::bad_alloc gives E_OUTOFMEMORY; runtime-library and any other exceptions give
// E_FAIL, each with its trace line under bit 0x02.
template <class Body>
HRESULT GuardEntryPoint(const char* failureText, Body&& body) noexcept {
    try {
        return body();
    } catch (long status) {
        TraceStatus(failureText, static_cast<HRESULT>(status));
        return static_cast<HRESULT>(status);
    } catch (const std::bad_alloc&) {
        TraceIfEnabled("Error allocating memory", kTraceErrors);
        return E_OUTOFMEMORY;
    } catch (const vq::dsc::exception::Exception&) {
        TraceIfEnabled("Uncaught dsc Exception", kTraceErrors);
        return E_FAIL;
    } catch (...) {
        TraceIfEnabled("Uncaught exception", kTraceErrors);
        return E_FAIL;
    }
}
