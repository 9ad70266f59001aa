#include "ZULMetaDataBridge/Source/StreamSalvage.h"

#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <string>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_blockSize = 4 << 20;

/// All registered identifiers differ in their first group and share the rest, the tail.
constexpr std::size_t s_groupSize = 4;
constexpr std::size_t s_tailSize = sizeof(uuid) - s_groupSize;

/// How many bytes before an identifier's tail show what contains the stream, and how many the header has from the tail
/// on.
constexpr std::size_t s_before = detail::s_extendedAtomHeaderSize + s_groupSize;
constexpr std::size_t s_behind = s_metaDataHeaderSize - s_groupSize;

std::string_view tailOfIdentifiers() {
    return {reinterpret_cast<const char*>(s_metaDataKinds.front().type.data) + s_groupSize, s_tailSize};
}

/// Assumes that no entry is more than a day before the start of its recording, or ten years after it.
bool canBeTime(double seconds) {
    constexpr double day = 86400;
    return std::isfinite(seconds) && seconds >= -day && seconds < 3652 * day;
}

template <class Value>
std::optional<double> timeOf(std::string_view bytes) {
    const auto decoded = decodeEntry<Value>(bytes, 1);
    return decoded ? std::optional<double>(decoded->time) : std::nullopt;
}

/// Returns whether `bytes` are an entry with a value of one of the types. The library does not know the type of a kind
/// that is registered but never decoded, so it tries them all.
template <class... Values>
bool isEntryOfAny(const MetaDataHeader& header, std::string_view bytes) {
    const auto isOne = [&]<class Value>() {
        const std::optional<double> time = timeOf<Value>(bytes);
        return metaDataFixedEntrySize<Value>() == header.fixedEntrySize && time && canBeTime(*time);
    };
    return (isOne.template operator()<Values>() || ...);
}

bool canBeEntry(const MetaDataHeader& header, std::string_view bytes) {
    if (!isDecodable(header))
        return isEntryOfAny<int, double, Rect, std::string, std::list<std::string>>(header, bytes);
    const std::optional<double> time = timeOfEntry(header, bytes);
    return time && canBeTime(*time);
}

bool canBeHeader(const MetaDataHeader& header) {
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    if (!kind || header.version < 1 || header.version > kind->currentVersion)
        return false;
    if (RecordedKinds::visit(header.uuid, []<class Kind>() {}))
        return isDecodable(header);
    constexpr std::array sizes{0U, unsigned{sizeof(double) + sizeof(int)}, unsigned{sizeof(double) + sizeof(Point)},
                               unsigned{sizeof(double) + sizeof(Rect)}};
    return std::find(sizes.begin(), sizes.end(), header.fixedEntrySize) != sizes.end();
}

/// The header of a DATA atom or chunk, which comes before a stream.
struct DataHeader {
    std::uint64_t size = 0; ///< its own
    std::uint64_t payload = 0;
};

/// Returns how many of `size` bytes are read at once.
std::size_t blockSizeFor(std::uint64_t size) {
    return static_cast<std::size_t>(std::min<std::uint64_t>(size, s_blockSize));
}

/// Returns the DATA header at the end of `before`, which may have any of its three forms.
std::optional<DataHeader> dataHeaderAtEndOf(std::string_view before) {
    using namespace detail;
    constexpr std::uint32_t type = swapInt(s_streamAtom.value); // as it is stored
    const std::size_t end = before.size();
    if (end < s_chunkHeaderSize)
        return std::nullopt;
    const std::size_t chunk = end - s_chunkHeaderSize;
    const std::size_t extended = end < s_extendedAtomHeaderSize ? 0 : end - s_extendedAtomHeaderSize;
    const auto without = [](std::uint64_t headerSize, std::uint64_t size) {
        return DataHeader{headerSize, size < headerSize ? 0 : size - headerSize};
    };
    if (end >= s_extendedAtomHeaderSize && detail::numberIn<std::uint32_t>(before, extended + 4) == type &&
        swapInt(detail::numberIn<std::uint32_t>(before, extended)) == s_extendedSizeMarker)
        return without(s_extendedAtomHeaderSize, swapInt(detail::numberIn<std::uint64_t>(before, chunk)));
    if (detail::numberIn<std::uint32_t>(before, chunk + 4) == type)
        return without(s_atomHeaderSize, swapInt(detail::numberIn<std::uint32_t>(before, chunk)));
    if (detail::numberIn<std::uint32_t>(before, chunk) == type)
        return DataHeader{s_chunkHeaderSize, detail::numberIn<std::uint32_t>(before, chunk + 4)};
    return std::nullopt;
}

