#include "ZULMetaDataBridge/Source/StreamSource.h"

#include "ZULMetaData/ZULMMetaDataParser.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <limits>
#include <memory>
#include <system_error>
#include <utility>

namespace ZULMetaData {

namespace {

StreamSource::Bytes openPart(const FileLocation& location, std::uint64_t offset, std::uint64_t length) {
    auto file = std::make_shared<std::ifstream>();
    errno = 0;
    fileOpen(*file, utf8Path(location).c_str(), std::ios_base::binary);
    std::error_code reason(errno, std::generic_category());
    std::error_code looking;
    const bool isFile = std::filesystem::is_regular_file(location, looking);
    if (!isFile || !file->is_open()) {
        if (!reason)
            reason = looking ? looking : std::make_error_code(std::errc::invalid_argument);
        throw std::system_error(reason, "cannot be opened");
    }
    const std::uint64_t total = sizeOfInput(*file);
    const std::uint64_t begin = std::min(offset, total);
    return {std::min(length, total - begin), [file, begin](std::uint64_t position, std::span<char> bytes) {
                return readingFrom(*file)(begin + position, bytes);
            }};
}

std::size_t copyFrom(std::string_view from, std::uint64_t position, std::span<char> to) {
    if (position >= from.size())
        return 0;
    return from.copy(to.data(), to.size(), static_cast<std::size_t>(position));
}

} // namespace

StreamSource StreamSource::file(const FileLocation& file) {
    return part(file, 0, std::numeric_limits<std::uint64_t>::max());
}

StreamSource StreamSource::part(const FileLocation& file, std::uint64_t offset, std::uint64_t length) {
    return {utf8Path(file), [=] { return openPart(file, offset, length); }};
}

StreamSource StreamSource::memory(std::string_view bytes, std::string name) {
    return {std::move(name), [bytes] {
                return Bytes{bytes.size(), [bytes](std::uint64_t position, std::span<char> to) {
                                 return copyFrom(bytes, position, to);
                             }};
            }};
}

} // namespace ZULMetaData
