#include "ZULMetaDataSession/Retiming/EntryIndex.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <system_error>

namespace ZULMetaData::detail {

namespace {

/// The size of an entry has been compared with the bytes that are there.
bool fits(const MetaDataHeader& header, std::string_view bytes) {
    if (header.uuid == s_cursorImageUUID)
        return decodeEntry<CursorImage>(bytes, header.version) && hasRoomForCursorFields(bytes, header.version);
    return bytes.size() >= timeOffsetIn(header) + sizeof(double);
}

} // namespace

EntryIndex::EntryIndex(const ByteSource& stream) : reader_(stream), timeOffset_(0), isDense_(false) {
    StreamEntries entries(stream);
    if (!entries.header())
        return;
    header_ = *entries.header();
    timeOffset_ = timeOffsetIn(header_);
    isDense_ = header_.fixedEntrySize != 0;
    if (isDense_)
        times_.reserve(static_cast<std::size_t>((stream.size() - s_metaDataHeaderSize) / header_.fixedEntrySize));
    while (const auto entry = entries.next()) {
        const std::string_view bytes = entries.bytesOf(*entry);
        if (bytes.size() < entry->size)
            throw std::system_error(std::make_error_code(std::errc::io_error), "cannot be read");
        if (!fits(header_, bytes))
            break;
        add(numberIn<double>(bytes, timeOffset_), *entry);
        end_ = entry->end();
    }
    putInOrder();
}

void EntryIndex::add(double time, const StreamEntry& entry) {
    if (!std::isfinite(time)) {
        ++timeless_;
        return;
    }
    if (isDense_ && timeless_ > 0) {
        isDense_ = false;
        for (std::size_t i = 0; i < times_.size(); ++i)
            offsets_.push_back(s_metaDataHeaderSize + std::uint64_t{i} * header_.fixedEntrySize);
    }
    if (!isDense_)
        offsets_.push_back(entry.offset);
    times_.push_back(time);
}

void EntryIndex::putInOrder() {
    if (std::is_sorted(times_.begin(), times_.end()))
        return;
    std::vector<std::size_t> order(times_.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::stable_sort(order.begin(), order.end(),
                     [this](std::size_t left, std::size_t right) { return times_[left] < times_[right]; });
    std::vector<double> times;
    std::vector<std::uint64_t> offsets;
    times.reserve(order.size());
    offsets.reserve(order.size());
    for (const std::size_t entry : order) {
        times.push_back(times_[entry]);
        offsets.push_back(isDense_ ? s_metaDataHeaderSize + std::uint64_t{entry} * header_.fixedEntrySize
                                   : offsets_[entry]);
    }
    times_ = std::move(times);
    offsets_ = std::move(offsets);
    isDense_ = false;
}

std::size_t EntryIndex::countBefore(double time) const {
    return static_cast<std::size_t>(std::lower_bound(times_.begin(), times_.end(), time) - times_.begin());
}

std::size_t EntryIndex::countUntil(double time) const {
    return static_cast<std::size_t>(std::upper_bound(times_.begin(), times_.end(), time) - times_.begin());
}

std::string_view EntryIndex::bytesOf(std::size_t entry) {
    std::uint64_t size = header_.fixedEntrySize;
    const std::uint64_t offset = isDense_ ? s_metaDataHeaderSize + std::uint64_t{entry} * size : offsets_[entry];
    if (size == 0)
        size = sizeof(std::uint32_t) + std::uint64_t{reader_.numberAt<std::uint32_t>(offset).value_or(0)};
    const std::string_view bytes = reader_.at(offset, size);
    if (bytes.size() < std::max<std::uint64_t>(size, timeOffset_ + sizeof(double))) // the file has changed
        throw std::system_error(std::make_error_code(std::errc::io_error), "cannot be read");
    return bytes;
}

} // namespace ZULMetaData::detail
