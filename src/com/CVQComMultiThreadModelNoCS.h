// The thread model of every component: no lock per object; each change of any object's reference
// count happens under one process-wide mutex, which exists from the moment the library is loaded.
// Thread safety: Increment and Decrement may be called from any thread at once.
#pragma once

#include <cstdint>

class CVQComMultiThreadModelNoCS {
  public:
    // Adds one to *count under the process-wide lock; returns the new value.
    static int32_t Increment(int32_t* count);
    // Subtracts one from *count under the process-wide lock; returns the new value.
    static int32_t Decrement(int32_t* count);
};
