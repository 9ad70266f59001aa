#include "Platform/DurableFile.h"

#include "Platform/Descriptor.h"

#include <cerrno>
#include <fcntl.h>
#include <string>
#include <sys/file.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace ZULMetaData {

namespace {

[[noreturn]] void fail(int error, const std::string& what) {
    throw std::system_error(error, std::generic_category(), what);
}

struct stat statusOf(int descriptor) {
    struct stat status {};
    if (fstat(descriptor, &status) != 0)
        fail(errno, "cannot be examined");
    return status;
}

void requireRegularFile(int descriptor) {
    if (!S_ISREG(statusOf(descriptor).st_mode))
        fail(EINVAL, "is not a regular file");
}

/// File systems that know no locks are taken as they are.
void lock(int descriptor) {
    if (uninterrupted([=] { return flock(descriptor, LOCK_EX | LOCK_NB); }) != 0 && errno == EWOULDBLOCK)
        fail(EBUSY, "is being changed by another program");
}

int syncOnce(int descriptor) {
#ifdef __APPLE__
    // fsync leaves the bytes in the drive's cache. Not every file system knows better.
    if (fcntl(descriptor, F_FULLFSYNC) == 0)
        return 0;
    if (errno == EINTR)
        return -1;
#endif
    return fsync(descriptor);
}

} // namespace

/// Without O_NONBLOCK, opening a pipe would wait for its other end.
DurableFile::DurableFile(const FileLocation& file)
    : descriptor_(uninterrupted([&] { return open(file.c_str(), O_RDWR | O_CLOEXEC | O_NONBLOCK | O_NOCTTY); })) {
    if (descriptor_ < 0)
        fail(errno, "cannot be opened for changing");
    try {
        requireRegularFile(descriptor_);
        lock(descriptor_);
    } catch (...) {
        close(descriptor_);
        throw;
    }
}

DurableFile::~DurableFile() {
    close(descriptor_);
}

std::uint64_t DurableFile::size() const {
    return static_cast<std::uint64_t>(statusOf(descriptor_).st_size);
}

bool DurableFile::isNamed(const FileLocation& file) const {
    struct stat named {};
    const struct stat own = statusOf(descriptor_);
    return stat(file.c_str(), &named) == 0 && named.st_dev == own.st_dev && named.st_ino == own.st_ino;
}

std::size_t DurableFile::readAt(std::uint64_t position, std::span<char> bytes) const {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const auto offset = static_cast<off_t>(position + done);
        const ssize_t got =
            uninterrupted([&] { return pread(descriptor_, bytes.data() + done, bytes.size() - done, offset); });
        if (got < 0)
            fail(errno, "cannot be read" + atOffset(position + done));
        if (got == 0)
            break;
        done += static_cast<std::size_t>(got);
    }
    return done;
}

void DurableFile::writeAt(std::uint64_t position, std::span<const char> bytes) {
    std::size_t done = 0;
    while (done < bytes.size()) {
        const auto offset = static_cast<off_t>(position + done);
        const ssize_t written =
            uninterrupted([&] { return pwrite(descriptor_, bytes.data() + done, bytes.size() - done, offset); });
        if (written <= 0)
            fail(written < 0 ? errno : EIO, "cannot be written" + atOffset(position + done));
        done += static_cast<std::size_t>(written);
    }
}

void DurableFile::truncate(std::uint64_t size) {
    if (uninterrupted([&] { return ftruncate(descriptor_, static_cast<off_t>(size)); }) != 0)
        fail(errno, "cannot be given a length of " + std::to_string(size) + " bytes");
}

void DurableFile::sync() {
    if (uninterrupted([this] { return syncOnce(descriptor_); }) != 0)
        fail(errno, "cannot be synced");
}

} // namespace ZULMetaData
