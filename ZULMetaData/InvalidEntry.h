#pragma once

// How every decoder reports an entry whose beginning is missing.

#include <istream>
#include <stdexcept>

namespace ZULMetaData::detail {

/// Nothing more will come: the end of the input, or a device that failed.
inline bool inputEnded(const std::istream& stream) {
    return stream.eof() || stream.bad();
}

inline void throwIfInputEnded(const std::istream& stream) {
    if (inputEnded(stream))
        throw std::runtime_error("invalid meta data entry");
}

} // namespace ZULMetaData::detail
