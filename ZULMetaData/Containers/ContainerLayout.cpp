#include "ZULMetaData/Containers/ContainerLayout.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/WideRIFF.h"

#include <algorithm>
#include <utility>

namespace ZULMetaData {

ItemWalk::ItemWalk(ByteSource file, Container::Type type)
    : reader_(std::make_shared<detail::ByteReader>(std::move(file))), type_(type),
      sizes_(detail::ExtendedSizes::BelowHeader), end_(reader_->size()) {
    if (type == Container::Riff)
        first_ = detail::wideRIFF(*this);
    else if (type != Container::QuickTime)
        end_ = 0;
}

const ByteSource& ItemWalk::source() const {
    return reader_->source();
}

void ItemWalk::takeSizesLiterally() {
    sizes_ = detail::ExtendedSizes::Marked;
}

/// Builds the item where the caller wants it: in a movie of many fragments, copies of items take most of the time.
std::optional<ContainerItem> ItemWalk::itemAt(std::uint64_t position) const {
    std::optional<ContainerItem> item = position == 0 ? first_ : std::nullopt;
    if (item)
        return item;
    detail::ByteCursor cursor(*reader_, position, end_);
    item.emplace();
    if (!(isMovie() ? readAtomHeader(cursor, sizes_, *item) : readChunkHeader(cursor, *item)))
        item.reset();
    return item;
}

std::optional<ContainerItem> ItemWalk::next() {
    auto item = position_ < end_ ? itemAt(position_) : std::nullopt;
    if (item) {
        const std::uint64_t following = after(*item);
        position_ = following > item->offset ? following : end_;
    }
    return item;
}

ItemWalk ItemWalk::inside(const ContainerItem& parent) const {
    ItemWalk children = *this;
    children.first_.reset();
    children.position_ = parent.payloadOffset();
    children.end_ = parent.end() < parent.offset ? end_ : std::min(end_, parent.end());
    return children;
}

std::vector<ContainerItem> topLevelItems(const ByteSource& file, Container::Type type) {
    std::vector<ContainerItem> items;
    ItemWalk walk(file, type);
    while (const auto item = walk.next())
        items.push_back(*item);
    return items;
}

} // namespace ZULMetaData
