// How section and key names compare: surrounding whitespace never counts, and letters compare
// without regard to case unless case sensitivity is on.
// Thread safety: NameRules is a value that does not change after construction; its const operations
// may run concurrently.
#pragma once

#include <cctype>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace kest::ini {

// True for the characters the INI format treats as whitespace.
constexpr bool IsIniSpace(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

// `text` without leading and trailing whitespace.
inline std::string_view TrimIniSpace(std::string_view text) {
    size_t begin = 0;
    size_t end = text.size();
    while (begin < end && IsIniSpace(text[begin])) {
        ++begin;
    }
    while (end > begin && IsIniSpace(text[end - 1])) {
        --end;
    }
    return text.substr(begin, end - begin);
}

// Hashing and equality of names under one case rule, for the name indexes.
class NameRules {
  public:
    explicit NameRules(bool caseSensitive = false) : caseSensitive_(caseSensitive) {}

    bool CaseSensitive() const { return caseSensitive_; }

    size_t operator()(std::string_view name) const {
        std::string_view trimmed = TrimIniSpace(name);
        uint64_t hash = 14695981039346656037ull;
        for (char c : trimmed) {
            hash = (hash ^ Fold(c)) * 1099511628211ull;
        }
        // Where size_t has 32 bits the high half is folded in: the low half alone mixes poorly.
        return static_cast<size_t>(sizeof(size_t) < sizeof(hash) ? hash ^ (hash >> 32) : hash);
    }

    bool operator()(std::string_view left, std::string_view right) const {
        left = TrimIniSpace(left);
        right = TrimIniSpace(right);
        if (left.size() != right.size()) {
            return false;
        }
        for (size_t i = 0; i < left.size(); ++i) {
            if (Fold(left[i]) != Fold(right[i])) {
                return false;
            }
        }
        return true;
    }

  private:
    unsigned char Fold(char c) const {
        unsigned char byte = static_cast<unsigned char>(c);
        return caseSensitive_ ? byte : static_cast<unsigned char>(std::toupper(byte));
    }

    bool caseSensitive_;
};

}  // namespace kest::ini
