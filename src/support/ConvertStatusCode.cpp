#include "support/ConvertStatusCode.h"

#include <cstdio>

#include "support/TraceGate.h"

HRESULT ConvertStatusCode(int32_t libraryStatus) {
    switch (libraryStatus) {
        case 0:
            return S_OK;
        case -375500:
            return E_OUTOFMEMORY;
        case -375501:
            return E_UNEXPECTED;
        case -375502:
            return E_NOTIMPL;
        case -375523:
            return UX_E_VALUE_INVALID;
        case -375563:
            return E_INVALIDARG;
        case -375623:
            return UX_E_STATUS_0420;
        default:
            break;
    }
    if (IsTraceEnabled(kTraceErrors)) {
        char line[96];
        std::snprintf(line, sizeof(line),
                      "ConvertStatusCode passed a miscellaneous error: %d (0x%08X)", libraryStatus,
                      static_cast<unsigned>(libraryStatus));
        TraceIfEnabled(line, kTraceErrors);
    }
    return E_FAIL;
}
