#include "Platform/Descriptor.h"

#include <system_error>
#include <utility>

namespace ZULMetaData {

void throwSystemError(int error, const std::string& what) {
    throw std::system_error(error, std::generic_category(), what);
}

void Descriptor::close() {
    const int number = std::exchange(number_, -1); // it is closed even if closing fails
    if (number >= 0 && ::close(number) != 0 && errno != EINTR)
        throwSystemError(errno, "cannot be closed");
}

std::size_t Descriptor::readAt(std::uint64_t position, std::span<char> bytes) const {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const auto offset = static_cast<off_t>(position + done);
        const ssize_t got =
            uninterrupted([&] { return pread(number_, bytes.data() + done, bytes.size() - done, offset); });
        if (got < 0)
            throwSystemError(errno, "cannot be read" + atOffset(position + done));
        if (got == 0)
            break;
        done += static_cast<std::size_t>(got);
    }
    return done;
}

void Descriptor::writeAt(std::uint64_t position, std::span<const char> bytes) {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const auto offset = static_cast<off_t>(position + done);
        const ssize_t written =
            uninterrupted([&] { return pwrite(number_, bytes.data() + done, bytes.size() - done, offset); });
        if (written <= 0)
            throwSystemError(written < 0 ? errno : EIO, "cannot be written" + atOffset(position + done));
        done += static_cast<std::size_t>(written);
    }
}

void Descriptor::truncate(std::uint64_t size) {
    if (uninterrupted([&] { return ftruncate(number_, static_cast<off_t>(size)); }) != 0)
        throwSystemError(errno, "cannot be given a length of " + std::to_string(size) + " bytes");
}

} // namespace ZULMetaData
