#include "support/WholeTransfer.h"

#include <unistd.h>

#include <cerrno>

namespace kest {
namespace {

// Room for a read of input whose size is not known beforehand.
constexpr size_t kUnknownSizeChunk = 4096;

}  // namespace

bool WriteWhole(int descriptor, const void* data, size_t size) {
    const char* next = static_cast<const char*>(data);
    while (size > 0) {
        const ssize_t written = write(descriptor, next, size);
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            if (written == 0) {
                errno = EIO;
            }
            return false;
        }
        next += written;
        size -= static_cast<size_t>(written);
    }
    return true;
}

bool WriteWhole(int descriptor, std::string_view text) {
    return WriteWhole(descriptor, text.data(), text.size());
}

bool ReadWhole(int descriptor, void* data, size_t size) {
    char* next = static_cast<char*>(data);
    while (size > 0) {
        const ssize_t count = read(descriptor, next, size);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            if (count == 0) {
                errno = 0;
            }
            return false;
        }
        next += count;
        size -= static_cast<size_t>(count);
    }
    return true;
}

bool ReadToEnd(int descriptor, std::string& text, size_t expectedSize) {
    const size_t start = text.size();
    size_t filled = start;
    text.resize(start + (expectedSize > 0 ? expectedSize + 1 : kUnknownSizeChunk));
    for (;;) {
        if (filled == text.size()) {
            text.resize(text.size() * 2);
        }
        const ssize_t count = read(descriptor, &text[filled], text.size() - filled);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            const int error = errno;
            text.resize(filled);
            errno = error;
            return false;
        }
        if (count == 0) {
            break;
        }
        filled += static_cast<size_t>(count);
        if (expectedSize > 0 && filled - start == expectedSize && filled < text.size()) {
            break;
        }
    }
    text.resize(filled);
    return true;
}

}  // namespace kest
