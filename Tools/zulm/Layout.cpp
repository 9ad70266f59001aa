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
    Walk(MetaDataParser& parser, Layout& layout) : parser_(parser), layout_(layout) {}

    std::vector<LayoutItem> items(std::uint64_t begin, std::uint64_t end, bool isInsideMetaData) {
        const std::uint64_t firstEnd = layout_.ends.size();
        std::vector<LayoutItem> items;
        std::uint64_t position = begin;
        for (const ContainerItem& found : listed(begin, end)) {
            items.push_back(entryFor(found, isInsideMetaData));
            position = behind(items.back());
            if (const std::string reason = reasonToEnd(items.back(), end, isInsideMetaData); !reason.empty()) {
                layout_.ends.push_back({found.offset, reason});
                break;
            }
        }
        const bool isFilled = position >= end || layout_.ends.size() > firstEnd;
        if (!isFilled)
            layout_.ends.push_back(
                {position, fmt::format("{} bytes are left, too few for another header", end - position)});
        for (LayoutItem& item : items)
            if (item.isMetaData)
                item.children =
                    this->items(item.item.payloadOffset(), std::min(item.item.offset + item.size, end), true);
        return items;
    }

private:
    bool isMovie() const { return parser_.getStreamType() == MetaDataParser::QuickTime; }
    const char* what() const { return isMovie() ? "atom" : "chunk"; }

    std::vector<ContainerItem> listed(std::uint64_t begin, std::uint64_t end) {
        std::istream& stream = parser_.getStream();
        return isMovie() ? listAtoms(stream, begin, end, layout_.fileSize)
                         : listChunks(stream, begin, end, layout_.fileSize);
    }

    LayoutItem entryFor(const ContainerItem& found, bool isInsideMetaData) {
        LayoutItem entry;
        entry.item = found;
        entry.isOpenEnded = isMovie() && found.sizeField == 0;
        entry.size = entry.isOpenEnded ? layout_.fileSize - found.offset : found.size;
        const bool isStream = isInsideMetaData && found.holdsStream();
        entry.isMetaData = !isInsideMetaData && found.holdsMetaData() && !entry.isOpenEnded;
        entry.isForeign = isInsideMetaData && !isStream;
        if (isStream)
            entry.stream = streamAt(found.payloadOffset());
        return entry;
    }

    std::optional<uuid> streamAt(std::uint64_t offset) {
        MetaDataHeader header;
        std::istream& stream = parser_.getStream();
        stream.clear();
        stream.seekg(static_cast<std::streamoff>(offset));
        if (!stream.read(reinterpret_cast<char*>(&header), sizeof header))
            return std::nullopt;
        return header.uuid;
    }

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

    MetaDataParser& parser_;
    Layout& layout_;
};

} // namespace

std::string LayoutItem::headerForm() const {
    if (isOpenEnded)
        return "open-ended";
    return item.isExtended() ? "extended" : "32-bit";
}

Layout layoutOf(Recording& recording) {
    MetaDataParser& parser = recording.parser();
    Layout layout;
    layout.fileSize = recording.size();
    if (parser.getStreamType() != MetaDataParser::RawStream)
        layout.items = Walk(parser, layout).items(0, layout.fileSize, false);
    return layout;
}

} // namespace Zulm
