// A file that lives in memory (memfd), reachable by a path, so fuzz targets that load and save
// files cost no disk I/O. Saving to the path without safe replacement truncates and rewrites the
// same memory file.
#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <cstdlib>
#include <string>
#include <string_view>

#include "support/FileDescriptor.h"

class MemoryFile {
  public:
    MemoryFile() : descriptor_(memfd_create("kest-fuzz", MFD_CLOEXEC)) {
        if (!descriptor_.IsOpen()) {
            std::abort();
        }
        path_ = "/proc/self/fd/" + std::to_string(descriptor_.Get());
    }

    const char* Path() const { return path_.c_str(); }

    // Makes `bytes` the whole content.
    void Replace(std::string_view bytes) const {
        if (ftruncate(descriptor_.Get(), 0) != 0 ||
            pwrite(descriptor_.Get(), bytes.data(), bytes.size(), 0) !=
                static_cast<ssize_t>(bytes.size())) {
            std::abort();
        }
    }

  private:
    kest::FileDescriptor descriptor_;
    std::string path_;
};
