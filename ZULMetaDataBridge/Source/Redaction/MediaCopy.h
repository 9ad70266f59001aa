#pragma once

// The media part of a container byte for byte, but for what is blanked.

#include "ZULMetaData/ByteSource.h"
#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"

#include <cstdint>
#include <span>
#include <vector>

namespace ZULMetaData::detail {

class MediaCopy {
public:
    /// A blank inside of an earlier, larger one has no effect.
    MediaCopy(ByteSource file, std::vector<Blank> blanks);

    /// Returns whether the byte is copied as it is.
    bool isKept(std::uint64_t offset) const;

    /// Returns the original with what is blanked. This object must outlive it.
    ByteSource bytes() const;

private:
    void blank(std::uint64_t offset, std::span<char> bytes) const;

    ByteSource file_;
    std::vector<Blank> blanks_; ///< in the order of the file, without overlaps
};

} // namespace ZULMetaData::detail
