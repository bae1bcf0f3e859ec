// Writing a whole buffer to a descriptor.
#pragma once

#include <string>

// Writes all of `text` to `descriptor`, retrying interrupted and short writes. False (errno
// set) when a write fails or writes nothing.
bool WriteWhole(int descriptor, const std::string& text);
