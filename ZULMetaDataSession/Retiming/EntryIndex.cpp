#include "ZULMetaDataSession/Retiming/EntryIndex.h"

#include "ZULMetaDataSession/Error.h"

#include <algorithm>
#include <cmath>
#include <tuple>
#include <utility>

namespace ZULMetaData::detail {

namespace {

/// The size of an entry has been compared with the bytes that are there.
bool fits(const MetaDataHeader& header, std::string_view bytes) {
    if (header.uuid == s_cursorImageUUID)
        return decodeEntry<CursorImage>(bytes, header.version) && hasRoomForCursorFields(bytes, header.version);
    return bytes.size() >= timeOffsetIn(header) + sizeof(double);
}

} // namespace

EntryIndex::EntryIndex(const ByteSource& stream, const std::string& file)
    : file_(file), reader_(stream), timeOffset_(0), isDense_(false) {
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
            refuseChange();
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
        for (std::size_t i = 0; i < times_.size(); ++i)
            offsets_.push_back(offsetOf(i));
        isDense_ = false;
    }
    if (!isDense_)
        offsets_.push_back(entry.offset);
    times_.push_back(time);
}

void EntryIndex::putInOrder() {
    if (std::is_sorted(times_.begin(), times_.end()))
        return;
    std::vector<std::pair<double, std::uint64_t>> entries; // times and offsets
    entries.reserve(times_.size());
    for (std::size_t i = 0; i < times_.size(); ++i)
        entries.emplace_back(times_[i], offsetOf(i));
    std::stable_sort(entries.begin(), entries.end(),
                     [](const auto& left, const auto& right) { return left.first < right.first; });
    isDense_ = false;
    offsets_.resize(entries.size());
    for (std::size_t i = 0; i < entries.size(); ++i)
        std::tie(times_[i], offsets_[i]) = entries[i];
    keepInMemory();
}

/// Entries that are not in order are read from all over the stream.
void EntryIndex::keepInMemory() {
    constexpr std::uint64_t most = std::uint64_t{256} << 20;
    if (reader_.size() > most)
        return;
    copy_.resize(static_cast<std::size_t>(reader_.size()));
    copy_.resize(reader_.source().read(0, copy_));
}

std::size_t EntryIndex::countBefore(double time) const {
    return static_cast<std::size_t>(std::lower_bound(times_.begin(), times_.end(), time) - times_.begin());
}

std::size_t EntryIndex::countUntil(double time) const {
    return static_cast<std::size_t>(std::upper_bound(times_.begin(), times_.end(), time) - times_.begin());
}

void EntryIndex::refuseChange() const {
    throw Error(file_, "has changed while it was read; try again");
}

std::string_view EntryIndex::bytesOf(std::size_t entry) {
    const std::uint64_t offset = offsetOf(entry);
    std::uint64_t size = header_.fixedEntrySize;
    if (size == 0) {
        const std::string_view stored = at(offset, sizeof(std::uint32_t));
        size = stored.size() + (stored.empty() ? 0 : numberIn<std::uint32_t>(stored, 0));
    }
    const std::string_view bytes = at(offset, size);
    if (bytes.size() < timeOffset_ + sizeof(double))
        refuseChange();
    return bytes;
}

/// Returns nothing if fewer bytes can be read.
std::string_view EntryIndex::at(std::uint64_t offset, std::uint64_t size) {
    if (copy_.empty()) {
        const std::string_view bytes = reader_.at(offset, size);
        return bytes.size() < size ? std::string_view() : bytes;
    }
    const bool isThere = offset <= copy_.size() && size <= copy_.size() - offset;
    return isThere ? std::string_view(copy_).substr(static_cast<std::size_t>(offset), static_cast<std::size_t>(size))
                   : std::string_view();
}

} // namespace ZULMetaData::detail
