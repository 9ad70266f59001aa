#include "Tools/zulm/Layout.h"

#include "Tools/zulm/Recording.h"
#include "Tools/zulm/Text.h"

#include <fmt/core.h>

#include <algorithm>
#include <utility>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// One list of items and the bytes that they should fill.
class Walk {
public:
    Walk(Recording& recording, LayoutPart part, Layout& layout)
        : name_(recording.name()), parser_(recording.parser()), part_(part), layout_(layout) {}

    std::vector<LayoutItem> items(std::uint64_t begin, std::uint64_t end, bool isInsideMetaData) {
        const std::uint64_t firstEnd = layout_.ends.size();
        std::vector<LayoutItem> items;
        std::uint64_t position = begin;
        visit(begin, end, [&](const ContainerItem& found) {
            LayoutItem item = entryFor(found, isInsideMetaData);
            const std::string reason = reasonToEnd(item, end, isInsideMetaData);
            if (reason.empty())
                position = behind(item);
            else
                layout_.ends.push_back({found.offset, reason});
            if (isInsideMetaData || item.isMetaData || part_ == LayoutPart::Whole)
                items.push_back(std::move(item));
            return reason.empty();
        });
        const bool isFilled = position >= end || layout_.ends.size() > firstEnd;
        if (!isFilled)
            layout_.ends.push_back(
                {position, fmt::format("{} bytes are left, too few for another header", end - position)});
        for (LayoutItem& item : items) {
            if (item.isMetaData)
                item.children = this->items(item.item.payloadOffset(), std::min(item.item.end(), end), true);
            else if (isInsideMetaData && !item.isForeign)
                item.stream = streamAt(item.item.payloadOffset());
        }
        return items;
    }

private:
    bool isMovie() const { return parser_.getStreamType() == MetaDataParser::QuickTime; }
    const char* what() const { return isMovie() ? "atom" : "chunk"; }

    void visit(std::uint64_t begin, std::uint64_t end, const ContainerVisitor& visitor) {
        (isMovie() ? visitAtoms : visitChunks)(parser_.getStream(), begin, end, layout_.fileSize, visitor);
        requireRead(parser_.getStream(), name_);
    }

    LayoutItem entryFor(const ContainerItem& found, bool isInsideMetaData) {
        LayoutItem entry;
        entry.item = found;
        entry.isOpenEnded = isMovie() && found.sizeField == 0;
        entry.size = entry.isOpenEnded ? layout_.fileSize - found.offset : found.size;
        entry.isMetaData = !isInsideMetaData && found.holdsMetaData() && !entry.isOpenEnded;
        entry.isForeign = isInsideMetaData && !found.holdsStream();
        return entry;
    }

    std::optional<uuid> streamAt(std::uint64_t offset) {
        MetaDataHeader header;
        std::istream& stream = parser_.getStream();
        stream.clear();
        stream.seekg(static_cast<std::streamoff>(offset));
        const bool isThere = !stream.read(reinterpret_cast<char*>(&header), sizeof header).fail();
        requireRead(stream, name_);
        if (!isThere)
            return std::nullopt;
        return header.uuid;
    }

    /// Where the next item is, behind one that has no reason to end.
    std::uint64_t behind(const LayoutItem& entry) const {
        return entry.item.offset + entry.size + (isMovie() ? 0 : entry.size % 2);
    }

    /// Why nothing behind an item can be found; empty where something can.
    std::string reasonToEnd(const LayoutItem& entry, std::uint64_t end, bool isInsideMetaData) const {
        const std::string name = fmt::format("{} '{}'", what(), printable(entry.item.type));
        if (entry.isOpenEnded)
            return fmt::format(
                "{} is open-ended, as an interrupted recording leaves it; 'zulm repair' gives it its size", name);
        if (isMovie() && entry.size == 0)
            return fmt::format("{} declares size 0, as an interrupted save leaves it; 'zulm repair' gives it its size",
                               name);
        if (entry.size < entry.item.headerSize)
            return fmt::format("{} declares {} bytes, less than its header of {}", name, entry.size,
                               entry.item.headerSize);
        if (!isMovie() && entry.item.sizeField == 0)
            return fmt::format("{} has size 0, where the search for metadata ends", name);
        if (entry.size > end - std::min(entry.item.offset, end))
            return fmt::format("{} reaches {} bytes beyond the end of {}", name,
                               entry.size - (end - std::min(entry.item.offset, end)),
                               isInsideMetaData ? "the metadata" : "the file");
        return {};
    }

    const std::string& name_;
    MetaDataParser& parser_;
    LayoutPart part_;
    Layout& layout_;
};

} // namespace

std::string LayoutItem::headerForm() const {
    if (isOpenEnded)
        return "open-ended";
    return item.isExtended() ? "extended" : "32-bit";
}

Layout layoutOf(Recording& recording, LayoutPart part) {
    Layout layout;
    layout.fileSize = recording.size();
    if (recording.parser().getStreamType() != MetaDataParser::RawStream)
        layout.items = Walk(recording, part, layout).items(0, layout.fileSize, false);
    return layout;
}

} // namespace Zulm
