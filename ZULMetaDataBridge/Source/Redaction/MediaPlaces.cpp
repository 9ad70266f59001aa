#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"

#include <algorithm>
#include <utility>

namespace ZULMetaData::detail {

namespace {

/// Returns the blanks in the order of the file, without overlaps.
std::vector<Blank> inOrder(std::vector<Blank> blanks) {
    std::stable_sort(blanks.begin(), blanks.end(), [](const Blank& left, const Blank& right) {
        return left.offset != right.offset ? left.offset < right.offset : left.size > right.size;
    });
    std::vector<Blank> ordered;
    for (Blank& blank : blanks)
        if (ordered.empty() || blank.offset >= ordered.back().end())
            ordered.push_back(std::move(blank));
        else if (blank.end() > ordered.back().end()) // texts that lie across each other
            ordered.back().size = blank.end() - ordered.back().offset;
    return ordered;
}

/// `bytes` stand at `offset`.
void blankIn(const std::vector<Blank>& blanks, std::uint64_t offset, std::span<char> bytes) {
    const std::uint64_t end = offset + bytes.size();
    auto next = std::lower_bound(blanks.begin(), blanks.end(), offset,
                                 [](const Blank& blank, std::uint64_t position) { return blank.end() <= position; });
    for (; next != blanks.end() && next->offset < end; ++next)
        for (std::uint64_t at = std::max(next->offset, offset); at < std::min(next->end(), end); ++at) {
            const std::uint64_t place = at - next->offset;
            bytes[static_cast<std::size_t>(at - offset)] =
                place < next->head.size() ? next->head[static_cast<std::size_t>(place)] : '\0';
        }
}

} // namespace

ByteSource withBlanks(const ByteSource& file, std::vector<Blank> blanks) {
    return {file.size(), [file, ordered = inOrder(std::move(blanks))](std::uint64_t position, std::span<char> bytes) {
                const std::size_t size = file.read(position, bytes);
                blankIn(ordered, position, bytes.first(size));
                return size;
            }};
}

} // namespace ZULMetaData::detail
