// An owned array of samples with pointer and index access.
#pragma once

#include <cstddef>
#include <vector>

namespace SlmLibrary {

template <typename T>
class IppBuffer {
public:
    explicit IppBuffer(std::size_t size, T fill = T{}) : values_(size, fill) {}

    T* data() { return values_.data(); }
    const T* data() const { return values_.data(); }
    std::size_t size() const { return values_.size(); }
    T& operator[](std::size_t i) { return values_[i]; }
    const T& operator[](std::size_t i) const { return values_[i]; }
    T* begin() { return values_.data(); }
    T* end() { return values_.data() + values_.size(); }
    const T* begin() const { return values_.data(); }
    const T* end() const { return values_.data() + values_.size(); }

private:
    std::vector<T> values_;
};

}  // namespace SlmLibrary
