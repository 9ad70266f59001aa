#include "ZULMetaData/StreamEntries.h"

#include <cstring>
#include <new>
#include <streambuf>
#include <utility>

namespace ZULMetaData {

namespace {

using Size = std::uint32_t;

/// A text as it is stored: size, time, characters.
bool isText(std::string_view bytes) {
    constexpr std::size_t leastSize = sizeof(Size) + sizeof(double);
    return bytes.size() >= leastSize && detail::numberIn<Size>(bytes, 0) == bytes.size() - sizeof(Size);
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

StreamEntries::StreamEntries(ByteSource stream)
    : reader_(std::move(stream)), header_(reader_.numberAt<MetaDataHeader>(0)) {
    if (header_)
        position_ = s_metaDataHeaderSize;
}

std::optional<StreamEntry> StreamEntries::next() {
    end_ = StreamExtent::AtEntry;
    if (!header_ || position_ == reader_.size())
        return std::nullopt;
    std::optional<std::uint64_t> size = header_->fixedEntrySize;
    if (*size == 0) {
        const auto following = reader_.numberAt<Size>(position_);
        size = following ? std::optional(sizeof(Size) + std::uint64_t{*following}) : std::nullopt;
        end_ = following == Size{0} ? StreamExtent::EmptyEntry : StreamExtent::AtEntry;
    }
    if (!size || *size > reader_.size() - position_)
        end_ = StreamExtent::InsideEntry;
    if (end_ != StreamExtent::AtEntry)
        return std::nullopt;
    return StreamEntry{std::exchange(position_, position_ + *size), *size};
}

std::optional<StreamExtent> measureStream(const ByteSource& stream) {
    StreamEntries entries(stream);
    if (!entries.header())
        return std::nullopt;
    StreamExtent extent;
    extent.header = *entries.header();
    if (const std::uint32_t size = extent.header.fixedEntrySize; size != 0) {
        extent.entries = (stream.size() - s_metaDataHeaderSize) / size;
        extent.wholeBytes = s_metaDataHeaderSize + extent.entries * size;
        extent.end = extent.wholeBytes == stream.size() ? StreamExtent::AtEntry : StreamExtent::InsideEntry;
        return extent;
    }
    while (entries.next())
        ++extent.entries;
    extent.wholeBytes = entries.wholeBytes();
    extent.end = entries.end();
    return extent;
}

bool hasRoomForCursorFields(std::string_view bytes, int version) {
    const CursorImageSchema schema(version);
    CursorImage image;
    double time = 0;
    Record record{image, time};
    const auto take = [&bytes](const FieldInfo& field) {
        if (field.data)
            bytes.copy(reinterpret_cast<char*>(field.data), field.size);
        const bool fits = field.size <= bytes.size();
        bytes.remove_prefix(fits ? field.size : bytes.size());
        return fits;
    };
    bool fits = true;
    for (const SchemaFieldStep& step : schema.GetBaseInfoSteps())
        fits = fits && (!step.existsIn(version) || take(step.fieldGetter(record)));
    for (const SchemaFieldStep& step : schema.GetDataSteps()) {
        if (!step.existsIn(version) || !step.condition(record))
            continue;
        const bool isImage = step.fieldGetter == schema.GetImageFieldInfoFn(); // which would allocate the image
        fits = fits && take(isImage ? FieldInfo{nullptr, schema.GetImageSize(record)} : step.fieldGetter(record));
    }
    return fits;
}

namespace detail {

bool readEntryBytes(std::string_view bytes, double& time, std::string& text, int) {
    if (!isText(bytes))
        return false;
    time = detail::numberIn<double>(bytes, sizeof(Size));
    text = bytes.substr(sizeof(Size) + sizeof(double));
    return true;
}

bool readEntryBytes(std::string_view bytes, double& time, std::list<std::string>& texts, int) {
    constexpr std::size_t start = 2 * sizeof(Size);
    if (bytes.size() < start || detail::numberIn<Size>(bytes, 0) != bytes.size() - sizeof(Size))
        return false;
    std::string_view rest = bytes.substr(start);
    for (auto count = detail::numberIn<Size>(bytes, sizeof(Size)); count > 0; --count) {
        const std::uint64_t size =
            rest.size() < sizeof(Size) ? 0 : sizeof(Size) + std::uint64_t{detail::numberIn<Size>(rest, 0)};
        if (!isText(rest.substr(0, static_cast<std::size_t>(size))))
            return false;
        rest.remove_prefix(static_cast<std::size_t>(size));
    }
    if (!rest.empty())
        return false;
    BytesInput input(bytes);
    readStringListEntry(input, texts);
    time = texts.empty() ? 0 : detail::numberIn<double>(bytes, start + sizeof(Size));
    return true;
}

bool readEntryBytes(std::string_view bytes, double& time, CursorImage& image, int version) {
    const CursorImageSchema schema(version);
    Record record{image, time};
    const std::uint64_t baseSize = schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record);
    if (baseSize == 0 || bytes.size() < baseSize)
        return false;
    const auto take = [&bytes](const FieldInfo& field) {
        if (!field.data && field.size != 0)
            throw std::bad_alloc();
        if (field.size != 0)
            std::memcpy(field.data, bytes.data(), field.size);
        bytes.remove_prefix(field.size);
    };
    const std::size_t size = bytes.size();
    for (const SchemaFieldStep& step : schema.GetBaseInfoSteps())
        if (step.existsIn(version))
            take(step.fieldGetter(record));
    if (record.entrySize != size - sizeof record.entrySize || record.justMetadataSize != bytes.size())
        return false;
    image.freeImageData(true);
    for (const SchemaFieldStep& step : schema.GetDataSteps()) {
        if (bytes.empty() || !step.existsIn(version) || !step.condition(record))
            continue;
        const bool isImage = step.fieldGetter == schema.GetImageFieldInfoFn(); // which allocates the image
        if ((isImage ? schema.GetImageSize(record) : step.fieldGetter(record).size) > bytes.size()) {
            if (isImage)
                image.freeImageData(true);
            break;
        }
        take(step.fieldGetter(record));
    }
    return true;
}

} // namespace detail

} // namespace ZULMetaData
