// Inline helpers to create, read and free host strings (CvqBStr).
#pragma once

#include <cstdlib>
#include <cstring>
#include <cwchar>

#include "uxsys/Types.h"

// Allocates a host string holding `count` characters copied from `text` (which may be null only
// when count is 0). Returns null when the count is too large or allocation fails.
inline CvqBStr CvqBStrAllocLen(const wchar_t* text, uint64_t count) {
    if (count >= 0xFFFFFFFFull || count + 1 > 0x3FFFFFFFull) {
        return nullptr;
    }
    const size_t bytes = sizeof(uint32_t) + (static_cast<size_t>(count) + 1) * sizeof(wchar_t);
    void* block = std::malloc(bytes);
    if (block == nullptr) {
        return nullptr;
    }
    const uint32_t count32 = static_cast<uint32_t>(count);
    std::memcpy(block, &count32, sizeof(count32));
    // malloc aligns for every type, so four bytes on the characters are aligned for wchar_t.
    static_assert(alignof(wchar_t) <= sizeof(uint32_t), "characters follow the count");
    wchar_t* chars =
        static_cast<wchar_t*>(static_cast<void*>(static_cast<char*>(block) + sizeof(uint32_t)));
    if (count != 0) {
        std::memcpy(chars, text, static_cast<size_t>(count) * sizeof(wchar_t));
    }
    chars[count] = L'\0';
    return chars;
}

// Allocates a host string from zero-terminated wide text; null text gives an empty string.
inline CvqBStr CvqBStrAlloc(const wchar_t* text) {
    return CvqBStrAllocLen(text, text == nullptr ? 0 : std::wcslen(text));
}

// Number of characters of a host string; 0 for null.
inline uint32_t CvqBStrLength(const wchar_t* str) {
    if (str == nullptr) {
        return 0;
    }
    uint32_t count;
    std::memcpy(&count, reinterpret_cast<const char*>(str) - sizeof(uint32_t), sizeof(count));
    return count;
}

// Frees a host string's block (four bytes before the handle); null does nothing.
inline void CvqBStrFree(CvqBStr str) {
    if (str != nullptr) {
        std::free(reinterpret_cast<char*>(str) - sizeof(uint32_t));
    }
}

// Owns one host string and frees it on destruction; Release() hands ownership on.
class CvqBStrHolder {
  public:
    CvqBStrHolder() = default;
    explicit CvqBStrHolder(CvqBStr str) : str_(str) {}
    ~CvqBStrHolder() { CvqBStrFree(str_); }
    CvqBStrHolder(const CvqBStrHolder&) = delete;
    CvqBStrHolder& operator=(const CvqBStrHolder&) = delete;
    CvqBStrHolder(CvqBStrHolder&& other) noexcept : str_(other.Release()) {}
    CvqBStrHolder& operator=(CvqBStrHolder&& other) noexcept {
        if (this != &other) {
            CvqBStrFree(str_);
            str_ = other.Release();
        }
        return *this;
    }

    // The held string (may be null); ownership stays here.
    CvqBStr Get() const { return str_; }
    // Address to receive a string from a call; frees what was held first.
    CvqBStr* Receive() {
        CvqBStrFree(str_);
        str_ = nullptr;
        return &str_;
    }
    // Gives up ownership and returns the string.
    CvqBStr Release() {
        CvqBStr str = str_;
        str_ = nullptr;
        return str;
    }

  private:
    CvqBStr str_ = nullptr;
};
