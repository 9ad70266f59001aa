#pragma once

// The exception that every decoder throws for an entry whose beginning is missing.

#include "../SharedDependencies/Export.h"

#include <istream>
#include <stdexcept>

namespace ZULMetaData {

/// The input ended inside the time or the size of an entry.
class ZULMETADATA_API InvalidEntry : public std::runtime_error {
public:
    InvalidEntry() : std::runtime_error("invalid meta data entry") {} ///< takes the message that all readers use
};

namespace detail {

/// Returns whether no more bytes will come, because the input has ended or its device has failed.
inline bool inputEnded(const std::istream& stream) {
    return stream.eof() || stream.bad();
}

inline void throwIfInputEnded(const std::istream& stream) {
    if (inputEnded(stream))
        throw InvalidEntry();
}

} // namespace detail

} // namespace ZULMetaData
