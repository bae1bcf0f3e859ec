#include "trace/FreeSpace.h"

#include <sys/statvfs.h>

#include <atomic>
#include <cerrno>

namespace kest_trace {
namespace {

std::atomic<FreeSpaceMeasure> measure{&MeasureFreeSpace};

}  // namespace

bool MeasureFreeSpace(const std::string& directory, uint64_t* freeBytes) {
    struct statvfs status;
    int result;
    do {
        result = statvfs(directory.c_str(), &status);
    } while (result != 0 && errno == EINTR);
    if (result != 0) {
        return false;
    }
    // In 64 bits: a product in 32 bits wraps on any file system with more than 2 GiB free.
    *freeBytes = static_cast<uint64_t>(status.f_frsize) * static_cast<uint64_t>(status.f_bfree);
    return true;
}

FreeSpaceMeasure CurrentFreeSpaceMeasure() {
    return measure.load(std::memory_order_acquire);
}

void SetFreeSpaceMeasure(FreeSpaceMeasure replacement) {
    measure.store(replacement != nullptr ? replacement : &MeasureFreeSpace,
                  std::memory_order_release);
}

}  // namespace kest_trace