/// Sorts by kind, and puts the stream with more entries, the better origin and the later place first.
bool isBetter(const SalvagedStream& left, const SalvagedStream& right) {
    if (left.header.uuid != right.header.uuid)
        return left.header.uuid < right.header.uuid;
    if (left.entries != right.entries)
        return left.entries > right.entries;
    return left.origin != right.origin ? left.origin < right.origin : left.offset > right.offset;
}

/// Marker and type of an atom as the library writes it. No other bytes of a stream are likely to look like this.
std::string itemMark(FourCC type) {
    const auto header = detail::extendedAtomHeader(type, 0);
    return {header.data(), detail::s_atomHeaderSize};
}

} // namespace

StreamSalvage::StreamSalvage(ByteSource file, Container::Type type, Progress progress)
    : file_(std::move(file)), type_(type), progress_(std::move(progress)), total_(file_.size()) {}

SalvageReport StreamSalvage::run() {
    candidates_.clear();
    reachable_.clear();
    hasMore_ = false;
    findReachable();
    search();
    measureAll();
    return report();
}

void StreamSalvage::findReachable() {
    const auto add = [this](std::uint64_t begin, std::uint64_t offset, std::uint64_t declared) {
        Candidate found{{}, begin};
        MetaDataHeader& header = found.stream.header;
        if (declared < sizeof header || reachable_.size() == SalvageReport::s_maximumStreams ||
            file_.read(offset, {reinterpret_cast<char*>(&header), sizeof header}) < sizeof header)
            return;
        found.stream.origin = SalvagedStream::Reachable;
        found.stream.offset = offset;
        found.stream.declaredBytes = declared;
        reachable_.push_back(found);
    };
    if (type_ == Container::RawStream)
        return add(0, 0, total_);
    ItemWalk items(file_, type_);
    while (const auto item = items.next()) {
        if (!item->holdsMetaData() || item->end() <= item->offset) // readers find nothing in an item without an end
            continue;
        ItemWalk children = items.inside(*item);
        while (const auto child = children.next())
            if (child->holdsStream())
                add(child->offset, child->payloadOffset(), child->payloadSize());
    }
}

void StreamSalvage::search() {
    const std::size_t blockSize = blockSizeFor(total_);
    std::string block(s_before + s_behind + blockSize, '\0');
    std::size_t kept = 0; // of the block before; they stand before the bytes that are read
    for (std::uint64_t position = 0; position < total_;) {
        const std::size_t size = file_.read(position, {block.data() + kept, blockSize});
        if (size == 0)
            return;
        searchIn({block.data(), kept + size}, kept, position - kept);
        position += size;
        const std::size_t overlap = std::min(kept + size, s_before + s_behind);
        std::memmove(block.data(), block.data() + kept + size - overlap, overlap);
        kept = overlap;
        if (progress_)
            progress_(position);
    }
}

/// `bytes` stand at `offset`; the first `kept` of them have been searched. A header that reaches beyond them is found
/// in the next ones, which overlap with these.
void StreamSalvage::searchIn(std::string_view bytes, std::size_t kept, std::uint64_t offset) {
    const std::string_view tail = tailOfIdentifiers();
    for (std::size_t at = bytes.find(tail); at != std::string_view::npos; at = bytes.find(tail, at + 1)) {
        const bool isSeenBefore = at + s_behind <= kept;
        if (at < s_groupSize || isSeenBefore || bytes.size() - at < s_behind)
            continue;
        const std::size_t start = at - s_groupSize;
        consider(bytes.substr(start), bytes.substr(0, start), offset + start);
    }
}

void StreamSalvage::consider(std::string_view bytes, std::string_view before, std::uint64_t offset) {
    const auto header = detail::numberIn<MetaDataHeader>(bytes, 0);
    if (!canBeHeader(header))
        return;
    hasMore_ |= candidates_.size() == SalvageReport::s_maximumStreams;
    if (hasMore_)
        return;
    Candidate found{{}, offset};
    found.stream.header = header;
    found.stream.offset = offset;
    const std::optional<DataHeader> data = dataHeaderAtEndOf(before);
    if (data && data->payload >= s_metaDataHeaderSize) {
        found.begin -= data->size;
        found.stream.origin = SalvagedStream::Unreachable;
        found.stream.declaredBytes = data->payload;
    }
    candidates_.push_back(found);
}

void StreamSalvage::measureAll() {
    std::erase_if(candidates_, [this](const Candidate& candidate) {
        return std::any_of(reachable_.begin(), reachable_.end(),
                           [&](const Candidate& other) { return other.stream.offset == candidate.stream.offset; });
    });
    std::erase_if(candidates_, [this](Candidate& candidate) { return !beginsLikeStream(candidate.stream); });
    candidates_.insert(candidates_.end(), reachable_.begin(), reachable_.end());
    std::sort(candidates_.begin(), candidates_.end(),
              [](const Candidate& left, const Candidate& right) { return left.stream.offset < right.stream.offset; });
    std::uint64_t coveredEnd = 0;
    for (std::size_t index = 0; index < candidates_.size(); ++index) {
        Candidate& candidate = candidates_[index];
        const bool isInside = candidate.stream.offset < coveredEnd;
        candidate.isStream = (!isInside || candidate.stream.origin == SalvagedStream::Reachable) && measure(index);
        if (candidate.isStream)
            coveredEnd = std::max(coveredEnd, candidate.stream.end());
    }
}

