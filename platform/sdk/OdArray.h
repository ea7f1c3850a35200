/// The growing array of the drawing SDK.
#pragma once

#include "platform/sdk/OdError.h"

#include <cstddef>
#include <new>
#include <utility>
#include <vector>

/// A growing array of values. A plain value itself: copies are independent.
/// Running out of memory is thrown as `OdError(eOutOfMemory)` and leaves the array as it was.
template <class T>
class OdArray {
public:
    /// Walks the elements in order; valid until the array changes.
    using const_iterator = typename std::vector<T>::const_iterator;

    /// The number of elements.
    std::size_t size() const noexcept { return items_.size(); }
    /// Whether there is no element.
    bool isEmpty() const noexcept { return items_.empty(); }

    /// The element at `index`, which must be below `size()`; valid until the array changes.
    T const& operator[](std::size_t index) const noexcept { return items_[index]; }
    /// The first element of an array that has one.
    T const& first() const noexcept { return items_.front(); }

    /// Adds an element at the end.
    void append(T value)
    {
        try {
            items_.push_back(std::move(value));
        } catch (std::bad_alloc const&) {
            throw OdError(eOutOfMemory);
        }
    }

    /// The first element, or `end()`.
    const_iterator begin() const noexcept { return items_.begin(); }
    /// Behind the last element.
    const_iterator end() const noexcept { return items_.end(); }

private:
    std::vector<T> items_;
};
