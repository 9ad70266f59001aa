#include "Reports/Layout.h"

#include "Reports/Text.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <fmt/core.h>

#include <algorithm>

namespace Zulm {

using namespace ZULMetaData;

namespace {

LayoutItem entryFor(const ItemWalk& items, const ContainerItem& found, bool isInsideMetaData) {
    LayoutItem entry;
    entry.item = found;
    entry.isOpenEnded = items.isMovie() && found.sizeField == 0;
    entry.size = entry.isOpenEnded ? items.source().size() - found.offset : found.size;
    entry.isMetaData = !isInsideMetaData && found.holdsMetaData() && !entry.isOpenEnded;
    entry.isForeign = isInsideMetaData && !found.holdsStream();
    if (isInsideMetaData && !entry.isForeign)
        if (const auto header = StreamEntries(items.source().part(found.payloadOffset())).header())
            entry.stream = header->uuid;
    return entry;
}

/// Returns why the walk ends at this item. Empty if it goes on.
std::string reasonToEnd(const ItemWalk& items, const LayoutItem& entry, bool isInsideMetaData) {
    const bool isMovie = items.isMovie();
    const std::uint64_t left = items.end() - std::min(entry.item.offset, items.end());
    if (entry.size >= entry.item.headerSize && entry.size <= left && !entry.isOpenEnded &&
        (isMovie || entry.item.sizeField != 0))
        return {}; // before any text is made: a movie may hold hundreds of thousands of items
    const std::string name = fmt::format("{} '{}'", isMovie ? "atom" : "chunk", printable(entry.item.type.text()));
    if (entry.isOpenEnded)
        return fmt::format("{} is open-ended, as an interrupted recording leaves it; 'zulm repair' gives it its size",
                           name);
    if (isMovie && entry.size == 0)
        return fmt::format("{} declares size 0, as an interrupted save leaves it; 'zulm repair' gives it its size",
                           name);
    if (entry.size < entry.item.headerSize)
        return fmt::format("{} declares {} bytes, less than its header of {}", name, entry.size, entry.item.headerSize);
    if (!isMovie && entry.item.sizeField == 0)
        return fmt::format("{} has size 0, where the search for metadata ends", name);
    if (entry.size > left)
        return fmt::format("{} reaches {} bytes beyond the end of {}", name, entry.size - left,
                           isInsideMetaData ? "the metadata" : "the file");
    return {};
}

/// One list of items and the bytes that they should fill.
void walk(ItemWalk items, LayoutPart part, const LayoutVisitor& visitor, bool isInsideMetaData) {
    std::uint64_t position = items.position();
    while (const auto found = items.next()) {
        const LayoutItem item = entryFor(items, *found, isInsideMetaData);
        if (isInsideMetaData || item.isMetaData || part == LayoutPart::Whole)
            visitor.item(item, isInsideMetaData);
        if (item.isMetaData) {
            walk(items.inside(item.item), part, visitor, true);
            visitor.childrenEnd();
        }
        if (const std::string reason = reasonToEnd(items, item, isInsideMetaData); !reason.empty())
            return visitor.end({found->offset, reason});
        position = items.after(*found);
    }
    if (position < items.end())
        visitor.end({position, fmt::format("{} bytes are left, too few for another header", items.end() - position)});
}

} // namespace

std::string LayoutItem::headerForm() const {
    if (isOpenEnded)
        return "open-ended";
    return item.isExtended() ? "extended" : "32-bit";
}

void walkLayout(RecordingFile& recording, LayoutPart part, const LayoutVisitor& visitor) {
    walk(ItemWalk(recording.bytes(), recording.container()), part, visitor, false);
}

} // namespace Zulm
