#include "ZULMetaDataBridge/Source/Redaction/MediaCopy.h"

#include <algorithm>

namespace ZULMetaData::detail {

MediaCopy::MediaCopy(ByteSource file, std::vector<Blank> blanks) : file_(std::move(file)) {
    std::stable_sort(blanks.begin(), blanks.end(), [](const Blank& left, const Blank& right) {
        return left.offset != right.offset ? left.offset < right.offset : left.size > right.size;
    });
    for (Blank& blank : blanks)
        if (blanks_.empty() || blank.offset >= blanks_.back().end())
            blanks_.push_back(std::move(blank));
        else if (blank.end() > blanks_.back().end()) // texts that lie across each other
            blanks_.back().size = blank.end() - blanks_.back().offset;
}

bool MediaCopy::isKept(std::uint64_t offset) const {
    return std::none_of(blanks_.begin(), blanks_.end(),
                        [offset](const Blank& blank) { return blank.offset <= offset && offset < blank.end(); });
}

ByteSource MediaCopy::bytes() const {
    return {file_.size(), [this](std::uint64_t position, std::span<char> bytes) {
                const std::size_t size = file_.read(position, bytes);
                blank(position, bytes.first(size));
                return size;
            }};
}

void MediaCopy::blank(std::uint64_t offset, std::span<char> bytes) const {
    const std::uint64_t end = offset + bytes.size();
    auto next = std::lower_bound(blanks_.begin(), blanks_.end(), offset,
                                 [](const Blank& blank, std::uint64_t position) { return blank.end() <= position; });
    for (; next != blanks_.end() && next->offset < end; ++next)
        for (std::uint64_t at = std::max(next->offset, offset); at < std::min(next->end(), end); ++at) {
            const std::uint64_t place = at - next->offset;
            bytes[static_cast<std::size_t>(at - offset)] =
                place < next->head.size() ? next->head[static_cast<std::size_t>(place)] : '\0';
        }
}

} // namespace ZULMetaData::detail
