#include "Reports/Layout.h"

#include "Reports/Text.h"
#include "ZULMetaDataBridge/Source/Recording.h"

#include <fmt/core.h>

#include <algorithm>
#include <istream>

namespace Zulm {

using namespace ZULMetaData;

namespace {

/// Leaves the stream where it was.
class PositionKept {
public:
    explicit PositionKept(std::istream& stream) : stream_(stream) {
        stream_.clear();
        position_ = stream_.tellg();
    }
    ~PositionKept() {
        stream_.clear();
        stream_.seekg(position_);
    }
    PositionKept(const PositionKept&) = delete;
    PositionKept& operator=(const PositionKept&) = delete;

private:
    std::istream& stream_;
    std::istream::pos_type position_;
};

class Walk {
public:
    Walk(Recording& recording, LayoutPart part, const LayoutVisitor& visitor)
        : recording_(recording), fileSize_(recording.size()), part_(part), visitor_(visitor) {}

    void run() { walk(0, fileSize_, false); }

private:
    /// One list of items and the bytes that they should fill.
    void walk(std::uint64_t begin, std::uint64_t end, bool isInsideMetaData) {
        std::uint64_t position = begin;
        bool hasEnded = false;
        visit(begin, end, [&](const ContainerItem& found) {
            const LayoutItem item = entryFor(found, isInsideMetaData);
            show(item, end, isInsideMetaData);
            const std::string reason = reasonToEnd(item, end, isInsideMetaData);
            hasEnded = !reason.empty();
            if (hasEnded)
                visitor_.end({found.offset, reason});
            else
                position = behind(item);
            return !hasEnded;
        });
        if (position < end && !hasEnded)
            visitor_.end({position, fmt::format("{} bytes are left, too few for another header", end - position)});
    }

    void show(const LayoutItem& item, std::uint64_t end, bool isInsideMetaData) {
        if (!isInsideMetaData && !item.isMetaData && part_ != LayoutPart::Whole)
            return;
        visitor_.item(item, isInsideMetaData);
        if (!item.isMetaData)
            return;
        const PositionKept kept(recording_.input());
        walk(item.item.payloadOffset(), std::min(item.item.end(), end), true);
        visitor_.childrenEnd();
    }

    bool isMovie() const { return recording_.container() == Container::QuickTime; }
    const char* what() const { return isMovie() ? "atom" : "chunk"; }

    void visit(std::uint64_t begin, std::uint64_t end, const ContainerVisitor& visitor) {
        (isMovie() ? visitAtoms : visitChunks)(recording_.input(), begin, end, fileSize_, visitor);
        recording_.requireRead();
    }

    LayoutItem entryFor(const ContainerItem& found, bool isInsideMetaData) {
        LayoutItem entry;
        entry.item = found;
        entry.isOpenEnded = isMovie() && found.sizeField == 0;
        entry.size = entry.isOpenEnded ? fileSize_ - found.offset : found.size;
        entry.isMetaData = !isInsideMetaData && found.holdsMetaData() && !entry.isOpenEnded;
        entry.isForeign = isInsideMetaData && !found.holdsStream();
        if (isInsideMetaData && !entry.isForeign)
            entry.stream = streamAt(found.payloadOffset());
        return entry;
    }

    std::optional<uuid> streamAt(std::uint64_t offset) {
        MetaDataHeader header;
        std::istream& stream = recording_.input();
        const PositionKept kept(stream);
        stream.seekg(static_cast<std::streamoff>(offset));
        const bool isThere = !stream.read(reinterpret_cast<char*>(&header), sizeof header).fail();
        recording_.requireRead();
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

    Recording& recording_;
    std::uint64_t fileSize_;
    LayoutPart part_;
    const LayoutVisitor& visitor_;
};

} // namespace

std::string LayoutItem::headerForm() const {
    if (isOpenEnded)
        return "open-ended";
    return item.isExtended() ? "extended" : "32-bit";
}

void walkLayout(Recording& recording, LayoutPart part, const LayoutVisitor& visitor) {
    if (recording.container() != Container::RawStream)
        Walk(recording, part, visitor).run();
}

} // namespace Zulm
