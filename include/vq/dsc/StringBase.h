// The runtime library's owned, always zero-terminated strings. Their layout is part of the binary
// interface with the controller library, which fills them: exactly three pointers (start of the
// characters, end of the characters where the terminating zero stands, end of the allocation),
// no virtual functions, characters allocated with new[] and released with delete[].
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <type_traits>
#include <utility>

#include "vq/dsc/SafeInteger.h"

namespace vq {
namespace dsc {

template <class CharT, class OtherT, class WideT>
class StringBase;

// Narrow text in the process locale's character set.
using NarrowString = StringBase<char, wchar_t, wchar_t>;
// Wide text of 32-bit characters.
using WideString = StringBase<wchar_t, char, wchar_t>;

namespace detail {

// Replaces the text of `target` by `count` characters of the other width converted through the
// process locale's character set; characters that cannot be converted become '?'.
void ConvertText(const wchar_t* text, std::size_t count, NarrowString& target);
void ConvertText(const char* text, std::size_t count, WideString& target);

// Raises vq::dsc::exception::OutOfRange2 with the text "String offset out of range".
[[noreturn]] void RaiseStringOffsetOutOfRange();

}  // namespace detail

// A growable character sequence of CharT; OtherT is the character type it converts from, WideT
// the wide character type of the pair. Lengths whose byte size or whose count plus one does not
// fit in 32 bits raise vq::dsc::exception::OutOfRange.
template <class CharT, class OtherT, class WideT>
class StringBase {
    static_assert(std::is_same<WideT, wchar_t>::value, "the wide character type is wchar_t");
    using Traits = std::char_traits<CharT>;

  public:
    using value_type = CharT;
    using size_type = std::size_t;
    // The position that find() returns when nothing is found.
    static constexpr size_type npos = static_cast<size_type>(-1);

    // An empty string (it still owns one zero character).
    StringBase() { Initialize(nullptr, 0); }
    // A copy of zero-terminated text; null gives an empty string.
    StringBase(const CharT* text) { Initialize(text, LengthOf(text)); }
    // A copy of `count` characters at `text`.
    StringBase(const CharT* text, size_type count) { Initialize(text, count); }
    // A copy of a standard string.
    StringBase(const std::basic_string<CharT>& text) { Initialize(text.data(), text.size()); }
    // Zero-terminated text of the other width, converted; null gives an empty string.
    explicit StringBase(const OtherT* text) : StringBase() {
        detail::ConvertText(text, LengthOf(text), *this);
    }
    // A standard string of the other width, converted.
    explicit StringBase(const std::basic_string<OtherT>& text) : StringBase() {
        detail::ConvertText(text.data(), text.size(), *this);
    }
    // Text of the other width, converted.
    explicit StringBase(const StringBase<OtherT, CharT, WideT>& text) : StringBase() {
        detail::ConvertText(text.c_str(), text.length(), *this);
    }
    StringBase(const StringBase& other) { Initialize(other.begin_, other.length()); }
    // Takes the other's characters; the other is left empty (owning a fresh zero character).
    // Not noexcept: the fresh zero character is allocated.
    // NOLINTNEXTLINE(performance-noexcept-move-constructor)
    StringBase(StringBase&& other) : StringBase() { swap(other); }
    ~StringBase() { delete[] begin_; }

    // Copy and swap (in assign), so assigning a string to itself keeps it.
    // NOLINTNEXTLINE(bugprone-unhandled-self-assignment)
    StringBase& operator=(const StringBase& other) { return assign(other.begin_, other.length()); }
    // Not noexcept: the other string is left owning a freshly allocated zero character.
    StringBase& operator=(StringBase&& other) {  // NOLINT(performance-noexcept-move-constructor)
        StringBase taken(std::move(other));
        swap(taken);
        return *this;
    }
    StringBase& operator=(const CharT* text) { return assign(text, LengthOf(text)); }
    StringBase& operator=(const std::basic_string<CharT>& text) {
        return assign(text.data(), text.size());
    }

    // Replaces the text by `count` characters at `text` (which may lie inside this string).
    StringBase& assign(const CharT* text, size_type count) {
        StringBase copy(text, count);
        swap(copy);
        return *this;
    }
    // Replaces the text by zero-terminated text of the other width, converted.
    StringBase& assign(const OtherT* text) {
        detail::ConvertText(text, LengthOf(text), *this);
        return *this;
    }

    // The characters, zero-terminated.
    const CharT* c_str() const noexcept { return begin_; }
    const CharT* data() const noexcept { return begin_; }
    // Number of characters before the terminating zero.
    size_type length() const noexcept { return static_cast<size_type>(end_ - begin_); }
    size_type size() const noexcept { return length(); }
    bool empty() const noexcept { return end_ == begin_; }
    // Number of characters the allocation holds without growing, the terminating zero included.
    size_type capacity() const noexcept { return static_cast<size_type>(capacityEnd_ - begin_); }
    // A standard-string copy of the text.
    std::basic_string<CharT> str() const { return std::basic_string<CharT>(begin_, length()); }

    // Appends `count` characters at `text` (which may lie inside this string).
    StringBase& append(const CharT* text, size_type count) {
        Grow(count, [text, count](CharT* destination) { Traits::copy(destination, text, count); });
        return *this;
    }
    StringBase& append(const CharT* text) { return append(text, LengthOf(text)); }
    StringBase& append(const StringBase& text) { return append(text.begin_, text.length()); }
    // Appends `count` copies of `character`.
    StringBase& append(size_type count, CharT character) {
        Grow(count, [count, character](CharT* destination) {
            Traits::assign(destination, count, character);
        });
        return *this;
    }
    StringBase& operator+=(const StringBase& text) { return append(text); }
    StringBase& operator+=(const CharT* text) { return append(text); }
    StringBase& operator+=(CharT character) { return append(1, character); }

