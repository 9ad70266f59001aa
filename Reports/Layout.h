#pragma once

// How a container is put together: its items, what is inside its metadata atom, and the places at which they end too
// early.

#include "ZULMetaData/ZULMetaData.h"

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

namespace ZULMetaData {

class RecordingFile;

} // namespace ZULMetaData

namespace Zulm {

struct LayoutItem {
    ZULMetaData::ContainerItem item;
    bool isMetaData = false;                 ///< holds streams
    bool isForeign = false;                  ///< inside such an item, and no stream
    bool isOpenEnded = false;                ///< has no size: it reaches to the end of the file
    std::optional<ZULMetaData::uuid> stream; ///< the kind of the stream that it is

    std::uint64_t size; ///< what it takes of the file; an open end reaches to the end of the file

    /// "32-bit", "extended" or "open-ended".
    std::string headerForm() const;
};

/// The place after which nothing could be found, although there is more, and the reason.
struct LayoutEnd {
    std::uint64_t offset;
    std::string reason; ///< a sentence without its full stop
};

/// Gets what a walk meets, in the order of the file. A file may hold millions of items: none is kept.
struct LayoutVisitor {
    std::function<void(const LayoutItem& item, bool isChild)> item = [](const LayoutItem&, bool) {};

    /// After the children of an item that holds metadata.
    std::function<void()> childrenEnd = [] {};

    std::function<void(const LayoutEnd& end)> end = [](const LayoutEnd&) {};
};

/// Which items are visited. A movie may hold hundreds of thousands that hold no metadata.
enum class LayoutPart { Whole, MetaData };

/// Visits the items of a container, and no item of a bare stream. Throws `FileError` if the file cannot be read.
void walkLayout(ZULMetaData::RecordingFile& recording, LayoutPart part, const LayoutVisitor& visitor);

} // namespace Zulm
