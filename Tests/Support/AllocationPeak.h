#pragma once

// How much memory the C++ code of a test program holds at most. Counts what `new` hands out, in the whole program that
// links it.

#include <cstddef>

namespace ZULMetaData::Test {

/// Counts from the moment it is made; one at a time.
class AllocationPeak {
public:
    AllocationPeak();

    /// Bytes above what was held at the start.
    std::size_t bytes() const;

private:
    std::size_t start_;
};

} // namespace ZULMetaData::Test
