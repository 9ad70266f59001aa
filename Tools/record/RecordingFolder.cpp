#include "Tools/record/RecordingFolder.h"

#include "Tools/record/Failure.h"
#include "ZULMetaDataBridge/Source/MetaDataKinds.h"

#include <fmt/core.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <system_error>
#include <utility>

namespace Recorder {

namespace fs = std::filesystem;

namespace {

constexpr std::uint64_t s_firstReserve = std::uint64_t{2} << 20;
constexpr std::uint64_t s_leastFree = std::uint64_t{2} << 20; ///< beside the reserve, to begin at all

void requireAbsent(const fs::path& path, const char* advice) {
    std::error_code error;
    if (fs::symlink_status(path, error).type() != fs::file_type::not_found)
        throw Refusal(fmt::format("{}: exists already; {}", path.string(), advice));
}

/// A second name never replaces a file.
bool renameByLink(const fs::path& from, const fs::path& to) {
    return link(from.c_str(), to.c_str()) == 0 && unlink(from.c_str()) == 0;
}

/// Replaces a file that nobody else can have made. File systems without links need it.
bool renameOverOwnFile(const fs::path& from, const fs::path& to) {
    const FileHandle own(open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (!own || rename(from.c_str(), to.c_str()) == 0)
        return static_cast<bool>(own);
    const int error = errno;
    unlink(to.c_str());
    errno = error;
    return false;
}

bool isFull(int error) {
    return error == ENOSPC || error == EDQUOT;
}

} // namespace

fs::path RecordingFolder::folderOf(const fs::path& output) {
    fs::path folder = output;
    folder += ".recording";
    return folder;
}

RecordingFolder::RecordingFolder(const fs::path& output) : output_(output), folder_(folderOf(output)) {
    requireAbsent(output_, "choose another name, since nothing is ever replaced");
    requireAbsent(folder_, "it may hold a recording that was cut short: 'zulm record --recover' saves that one");
    if (mkdir(folder_.c_str(), 0700) != 0) {
        const int error = errno;
        const std::string sentence = fmt::format("{}: cannot be created: {}", folder_.string(), std::strerror(error));
        if (isFull(error))
            throw Failure(sentence + "; free some space first");
        throw Refusal(sentence);
    }
    reserve_ = FileHandle(open((folder_ / "reserve").c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (!reserve_ || !reserve(s_firstReserve) || freeBytes() < s_leastFree) {
        remove();
        throw Failure(fmt::format("{}: the file system has too little space left to record; free some space first",
                                  output_.string()));
    }
}

bool RecordingFolder::reserve(std::uint64_t bytes) {
    const std::lock_guard lock(mutex_);
    if (!reserve_)
        return false;
    if (bytes <= reserved_)
        return true;
    if (posix_fallocate(reserve_.get(), 0, static_cast<off_t>(bytes)) != 0)
        return false;
    reserved_ = bytes;
    return true;
}

bool RecordingFolder::releaseReserve() {
    const std::lock_guard lock(mutex_);
    if (!reserve_)
        return false;
    unlink((folder_ / "reserve").c_str());
    reserve_.close();
    return true;
}

std::uint64_t RecordingFolder::freeBytes() const {
    struct statvfs status {};
    if (statvfs(folder_.c_str(), &status) != 0)
        return 0;
    return std::uint64_t{status.f_bavail} * status.f_frsize;
}

void RecordingFolder::publish() {
    renameWithoutReplacing(movie(), output_, fmt::format("the movie is whole in {}", movie().string()));
    syncFolder(output_.parent_path());
}

void RecordingFolder::remove() {
    releaseReserve();
    removeRecording(folder_); // what is left says so by being there
}

std::vector<fs::path> streamFilesIn(const fs::path& folder) {
    std::vector<fs::path> files;
    ZULMetaData::RecordedKinds::forEach([&]<class Kind>() {
        fs::path file = folder / (ZULMetaData::metaDataKindName(Kind::type) + ".dat");
        std::error_code error;
        if (fs::is_regular_file(fs::symlink_status(file, error)))
            files.push_back(std::move(file));
    });
    return files;
}

bool removeRecording(const fs::path& folder) {
    for (const char* name : {"reserve", "movie.mp4", "session.lock"})
        unlink((folder / name).c_str());
    for (const fs::path& file : streamFilesIn(folder)) // last, since they show whose folder it is
        unlink(file.c_str());
    return rmdir(folder.c_str()) == 0;
}

void renameWithoutReplacing(const fs::path& from, const fs::path& to, const std::string& advice) {
    if (renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE) == 0)
        return;
    const bool isUnable = errno == EINVAL || errno == ENOSYS; // the file system
    if (isUnable && (renameByLink(from, to) || renameOverOwnFile(from, to)))
        return;
    throw Failure(fmt::format("{}: cannot be made: {}; {}", to.string(), std::strerror(errno), advice), ExitLoss);
}

void syncFolder(const fs::path& folder) {
    const FileHandle handle(open(folder.empty() ? "." : folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (handle)
        fsync(handle.get());
}

} // namespace Recorder
