// A fixed-size buffer that lives inside its owner while it is small, so that the common case allocates nothing.
#pragma once

#include <array>
#include <cstddef>
#include <span>
#include <vector>

namespace orvan {

// `n` default-constructed elements: in place when n <= N, on the heap beyond.
template <class T, std::size_t N>
class SmallBuffer {
public:
    explicit SmallBuffer(std::size_t n) : size_(n) {
        if (n > N) heap_.resize(n);
    }
    SmallBuffer(const SmallBuffer&) = delete;
    SmallBuffer& operator=(const SmallBuffer&) = delete;

    T* data() { return size_ > N ? heap_.data() : inline_.data(); }
    const T* data() const { return size_ > N ? heap_.data() : inline_.data(); }
    std::size_t size() const { return size_; }
    T& operator[](std::size_t i) { return data()[i]; }
    std::span<const T> view() const { return {data(), size_}; }

private:
    std::array<T, N> inline_{};
    std::vector<T> heap_;
    std::size_t size_;
};

}  // namespace orvan
