#include "ZULMetaDataBridge/Source/StreamSource.h"

#include <limits>
#include <utility>

namespace ZULMetaData {

StreamSource::StreamSource(std::string name, Callback<ByteSource()> open)
    : name_(std::move(name)), open_(std::move(open)) {}

StreamSource StreamSource::file(const FileLocation& file) {
    return part(file, 0, std::numeric_limits<std::uint64_t>::max());
}

StreamSource StreamSource::part(const FileLocation& file, std::uint64_t offset, std::uint64_t length) {
    return {utf8Path(file), [=] { return ByteSource::file(utf8Path(file)).part(offset, length); }};
}

StreamSource StreamSource::bytes(ByteSource bytes, std::string name) {
    return {std::move(name), [bytes = std::move(bytes)] { return bytes; }};
}

StreamSource StreamSource::memory(std::string_view bytes, std::string name) {
    return StreamSource::bytes(ByteSource::memory(bytes), std::move(name));
}

StreamSource StreamSource::unchecked() const {
    StreamSource source = *this;
    source.isChecked_ = false;
    return source;
}

StreamSource StreamSource::asStored() const {
    StreamSource source = unchecked();
    source.isAsStored_ = true;
    return source;
}

} // namespace ZULMetaData
