#include "ZULMetaDataBridge/Source/StreamSource.h"

#include <limits>
#include <utility>

namespace ZULMetaData {

StreamSource StreamSource::file(const FileLocation& file) {
    return part(file, 0, std::numeric_limits<std::uint64_t>::max());
}

StreamSource StreamSource::part(const FileLocation& file, std::uint64_t offset, std::uint64_t length) {
    return {utf8Path(file), [=] { return ByteSource::file(utf8Path(file)).part(offset, length); }};
}

StreamSource StreamSource::memory(std::string_view bytes, std::string name) {
    return {std::move(name), [bytes] { return ByteSource::memory(bytes); }};
}

} // namespace ZULMetaData
