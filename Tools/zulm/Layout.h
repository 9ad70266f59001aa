#pragma once

// How a container is put together: its items, what is inside its metadata atom, and where they end too early.

#include "ZULMetaData/ZULMetaData.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Zulm {

class Recording;

struct LayoutItem {
    ZULMetaData::ContainerItem item;
    bool isMetaData = false;                 ///< holds streams
    bool isForeign = false;                  ///< inside such an item, and no stream
    bool isOpenEnded = false;                ///< has no size: it reaches to the end of the file
    std::optional<ZULMetaData::uuid> stream; ///< the kind of the stream that it is
    std::vector<LayoutItem> children;

    std::uint64_t size; ///< what it takes of the file; for an open end up to the end of the file

    /// "32-bit", "extended" or "open-ended".
    std::string headerForm() const;
};

/// Where nothing further could be found, though there is more, and why.
struct LayoutEnd {
    std::uint64_t offset;
    std::string reason; ///< a sentence without its full stop
};

struct Layout {
    std::uint64_t fileSize = 0;
    std::vector<LayoutItem> items;
    std::vector<LayoutEnd> ends; ///< none where everything is filled; those inside metadata atoms too
};

/// Which items are kept. A movie may hold hundreds of thousands that hold no metadata.
enum class LayoutPart { Whole, MetaData };

/// No items for a bare stream. Throws `Failure` where the file cannot be read.
Layout layoutOf(Recording& recording, LayoutPart part = LayoutPart::Whole);

} // namespace Zulm
