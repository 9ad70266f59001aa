#pragma once

// Copies the media part of a container byte for byte, but for what is blanked.

#include "ZULMetaData/ByteSource.h"
#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"

#include <cstdint>
#include <functional>
#include <ostream>
#include <vector>

namespace ZULMetaData::detail {

class MediaCopy {
public:
    /// A blank inside of an earlier, larger one has no effect.
    MediaCopy(ByteSource file, std::vector<Blank> blanks);

    /// Returns whether the byte is copied as it is.
    bool isKept(std::uint64_t offset) const;

    /// Appends a part of the original to `out`. What is zero is skipped, so that holes of the file stay holes. Calls
    /// `advance` with the number of bytes that were copied. Throws `std::system_error` if the original ends too early.
    void copy(std::uint64_t offset, std::uint64_t size, std::ostream& out,
              const std::function<void(std::uint64_t)>& advance) const;

private:
    void blank(std::uint64_t offset, std::span<char> bytes) const;

    ByteSource file_;
    std::vector<Blank> blanks_; ///< in the order of the file, without overlaps
};

} // namespace ZULMetaData::detail
