// The runtime library's growable array. Its layout is part of the binary interface with the
// controller library, which fills it: exactly three pointers (begin, end of the elements, end of
// the storage), no virtual functions, storage allocated with malloc and released with free.
#pragma once

#include <cstddef>
#include <cstdlib>
#include <new>
#include <type_traits>
#include <utility>

#include "vq/dsc/SafeInteger.h"

namespace vq {
namespace dsc {

// A growable array of T; an empty vector owns no storage.
template <class T>
class Vector {
  public:
    using value_type = T;
    using size_type = std::size_t;
    using iterator = T*;
    using const_iterator = const T*;

    Vector() noexcept = default;
    Vector(const Vector& other) {
        reserve(other.size());
        for (const T& element : other) {
            push_back(element);
        }
    }
    // Takes the other's elements; the other is left empty.
    Vector(Vector&& other) noexcept { swap(other); }
    ~Vector() {
        clear();
        std::free(begin_);
    }
    // Copy and swap, so assigning a vector to itself keeps it.
    Vector& operator=(const Vector& other) {  // NOLINT(bugprone-unhandled-self-assignment)
        Vector copy(other);
        swap(copy);
        return *this;
    }
    Vector& operator=(Vector&& other) noexcept {
        Vector taken(std::move(other));
        swap(taken);
        return *this;
    }

    size_type size() const noexcept { return static_cast<size_type>(end_ - begin_); }
    bool empty() const noexcept { return end_ == begin_; }
    // Number of elements the storage holds without growing.
    size_type capacity() const noexcept { return static_cast<size_type>(capacityEnd_ - begin_); }

    T& operator[](size_type index) noexcept { return begin_[index]; }
    const T& operator[](size_type index) const noexcept { return begin_[index]; }
    iterator begin() noexcept { return begin_; }
    iterator end() noexcept { return end_; }
    const_iterator begin() const noexcept { return begin_; }
    const_iterator end() const noexcept { return end_; }

    // Appends a copy of `element` (which may be an element of this vector).
    void push_back(const T& element) { Append(element); }
    // Appends `element`, moved in.
    void push_back(T&& element) { Append(std::move(element)); }

    // Destroys every element; the storage is kept.
    void clear() noexcept {
        while (end_ != begin_) {
            --end_;
            end_->~T();
        }
    }

    // Makes room for at least `count` elements without changing the contents.
    void reserve(size_type count) {
        if (count > capacity()) {
            Relocate(count, nullptr);
        }
    }

    void swap(Vector& other) noexcept {
        std::swap(begin_, other.begin_);
        std::swap(end_, other.end_);
        std::swap(capacityEnd_, other.capacityEnd_);
    }

  private:
    friend struct VectorLayout;

    template <class Value>
    void Append(Value&& value) {
        if (end_ != capacityEnd_) {
            new (end_) T(std::forward<Value>(value));
            ++end_;
            return;
        }
        const size_type grown =
            capacity() == 0 ? 4 : (SafeInteger<size_type>(capacity()) * 2).Value();
        // The new element is built in the new storage before the old elements move, so `value`
        // may refer to one of them.
        Relocate(grown, [&value](T* slot) { new (slot) T(std::forward<Value>(value)); });
    }

    // Moves the elements into fresh storage for `count` elements. When `appendAt` is given it
    // first constructs one more element behind the moved ones. Leaves the vector unchanged when
    // anything throws.
    template <class AppendAt = std::nullptr_t>
    void Relocate(size_type count, AppendAt appendAt) {
        // NOLINTNEXTLINE(bugprone-sizeof-expression): T itself may be a pointer type
        const size_type bytes = (SafeInteger<size_type>(count) * sizeof(T)).Value();
        T* fresh = static_cast<T*>(std::malloc(bytes));
        if (fresh == nullptr) {
            throw std::bad_alloc();
        }
        const size_type oldSize = size();
        size_type built = 0;
        bool appended = false;
        try {
            if constexpr (!std::is_same<AppendAt, std::nullptr_t>::value) {
                appendAt(fresh + oldSize);
                appended = true;
            }
            for (; built < oldSize; ++built) {
                new (fresh + built) T(std::move_if_noexcept(begin_[built]));
            }
        } catch (...) {
            for (size_type i = 0; i < built; ++i) {
                fresh[i].~T();
            }
            if (appended) {
                fresh[oldSize].~T();
            }
            std::free(fresh);
            throw;
        }
        clear();
        std::free(begin_);
        begin_ = fresh;
        end_ = fresh + oldSize + (appended ? 1 : 0);
        capacityEnd_ = fresh + count;
    }

    T* begin_ = nullptr;
    T* end_ = nullptr;
    T* capacityEnd_ = nullptr;
};

// Checks the binary layout of vectors: three pointers in the documented order.
struct VectorLayout {
    template <class V>
    static constexpr bool IsThreePointers() {
        return sizeof(V) == 3 * sizeof(void*) && offsetof(V, begin_) == 0 &&
               offsetof(V, end_) == sizeof(void*) && offsetof(V, capacityEnd_) == 2 * sizeof(void*);
    }
};

static_assert(std::is_standard_layout<Vector<int>>::value, "Vector crosses the library ABI");
static_assert(VectorLayout::IsThreePointers<Vector<int>>(), "Vector layout");

}  // namespace dsc
}  // namespace vq
