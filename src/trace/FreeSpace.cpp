#include "trace/FreeSpace.h"

#include <atomic>

namespace kest::trace {
namespace {

std::atomic<FreeSpaceMeasure> measure{&kest::GetFreeDiskSpace};

}  // namespace

FreeSpaceMeasure CurrentFreeSpaceMeasure() {
    return measure.load(std::memory_order_acquire);
}

void SetFreeSpaceMeasure(FreeSpaceMeasure replacement) {
    measure.store(replacement != nullptr ? replacement : &kest::GetFreeDiskSpace,
                  std::memory_order_release);
}

}  // namespace kest::trace
