// Conversion between narrow text in the process locale's character set and wide (32-bit) text.
// Characters that cannot be converted become '?'; conversion itself never fails.
#pragma once

#include <cstddef>
#include <string>

namespace vq {
namespace dsc {

// Narrow text (locale character set) from `count` wide characters.
std::string NarrowFromWide(const wchar_t* text, size_t count);
inline std::string NarrowFromWide(const std::wstring& text) {
    return NarrowFromWide(text.data(), text.size());
}

// Wide text from `count` bytes of narrow text in the locale's character set.
std::wstring WideFromNarrow(const char* text, size_t count);
inline std::wstring WideFromNarrow(const std::string& text) {
    return WideFromNarrow(text.data(), text.size());
}

}  // namespace dsc
}  // namespace vq
