#pragma once

// Cursor images to write, read and compare.

#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

namespace ZULMetaData::Test {

/// Without bytes it has no image.
inline CursorImage cursorImage(std::uint64_t id, std::int32_t x, std::int32_t y, std::int32_t type, std::uint32_t flags,
                               const std::string& bytes = {}) {
    CursorImage image(id, x, y, nullptr, static_cast<std::uint32_t>(bytes.size()), CursorTypeID{type},
                      CursorImage::CursorImageFlags{flags});
    if (!bytes.empty()) {
        image.imageData = static_cast<unsigned char*>(std::malloc(bytes.size()));
        std::memcpy(image.imageData, bytes.data(), bytes.size());
    }
    return image;
}

inline CursorImage arrow(const std::string& bytes = {}) {
    return cursorImage(7, 3, -2, 5, 1, bytes);
}

/// A size that no bytes stand behind.
inline CursorImage arrowWithoutItsBytes(std::uint32_t size) {
    return {7, 3, -2, nullptr, size, CursorTypeID{5}, CursorImage::CursorImageFlags{1}};
}

} // namespace ZULMetaData::Test
