#include "ZULMetaDataBridge/Source/Redaction/MediaCopy.h"

#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

namespace ZULMetaData::detail {

namespace {

constexpr std::size_t s_mediaPiece = 1 << 20;

} // namespace

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

void MediaCopy::copy(std::uint64_t offset, std::uint64_t size, std::ostream& out,
                     const std::function<void(std::uint64_t)>& advance) const {
    std::vector<char> piece(s_mediaPiece);
    const std::uint64_t end = offset + size;
    while (offset < end) {
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(end - offset, piece.size()));
        const std::span<char> bytes(piece.data(), file_.read(offset, {piece.data(), wanted}));
        if (bytes.empty())
            throw std::system_error(EIO, std::generic_category(), "it ends at offset " + std::to_string(offset));
        blank(offset, bytes);
        if (isZero({bytes.data(), bytes.size()}))
            out.seekp(static_cast<std::streamoff>(bytes.size()), std::ios::cur);
        else
            out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        offset += bytes.size();
        advance(bytes.size());
    }
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
