// The one owner of an open file descriptor: closes it when it goes away. Move-only, so a
// descriptor has exactly one owner at any time. Not shared between threads.
#pragma once

#include <unistd.h>

#include <utility>

namespace kest {

class FileDescriptor {
  public:
    // Holds nothing.
    FileDescriptor() noexcept = default;
    // Takes over `descriptor`; a negative value holds nothing.
    explicit FileDescriptor(int descriptor) noexcept : descriptor_(descriptor) {}
    ~FileDescriptor() { Reset(); }
    FileDescriptor(FileDescriptor&& other) noexcept : descriptor_(other.Release()) {}
    FileDescriptor& operator=(FileDescriptor&& other) noexcept {
        Reset(other.Release());
        return *this;
    }
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;

    // The descriptor held, or -1.
    int Get() const noexcept { return descriptor_; }
    bool IsOpen() const noexcept { return descriptor_ >= 0; }

    // Gives the descriptor up without closing it; holds nothing afterwards.
    int Release() noexcept { return std::exchange(descriptor_, -1); }
    // Closes the descriptor held, if any, and takes over `descriptor`.
    void Reset(int descriptor = -1) noexcept {
        const int previous = std::exchange(descriptor_, descriptor);
        if (previous >= 0 && previous != descriptor) {
            close(previous);
        }
    }
    // Closes the descriptor now and reports how that went: 0, or -1 with errno set (a failed
    // delayed write shows here). Holds nothing afterwards.
    int Close() noexcept { return close(Release()); }

  private:
    int descriptor_ = -1;
};

}  // namespace kest
