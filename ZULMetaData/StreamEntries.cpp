#include "ZULMetaData/StreamEntries.h"

#include <algorithm>
#include <cstring>
#include <new>
#include <streambuf>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_windowSize = 1 << 16;

using Size = std::uint32_t;

template <class Number>
Number numberAt(std::string_view bytes, std::size_t offset) {
    Number number{};
    std::memcpy(&number, bytes.data() + offset, sizeof number);
    return number;
}

/// A text as it is stored: size, time, characters.
bool isText(std::string_view bytes) {
    constexpr std::size_t leastSize = sizeof(Size) + sizeof(double);
    return bytes.size() >= leastSize && numberAt<Size>(bytes, 0) == bytes.size() - sizeof(Size);
}

/// An input stream over bytes of somebody else.
class BytesInput : private std::streambuf, public std::istream {
public:
    explicit BytesInput(std::string_view bytes) : std::istream(static_cast<std::streambuf*>(this)) {
        char* begin = const_cast<char*>(bytes.data()); // never written to
        setg(begin, begin, begin + bytes.size());
    }
};

} // namespace

StreamEntries::StreamEntries(ReadBytes read, std::uint64_t length) : read_(std::move(read)), length_(length) {
    const std::string_view bytes = bytesAt(0, s_metaDataHeaderSize);
    if (length_ < s_metaDataHeaderSize || bytes.size() < s_metaDataHeaderSize)
        return;
    header_ = numberAt<MetaDataHeader>(bytes, 0);
    entrySize_ = header_->fixedEntrySize;
    position_ = s_metaDataHeaderSize;
}

std::optional<StreamEntry> StreamEntries::next() {
    end_ = StreamExtent::AtEntry;
    if (!header_ || position_ == length_)
        return std::nullopt;
    const std::optional<std::uint64_t> size = sizeOfNext();
    if (!size)
        return std::nullopt;
    const StreamEntry entry{position_, *size};
    position_ = entry.end();
    return entry;
}

std::optional<std::uint64_t> StreamEntries::sizeOfNext() {
    std::uint64_t size = entrySize_;
    if (entrySize_ == 0) {
        const std::string_view bytes = bytesAt(position_, sizeof(Size));
        const Size behind = bytes.size() == sizeof(Size) ? numberAt<Size>(bytes, 0) : 0;
        size = sizeof(Size) + std::uint64_t{behind};
        if (bytes.size() == sizeof(Size) && behind == 0) {
            end_ = StreamExtent::EmptyEntry;
            return std::nullopt;
        }
        if (bytes.size() < sizeof(Size))
            size = length_; // more than is left
    }
    if (size <= length_ - position_)
        return size;
    end_ = StreamExtent::InsideEntry;
    return std::nullopt;
}

std::string_view StreamEntries::bytesOf(const StreamEntry& entry) {
    return bytesAt(entry.offset, entry.size);
}

std::string_view StreamEntries::bytesAt(std::uint64_t position, std::uint64_t size) {
    const auto wanted = static_cast<std::size_t>(position < length_ ? std::min(size, length_ - position) : 0);
    if (position < windowStart_ || position + wanted > windowStart_ + windowSize_) {
        const std::uint64_t most = std::min<std::uint64_t>(std::max(wanted, s_windowSize), length_ - position);
        window_.resize(std::max(static_cast<std::size_t>(most), std::min(window_.size(), s_windowSize)));
        windowStart_ = position;
        windowSize_ = read_(position, {window_.data(), static_cast<std::size_t>(most)});
    }
    const auto start = static_cast<std::size_t>(position - windowStart_);
    return {window_.data() + start, std::min(wanted, windowSize_ - start)};
}

namespace detail {

bool readEntryBytes(std::string_view bytes, double& time, std::string& text) {
    if (!isText(bytes))
        return false;
    BytesInput input(bytes);
    readStringEntry(input, time, text);
    return true;
}

bool readEntryBytes(std::string_view bytes, double& time, std::list<std::string>& texts) {
    constexpr std::size_t start = 2 * sizeof(Size);
    if (bytes.size() < start || numberAt<Size>(bytes, 0) != bytes.size() - sizeof(Size))
        return false;
    std::string_view rest = bytes.substr(start);
    for (auto count = numberAt<Size>(bytes, sizeof(Size)); count > 0; --count) {
        const std::uint64_t size =
            rest.size() < sizeof(Size) ? 0 : sizeof(Size) + std::uint64_t{numberAt<Size>(rest, 0)};
        if (!isText(rest.substr(0, static_cast<std::size_t>(size))))
            return false;
        rest.remove_prefix(static_cast<std::size_t>(size));
    }
    if (!rest.empty())
        return false;
    BytesInput input(bytes);
    readStringListEntry(input, texts);
    time = texts.empty() ? 0 : numberAt<double>(bytes, start + sizeof(Size));
    return true;
}

bool readEntryBytes(std::string_view bytes, double& time, CursorImage& image, int version) {
    const CursorImageSchema schema(version);
    Record record{image, time};
    const std::uint64_t baseSize = schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record);
    if (baseSize == 0 || bytes.size() < baseSize)
        return false;
    BytesInput input(bytes);
    CursorImageReader reader(version);
    reader.ReadBaseInfo(input, schema, record);
    if (record.entrySize != bytes.size() - sizeof record.entrySize ||
        record.justMetadataSize != bytes.size() - baseSize)
        return false;
    reader.ReadMetaDataFields(input, schema, record);
    if (reader.hasRunOutOfMemory())
        throw std::bad_alloc();
    return true;
}

} // namespace detail

} // namespace ZULMetaData
