// Integer arithmetic that raises vq::dsc::exception::OutOfRange instead of wrapping, used for the
// size computations of the runtime library's containers.
#pragma once

#include <type_traits>

namespace vq {
namespace dsc {
namespace detail {

// Raises vq::dsc::exception::OutOfRange.
[[noreturn]] void RaiseOutOfRange();

}  // namespace detail

// An integer of type T. Construction from any integer value that T cannot represent, and any sum,
// difference or product that leaves T's range, raise vq::dsc::exception::OutOfRange.
template <class T>
class SafeInteger {
    static_assert(std::is_integral<T>::value && !std::is_same<T, bool>::value,
                  "SafeInteger holds integers");

  public:
    constexpr SafeInteger() noexcept : value_(0) {}

    // Takes `value` when T can represent it, raises OutOfRange otherwise. Implicit, so that
    // plain integers mix with safe ones in expressions.
    template <class U,
              class = std::enable_if_t<std::is_integral<U>::value && !std::is_same<U, bool>::value>>
    SafeInteger(U value) : value_(Narrow(value)) {}

    // The value held.
    constexpr T Value() const noexcept { return value_; }

    SafeInteger& operator+=(SafeInteger other) {
        T result;
        if (__builtin_add_overflow(value_, other.value_, &result)) {
            detail::RaiseOutOfRange();
        }
        value_ = result;
        return *this;
    }
    SafeInteger& operator-=(SafeInteger other) {
        T result;
        if (__builtin_sub_overflow(value_, other.value_, &result)) {
            detail::RaiseOutOfRange();
        }
        value_ = result;
        return *this;
    }
    SafeInteger& operator*=(SafeInteger other) {
        T result;
        if (__builtin_mul_overflow(value_, other.value_, &result)) {
            detail::RaiseOutOfRange();
        }
        value_ = result;
        return *this;
    }

    friend SafeInteger operator+(SafeInteger a, SafeInteger b) { return a += b; }
    friend SafeInteger operator-(SafeInteger a, SafeInteger b) { return a -= b; }
    friend SafeInteger operator*(SafeInteger a, SafeInteger b) { return a *= b; }
    friend bool operator==(SafeInteger a, SafeInteger b) { return a.value_ == b.value_; }
    friend bool operator!=(SafeInteger a, SafeInteger b) { return a.value_ != b.value_; }

  private:
    template <class U>
    static T Narrow(U value) {
        T result;
        if (__builtin_add_overflow(value, U(0), &result)) {
            detail::RaiseOutOfRange();
        }
        return result;
    }

    T value_;
};

}  // namespace dsc
}  // namespace vq
