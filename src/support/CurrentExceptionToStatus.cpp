#include "support/CurrentExceptionToStatus.h"

#include <exception>
#include <new>
#include <stdexcept>

#include "support/TraceGate.h"

HRESULT CurrentExceptionToStatus() {
    try {
        throw;
    } catch (long status) {
        return static_cast<HRESULT>(status);
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (const std::out_of_range&) {
        TraceStatus("out of range", E_FAIL);
        return E_FAIL;
    } catch (const std::exception&) {
        TraceStatus("std::exception", E_FAIL);
        return E_FAIL;
    }
}
