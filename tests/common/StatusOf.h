// The status of a call that returns one or throws one (as a long), as the host-facing guard sees
// it.
#pragma once

#include <type_traits>

#include "uxsys/StatusCodes.h"

namespace kest::test {

// The status `call` returns (S_OK for a call without result) or throws.
template <class Call>
HRESULT StatusOf(Call&& call) {
    try {
        if constexpr (std::is_void_v<decltype(call())>) {
            call();
            return S_OK;
        } else {
            return static_cast<HRESULT>(call());
        }
    } catch (long thrown) {
        return static_cast<HRESULT>(thrown);
    }
}

}  // namespace kest::test
