#pragma once

// The exception that every decoder throws for an entry whose beginning is missing.

#include <istream>
#include <stdexcept>

namespace ZULMetaData::detail {

/// Returns whether no more bytes will come, because the input has ended or its device has failed.
inline bool inputEnded(const std::istream& stream) {
    return stream.eof() || stream.bad();
}

inline void throwIfInputEnded(const std::istream& stream) {
    if (inputEnded(stream))
        throw std::runtime_error("invalid meta data entry");
}

} // namespace ZULMetaData::detail
