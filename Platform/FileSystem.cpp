#include "Platform/FileSystem.h"

#include "Platform/Descriptor.h"

#include <algorithm>
#include <cstdio>
#include <fcntl.h>
#include <filesystem>
#include <span>
#include <sys/stat.h>
#include <system_error>
#include <vector>

namespace ZULMetaData {

namespace {

using Side = CopyError::Side;

constexpr const char* s_cannotRename = "cannot be put in place";
constexpr std::uint64_t s_bufferSize = 1 << 20; // in bytes

/// What the system copies between two reports of progress, in bytes.
[[maybe_unused]] constexpr std::uint64_t s_systemCopy = 64 << 20;

/// Says which file failed if `call` fails.
template <class Call>
auto on(Side side, Call call) {
    try {
        return call();
    } catch (const std::system_error& error) {
        throw CopyError(side, error.what());
    }
}

/// Throws if there is no such file.
int descriptorOf(const FileLocation& file, int flags) {
    const int descriptor = uninterrupted([&] { return open(file.c_str(), flags | O_CLOEXEC); });
    if (descriptor < 0)
        throwSystemError(errno, "cannot be opened");
    return descriptor;
}

/// One copy of a range. The target begins where the range does.
class RangeCopy {
public:
    RangeCopy(const FileLocation& source, std::uint64_t offset, std::uint64_t size, const FileLocation& target,
              const CopyProgress& progress)
        : source_(on(Side::Source, [&] { return descriptorOf(source, O_RDONLY); })),
          target_(on(Side::Target, [&] { return descriptorOf(target, O_WRONLY); })), offset_(offset),
          end_(offset + size), progress_(progress) {}

    void run() {
        setTargetSize(0);
        for (std::uint64_t position = offset_; position < end_;) {
            const std::uint64_t begin = nextData(position);
            const std::uint64_t end = nextHole(begin);
            copyData(begin, end);
            position = end;
        }
        setTargetSize(end_ - offset_);
        report(end_);
    }

private:
#if defined(SEEK_DATA) && defined(SEEK_HOLE)
    /// Returns the first position of stored bytes, at `position` or after it.
    std::uint64_t nextData(std::uint64_t position) const {
        const off_t data = lseek(source_.number(), static_cast<off_t>(position), SEEK_DATA);
        if (data >= 0)
            return std::min(static_cast<std::uint64_t>(data), end_);
        return errno == ENXIO && sourceSize() >= end_ ? end_ : position; // else the read reports what is wrong
    }

    /// Returns their end. A file system that knows no holes has one at the end of the file.
    std::uint64_t nextHole(std::uint64_t position) const {
        const off_t hole = lseek(source_.number(), static_cast<off_t>(position), SEEK_HOLE);
        const bool isFound = hole >= 0 && static_cast<std::uint64_t>(hole) > position;
        return isFound ? std::min(static_cast<std::uint64_t>(hole), end_) : end_;
    }
#else
    std::uint64_t nextData(std::uint64_t position) const {
        return position;
    }
    std::uint64_t nextHole(std::uint64_t) const {
        return end_;
    }
#endif

    std::uint64_t sourceSize() const {
        const off_t size = lseek(source_.number(), 0, SEEK_END);
        return size < 0 ? 0 : static_cast<std::uint64_t>(size);
    }

    void copyData(std::uint64_t begin, std::uint64_t end) {
        for (std::uint64_t position = begin; position < end; report(position)) {
            const std::uint64_t copied = copyBySystem(position, end - position);
            position += copied > 0 ? copied : copyByHand(position, end - position);
        }
    }

    /// Returns 0 if the system cannot copy between these files, or failed: reading and writing by hand tells which
    /// side failed.
    std::uint64_t copyBySystem([[maybe_unused]] std::uint64_t position, [[maybe_unused]] std::uint64_t size) {
#ifdef __linux__
        if (systemCopies_) {
            auto from = static_cast<off_t>(position);
            auto to = static_cast<off_t>(position - offset_);
            const std::size_t wanted = std::min(size, s_systemCopy);
            const ssize_t copied = uninterrupted(
                [&] { return copy_file_range(source_.number(), &from, target_.number(), &to, wanted, 0); });
            if (copied > 0)
                return static_cast<std::uint64_t>(copied);
            systemCopies_ = false;
        }
#endif
        return 0;
    }

    std::uint64_t copyByHand(std::uint64_t position, std::uint64_t size) {
        buffer_.resize(s_bufferSize);
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(size, buffer_.size()));
        const std::span<char> bytes(buffer_.data(), wanted);
        const std::size_t got = on(Side::Source, [&] { return source_.readAt(position, bytes); });
        if (got == 0)
            throw CopyError(Side::Source, "ends" + atOffset(position));
        on(Side::Target, [&] { target_.writeAt(position - offset_, bytes.first(got)); });
        return got;
    }

    void setTargetSize(std::uint64_t size) {
        on(Side::Target, [&] { target_.truncate(size); });
    }

    void report(std::uint64_t position) const {
        if (progress_)
            progress_(position - offset_);
    }

    Descriptor source_;
    Descriptor target_;
    std::uint64_t offset_;
    std::uint64_t end_;
    const CopyProgress& progress_;
    [[maybe_unused]] bool systemCopies_ = true;
    std::vector<char> buffer_;
};

/// One step that takes the name and fails if it is taken; -1 with `errno` otherwise, as a system call.
int renameIntoFreeName([[maybe_unused]] const FileLocation& from, [[maybe_unused]] const FileLocation& to) {
#if defined(__linux__)
    return renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE);
#elif defined(__APPLE__)
    return renamex_np(from.c_str(), to.c_str(), RENAME_EXCL);
#else
    errno = ENOSYS;
    return -1;
#endif
}

} // namespace

void copyFileRange(const FileLocation& source, std::uint64_t offset, std::uint64_t size, const FileLocation& target,
                   const CopyProgress& progress) {
    RangeCopy(source, offset, size, target, progress).run();
}

void renameWithoutReplacing(const FileLocation& from, const FileLocation& to) {
    if (renameIntoFreeName(from, to) == 0)
        return;
    if (errno != EINVAL && errno != ENOSYS && errno != ENOTSUP)
        throwSystemError(errno, s_cannotRename);
    renameOverPlaceholder(from, to);
}

void renameOverPlaceholder(const FileLocation& from, const FileLocation& to) {
    const Descriptor placeholder(
        uninterrupted([&] { return open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600); }));
    if (!placeholder.isOpen())
        throwSystemError(errno, s_cannotRename);
    if (std::rename(from.c_str(), to.c_str()) == 0)
        return;
    const int reason = errno;
    unlink(to.c_str());
    throwSystemError(reason, s_cannotRename);
}

bool createPrivateFolder(const FileLocation& folder) {
    if (mkdir(folder.c_str(), S_IRWXU) == 0)
        return true;
    const int reason = errno;
    std::error_code unknown;
    if (reason != EEXIST || !std::filesystem::is_directory(folder, unknown))
        throwSystemError(reason, "cannot be created");
    return false;
}

} // namespace ZULMetaData
