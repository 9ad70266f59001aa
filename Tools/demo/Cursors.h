#pragma once

// The cursors of the demo, drawn in code.

#include "Platform/Image.h"
#include "ZULMetaDataBridge/Source/ApplicationValues.h"

#include <cstdint>
#include <memory>
#include <vector>

namespace ZULMetaData::Demo {

struct Cursor {
    std::int64_t uid;
    std::int32_t typeId;
    ScreenPoint hotSpot; ///< in pixels of the image
    std::shared_ptr<const Image> image;
};

/// An arrow, a hand and a text beam, each at `scale` 1 (32 pixels) or 2 (64 pixels).
std::vector<Cursor> drawnCursors(int scale);

} // namespace ZULMetaData::Demo
