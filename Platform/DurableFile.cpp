#include "Platform/DurableFile.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace ZULMetaData {

namespace {

struct stat statusOf(int descriptor) {
    struct stat status {};
    if (fstat(descriptor, &status) != 0)
        throwSystemError(errno, "cannot be examined");
    return status;
}

/// File systems that know no locks are taken as they are.
void lock(int descriptor) {
    if (uninterrupted([=] { return flock(descriptor, LOCK_EX | LOCK_NB); }) != 0 && errno == EWOULDBLOCK)
        throwSystemError(EBUSY, "is being changed by another program");
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
    : Descriptor(uninterrupted([&] { return open(file.c_str(), O_RDWR | O_CLOEXEC | O_NONBLOCK | O_NOCTTY); })) {
    if (!isOpen())
        throwSystemError(errno, "cannot be opened for changing");
    if (!S_ISREG(statusOf(number()).st_mode))
        throwSystemError(EINVAL, "is not a regular file");
    lock(number());
}

std::uint64_t DurableFile::size() const {
    return static_cast<std::uint64_t>(statusOf(number()).st_size);
}

bool DurableFile::isNamed(const FileLocation& file) const {
    struct stat named {};
    const struct stat own = statusOf(number());
    if (stat(file.c_str(), &named) == 0)
        return named.st_dev == own.st_dev && named.st_ino == own.st_ino;
    if (errno != ENOENT && errno != ENOTDIR)
        throwSystemError(errno, "cannot be examined");
    return false;
}

void DurableFile::sync() {
    if (uninterrupted([this] { return syncOnce(number()); }) != 0)
        throwSystemError(errno, "cannot be synced");
}

} // namespace ZULMetaData