bool StreamSalvage::beginsLikeStream(const SalvagedStream& stream) const {
    if (stream.declaredBytes == s_metaDataHeaderSize)
        return true;
    StreamEntries entries(file_.part(stream.offset, declaredEndOf(stream) - stream.offset));
    const auto first = entries.next();
    return first && canBeEntry(stream.header, entries.bytesOf(*first));
}

/// Returns false if there is nothing to write of it.
bool StreamSalvage::measure(std::size_t index) {
    Candidate& candidate = candidates_[index];
    SalvagedStream& stream = candidate.stream;
    const std::uint64_t declaredEnd = declaredEndOf(stream);
    walk(stream, declaredEnd);
    const bool isWhole = stream.declaredBytes && stream.bytes == *stream.declaredBytes;
    if (stream.origin != SalvagedStream::Reachable || !isWhole) {
        const std::uint64_t limit = std::min(declaredEnd, limitOf(index));
        walk(stream, limit);
        walk(stream, std::min(limit, nextItemIn(stream.offset + s_metaDataHeaderSize, stream.end())));
        stream.isCutShort = stream.end() < declaredEnd && (stream.declaredBytes || stream.end() < limit);
    }
    stream.isCutShort |= stream.declaredBytes && stream.bytes < *stream.declaredBytes;
    const bool isEmpty = stream.declaredBytes == s_metaDataHeaderSize;
    const bool isKnownPlace = stream.origin == SalvagedStream::Reachable && isKnownStream(stream.header);
    return stream.entries > 0 || isEmpty || isKnownPlace;
}

std::uint64_t StreamSalvage::declaredEndOf(const SalvagedStream& stream) const {
    const std::uint64_t present = total_ - stream.offset;
    return stream.offset + std::min(present, stream.declaredBytes.value_or(present));
}

/// Returns the position at which a stream must end because another one begins.
std::uint64_t StreamSalvage::limitOf(std::size_t index) const {
    const bool hasEqualEntries = candidates_[index].stream.header.fixedEntrySize != 0;
    for (std::size_t next = index + 1; next < candidates_.size(); ++next)
        if (hasEqualEntries || candidates_[next].stream.origin != SalvagedStream::Bare)
            return std::max(candidates_[next].begin, candidates_[index].stream.offset + s_metaDataHeaderSize);
    return total_;
}

void StreamSalvage::walk(SalvagedStream& stream, std::uint64_t limit) const {
    StreamEntries entries(file_.part(stream.offset, limit - stream.offset));
    stream.bytes = std::min<std::uint64_t>(s_metaDataHeaderSize, limit - stream.offset);
    stream.entries = 0;
    if (stream.origin == SalvagedStream::Reachable && stream.header.fixedEntrySize != entrySizeOf(stream.header)) {
        stream.bytes = limit - stream.offset; // its entries cannot be told apart, but none of them is lost
        return;
    }
    while (const auto entry = entries.next()) {
        if (!stream.declaredBytes && !canBeEntry(stream.header, entries.bytesOf(*entry)))
            return;
        stream.bytes = entry->end();
        ++stream.entries;
    }
}

/// The first header of an atom of this library between `begin` and `end`, or `end`.
std::uint64_t StreamSalvage::nextItemIn(std::uint64_t begin, std::uint64_t end) const {
    const std::array marks{itemMark(detail::s_streamAtom), itemMark(detail::s_metaDataAtom),
                           itemMark(detail::s_recordingInfoAtom)};
    std::string block(blockSizeFor(end - std::min(begin, end)), '\0');
    for (std::uint64_t position = begin; position < end;) {
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(block.size(), end - position));
        const std::size_t size = file_.read(position, {block.data(), wanted});
        const std::string_view bytes(block.data(), size);
        std::size_t first = std::string_view::npos;
        for (const std::string& mark : marks)
            first = std::min(first, bytes.find(mark));
        if (first != std::string_view::npos)
            return position + first;
        if (size <= detail::s_atomHeaderSize)
            return end;
        position += size - detail::s_atomHeaderSize + 1;
    }
    return end;
}

SalvageReport StreamSalvage::report() {
    SalvageReport report;
    report.hasMore = hasMore_;
    for (const Candidate& candidate : candidates_)
        if (candidate.isStream)
            report.streams.push_back(candidate.stream);
    std::sort(report.streams.begin(), report.streams.end(), isBetter);
    return report;
}

} // namespace ZULMetaData