    // Position of the first occurrence of `count` characters at `text` at or after `position`;
    // npos when there is none or `position` lies beyond the end.
    size_type find(const CharT* text, size_type position, size_type count) const {
        const size_type length = this->length();
        if (position > length || count > length - position) {
            return npos;
        }
        const CharT* found = std::search(begin_ + position, end_, text, text + count);
        return found == end_ && count != 0 ? npos : static_cast<size_type>(found - begin_);
    }
    size_type find(const CharT* text, size_type position = 0) const {
        return find(text, position, LengthOf(text));
    }
    size_type find(const StringBase& text, size_type position = 0) const {
        return find(text.begin_, position, text.length());
    }

    // The characters from `position`, at most `count` of them. A position beyond the end raises
    // OutOfRange2 ("String offset out of range").
    StringBase substr(size_type position = 0, size_type count = npos) const {
        const size_type length = this->length();
        if (position > length) {
            detail::RaiseStringOffsetOutOfRange();
        }
        return StringBase(begin_ + position, std::min(count, length - position));
    }

    // Removes up to `count` characters from `position`; a count reaching past the end is cut at
    // the end. A position beyond the end raises OutOfRange2 ("String offset out of range").
    StringBase& erase(size_type position = 0, size_type count = npos) {
        const size_type length = this->length();
        if (position > length) {
            detail::RaiseStringOffsetOutOfRange();
        }
        count = std::min(count, length - position);
        Traits::move(begin_ + position, begin_ + position + count, length - position - count + 1);
        end_ -= count;
        return *this;
    }

    // Code-unit-wise comparison: negative, zero or positive as this text sorts before, equal to
    // or after `other`.
    int compare(const StringBase& other) const noexcept {
        const size_type length = this->length();
        const size_type otherLength = other.length();
        const int order = Traits::compare(begin_, other.begin_, std::min(length, otherLength));
        if (order != 0) {
            return order < 0 ? -1 : 1;
        }
        return length < otherLength ? -1 : (length > otherLength ? 1 : 0);
    }

    void swap(StringBase& other) noexcept {
        std::swap(begin_, other.begin_);
        std::swap(end_, other.end_);
        std::swap(capacityEnd_, other.capacityEnd_);
    }

    friend bool operator==(const StringBase& a, const StringBase& b) noexcept {
        return a.compare(b) == 0;
    }
    friend bool operator!=(const StringBase& a, const StringBase& b) noexcept {
        return a.compare(b) != 0;
    }
    friend bool operator<(const StringBase& a, const StringBase& b) noexcept {
        return a.compare(b) < 0;
    }

  private:
    friend struct StringBaseLayout;

    // Largest length whose byte size and whose count plus one fit in 32 bits.
    static constexpr size_type kMaxLength =
        std::min<size_type>(UINT32_MAX / sizeof(CharT), UINT32_MAX - 1);

    static size_type LengthOf(const CharT* text) {
        return text == nullptr ? 0 : Traits::length(text);
    }
    static size_type LengthOf(const OtherT* text) {
        return text == nullptr ? 0 : std::char_traits<OtherT>::length(text);
    }

    // Raises OutOfRange when `length` characters cannot be sized in 32 bits.
    static void CheckLength(SafeInteger<size_type> length) {
        const SafeInteger<uint32_t> count(length.Value());
        static_cast<void>(count * SafeInteger<uint32_t>(sizeof(CharT)));
        static_cast<void>(count + 1);
    }

    // Sets up a fresh allocation holding a copy of `count` characters at `text`.
    void Initialize(const CharT* text, size_type count) {
        CheckLength(count);
        begin_ = new CharT[count + 1];
        Traits::copy(begin_, text, count);
        end_ = begin_ + count;
        *end_ = CharT();
        capacityEnd_ = end_ + 1;
    }

    // Extends the text by `count` characters that `fill` writes at the given destination. When
    // the allocation grows, `fill` runs before the old characters are released, so it may read
    // from them.
    template <class Fill>
    void Grow(size_type count, Fill fill) {
        if (count == 0) {
            return;
        }
        const size_type length = this->length();
        const size_type newLength = (SafeInteger<size_type>(length) + count).Value();
        CheckLength(newLength);
        if (newLength < capacity()) {
            fill(end_);
            end_ += count;
            *end_ = CharT();
            return;
        }
        const size_type newCapacity =
            std::max(newLength + 1, std::min(capacity() * 2, kMaxLength + 1));
        CharT* fresh = new CharT[newCapacity];
        Traits::copy(fresh, begin_, length);
        fill(fresh + length);
        fresh[newLength] = CharT();
        delete[] begin_;
        begin_ = fresh;
        end_ = fresh + newLength;
        capacityEnd_ = fresh + newCapacity;
    }

    CharT* begin_ = nullptr;
    CharT* end_ = nullptr;
    CharT* capacityEnd_ = nullptr;
};

// Checks the binary layout of the string types: three pointers in the documented order.
struct StringBaseLayout {
    template <class String>
    static constexpr bool IsThreePointers() {
        return sizeof(String) == 3 * sizeof(void*) && offsetof(String, begin_) == 0 &&
               offsetof(String, end_) == sizeof(void*) &&
               offsetof(String, capacityEnd_) == 2 * sizeof(void*);
    }
};

static_assert(std::is_standard_layout<NarrowString>::value, "NarrowString crosses the library ABI");
static_assert(std::is_standard_layout<WideString>::value, "WideString crosses the library ABI");
static_assert(StringBaseLayout::IsThreePointers<NarrowString>(), "NarrowString layout");
static_assert(StringBaseLayout::IsThreePointers<WideString>(), "WideString layout");

}  // namespace dsc
}  // namespace vq
