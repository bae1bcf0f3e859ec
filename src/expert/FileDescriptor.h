// Owns one open file descriptor and closes it when it goes away.
#pragma once

#include <unistd.h>

#include <utility>

namespace nVQKESTSYSAPICHASSISEXPERT100 {

class FileDescriptor {
  public:
    // Takes over `descriptor`; a negative value holds nothing.
    explicit FileDescriptor(int descriptor) noexcept : descriptor_(descriptor) {}
    ~FileDescriptor() {
        if (descriptor_ >= 0) {
            close(descriptor_);
        }
    }
    FileDescriptor(FileDescriptor&& other) noexcept
        : descriptor_(std::exchange(other.descriptor_, -1)) {}
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;
    FileDescriptor& operator=(FileDescriptor&&) = delete;

    int Get() const noexcept { return descriptor_; }
    bool IsOpen() const noexcept { return descriptor_ >= 0; }

    // Closes the descriptor now; returns close's result (0 on success, -1 with errno set).
    int Close() noexcept { return close(std::exchange(descriptor_, -1)); }

  private:
    int descriptor_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
