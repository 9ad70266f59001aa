#pragma once

// What memory the library asks for while a test looks on, and how it copes where there is none.

#include <cstddef>

namespace ZULMetaData::Test {

/// Looks on from the moment it is made; one at a time.
class MemoryWatch {
public:
    MemoryWatch();
    ~MemoryWatch();
    MemoryWatch(const MemoryWatch&) = delete;
    MemoryWatch& operator=(const MemoryWatch&) = delete;

    /// From now on a larger block is not to be had: `malloc` and `calloc` give null, `new` throws.
    void refuseAbove(std::size_t bytes);

    /// Granted or not, from `malloc`, `calloc` or `new`.
    std::size_t largestRequest() const;

    /// Of `malloc` and `calloc`, less those that were freed.
    int blocks() const;

    /// The most that was held at one time beyond what was held at first, in bytes, however it was asked for.
    std::size_t peak() const;
};

} // namespace ZULMetaData::Test
