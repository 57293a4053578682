#pragma once
/// \file
/// The library's vector: elements constructed in place in a block from the
/// task allocator, bounds-checked access, checked growth.

#include "fen/Exception.h"
#include "fen/SafeInteger.h"
#include "fen/TaskAllocator.h"

#include <cstddef>
#include <new>
#include <utility>

namespace qv::fen {

template <typename T>
class Vector {
    // The task allocator aligns its blocks for the fundamental types only.
    static_assert(alignof(T) <= alignof(std::max_align_t));

public:
    Vector() noexcept = default;
    Vector(const Vector& other) { CopyFrom(other); }
    Vector(Vector&& other) noexcept { swap(other); }
    ~Vector() { Release(); }

    Vector& operator=(const Vector& other)
    {
        if (this != &other) {
            Vector copy(other);
            swap(copy);
        }
        return *this;
    }
    Vector& operator=(Vector&& other) noexcept
    {
        Vector moved(std::move(other));
        swap(moved);
        return *this;
    }

    void swap(Vector& other) noexcept
    {
        std::swap(begin_, other.begin_);
        std::swap(end_, other.end_);
        std::swap(capacityEnd_, other.capacityEnd_);
    }

    std::size_t size() const noexcept { return static_cast<std::size_t>(end_ - begin_); }
    bool empty() const noexcept { return end_ == begin_; }
    std::size_t capacity() const noexcept { return static_cast<std::size_t>(capacityEnd_ - begin_); }

    T* begin() noexcept { return begin_; }
    T* end() noexcept { return end_; }
    const T* begin() const noexcept { return begin_; }
    const T* end() const noexcept { return end_; }

    /// Bounds-checked: an index at or past the end throws OutOfRange.
    T& operator[](std::size_t index)
    {
        CheckIndex(index);
        return begin_[index];
    }
    const T& operator[](std::size_t index) const
    {
        CheckIndex(index);
        return begin_[index];
    }
    T& back()
    {
        CheckIndex(0);
        return end_[-1];
    }

    /// Appends a copy of `value`. A full vector of n elements moves to a new
    /// block of 2n + 1; if anything throws, the vector is left as it was.
    void push_back(const T& value) { emplace_back(value); }

    template <typename... Args>
    T& emplace_back(Args&&... args)
    {
        if (end_ != capacityEnd_) {
            new (end_) T(std::forward<Args>(args)...);
            return *end_++;
        }
        const std::size_t n = size();
        SafeInteger grown = SafeInteger::FromSize(n) * 2 + 1;
        T* block = static_cast<T*>(CheckedAlloc((SafeInteger(sizeof(T)) * grown).Value()));
        // The new element is built first: its arguments may refer to ours.
        bool newBuilt = false;
        std::size_t built = 0;
        try {
            new (block + n) T(std::forward<Args>(args)...);
            newBuilt = true;
            for (; built < n; ++built)
                new (block + built) T(begin_[built]);
        } catch (...) {
            if (newBuilt)
                block[n].~T();
            for (std::size_t i = 0; i < built; ++i)
                block[i].~T();
            TaskMemFree(block);
            throw;
        }
        Release();
        begin_ = block;
        end_ = block + n + 1;
        capacityEnd_ = block + grown.Value();
        return end_[-1];
    }

    void pop_back()
    {
        CheckIndex(0);
        (--end_)->~T();
    }

    void clear() noexcept
    {
        while (end_ != begin_)
            (--end_)->~T();
    }

private:
    void CheckIndex(std::size_t index) const
    {
        if (index >= size())
            QV_THROW(exception::OutOfRange());
    }

    void CopyFrom(const Vector& other)
    {
        const std::size_t n = other.size();
        if (n == 0)
            return;
        SafeInteger count = SafeInteger::FromSize(n);
        begin_ = static_cast<T*>(CheckedAlloc((SafeInteger(sizeof(T)) * count).Value()));
        end_ = begin_;
        capacityEnd_ = begin_ + n;
        try {
            for (const T& element : other) {
                new (end_) T(element);
                ++end_;
            }
        } catch (...) {
            Release();
            throw;
        }
    }

    void Release() noexcept
    {
        clear();
        TaskMemFree(begin_);
        begin_ = end_ = capacityEnd_ = nullptr;
    }

    T* begin_ = nullptr;
    T* end_ = nullptr;
    T* capacityEnd_ = nullptr;
};

} // namespace qv::fen
