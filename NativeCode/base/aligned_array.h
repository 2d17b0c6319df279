// A zero-filled array on a 64-byte boundary, sized once.
#pragma once

#include <cstddef>
#include <cstring>
#include <new>
#include <type_traits>
#include <utility>

namespace tessaly {

/// Owns `size` zero-filled elements aligned to 64 bytes (one cache line, one widest vector).
/// Load time: allocates. Element access is unchecked.
template <typename T>
class AlignedArray {
    static_assert(std::is_trivially_copyable_v<T> && std::is_trivially_destructible_v<T>);

public:
    static constexpr std::size_t alignment = 64;

    AlignedArray() noexcept = default;
    explicit AlignedArray(std::size_t size) : size_(size) {
        if (size_ > 0) {
            data_ =
                static_cast<T*>(::operator new (size_ * sizeof(T), std::align_val_t{alignment}));
            clear();
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
    void release() noexcept {
        if (data_ != nullptr) {
            ::operator delete (data_, std::align_val_t{alignment});
        }
    }

    T* data_ = nullptr;
    std::size_t size_ = 0;
};

}  // namespace tessaly
