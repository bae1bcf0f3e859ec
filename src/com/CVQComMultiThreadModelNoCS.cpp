#include "com/CVQComMultiThreadModelNoCS.h"

#include <mutex>

namespace {
// Constant-initialised, so it is ready before any code of the library runs.
std::mutex processCountLock;
}  // namespace

int32_t CVQComMultiThreadModelNoCS::Increment(int32_t* count) {
    std::lock_guard<std::mutex> hold(processCountLock);
    return ++*count;
}

int32_t CVQComMultiThreadModelNoCS::Decrement(int32_t* count) {
    std::lock_guard<std::mutex> hold(processCountLock);
    return --*count;
}
