// An array on a 64-byte boundary, sized once, zero-filled unless told otherwise.
#pragma once

#include <cstddef>
#include <cstring>
#include <limits>
#include <new>
#include <type_traits>
#include <utility>

#include "base/aligned_memory.h"

namespace tessaly {

/// Says that all of an array is written before any of it is read.
struct ForOverwrite {};
inline constexpr ForOverwrite forOverwrite{};

/// Owns `size` zero-filled elements aligned to 64 bytes (one cache line, one widest vector).
/// Load time: allocates. Element access is unchecked.
template <typename T>
class AlignedArray {
    static_assert(std::is_trivially_copyable_v<T> && std::is_trivially_destructible_v<T>);

public:
    static constexpr std::size_t alignment = memoryAlignment;

    AlignedArray() noexcept = default;
    /// @throws std::bad_alloc
    explicit AlignedArray(std::size_t size) : size_(size) {
        if (size_ > 0) {
            take(fits() ? allocateZeroed(size_ * sizeof(T)) : nullptr);
        }
    }
    /// Without values. @throws std::bad_alloc
    AlignedArray(std::size_t size, ForOverwrite) : size_(size) {
        if (size_ > 0) {
            take(fits() ? allocateForOverwrite(size_ * sizeof(T)) : nullptr);
        }
    }
    AlignedArray(AlignedArray&& other) noexcept
        : data_(std::exchange(other.data_, nullptr)), size_(std::exchange(other.size_, 0)) {}
    AlignedArray& operator=(AlignedArray&& other) noexcept {
        if (this != &other) {
            release();
            data_ = std::exchange(other.data_, nullptr);
            size_ = std::exchange(other.size_, 0);
        }
        return *this;
    }
    AlignedArray(const AlignedArray&) = delete;
    AlignedArray& operator=(const AlignedArray&) = delete;
    ~AlignedArray() { release(); }

    T* data() noexcept { return data_; }
    const T* data() const noexcept { return data_; }
    std::size_t size() const noexcept { return size_; }
    bool empty() const noexcept { return size_ == 0; }
    T& operator[](std::size_t i) noexcept { return data_[i]; }
    const T& operator[](std::size_t i) const noexcept { return data_[i]; }
    T* begin() noexcept { return data_; }
    T* end() noexcept { return data_ + size_; }
    const T* begin() const noexcept { return data_; }
    const T* end() const noexcept { return data_ + size_; }

    /// Sets every element to zero.
    void clear() noexcept {
        if (data_ != nullptr) {
            std::memset(static_cast<void*>(data_), 0, size_ * sizeof(T));
        }
    }

private:
    bool fits() const noexcept {
        return size_ <= std::numeric_limits<std::size_t>::max() / sizeof(T);
    }
    void take(void* memory) {
        if (memory == nullptr) {
            throw std::bad_alloc();
        }
        data_ = static_cast<T*>(memory);
    }
    void release() noexcept { releaseAligned(data_); }

    T* data_ = nullptr;
    std::size_t size_ = 0;
};

}  // namespace tessaly
