// Reading and writing whole buffers through a descriptor: interrupted calls (EINTR) and short
// transfers are repeated until everything has moved. Safe from any thread on distinct buffers;
// WriteWhole makes no allocation, so it may run between fork and exec.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace kest {

// Writes all `size` bytes at `data`. False, with errno set, when a write fails; a write that
// moves nothing counts as failed with EIO.
bool WriteWhole(int descriptor, const void* data, size_t size);
bool WriteWhole(int descriptor, std::string_view text);

// Fills all `size` bytes at `data`. False when a read fails (errno set) or the input ends first
// (errno 0).
bool ReadWhole(int descriptor, void* data, size_t size);

// Appends everything up to the end of the input to `text`. `expectedSize`, a regular file's size
// from fstat, sizes the buffer: a read that brings exactly that much and leaves room is taken
// as the end, which saves the last, empty read. False, with errno set, when a read fails; `text`
// then holds what arrived before.
bool ReadToEnd(int descriptor, std::string& text, size_t expectedSize = 0);

}  // namespace kest
