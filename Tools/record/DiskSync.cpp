#include "Tools/record/DiskSync.h"

#include "Tools/record/FileHandle.h"
#include "Tools/record/RecordingFolder.h"

#include <fcntl.h>
#include <unistd.h>

#include <chrono>
#include <system_error>

namespace Recorder {

namespace fs = std::filesystem;

namespace {

constexpr std::chrono::seconds s_interval(1);

} // namespace

DiskSync::DiskSync(const fs::path& folder) : folder_(folder), thread_([this] { run(); }) {}

DiskSync::~DiskSync() {
    {
        const std::lock_guard lock(mutex_);
        isOver_ = true;
    }
    over_.notify_all();
    thread_.join();
}

void DiskSync::run() {
    std::unique_lock lock(mutex_);
    while (!over_.wait_for(lock, s_interval, [this] { return isOver_; })) {
        lock.unlock();
        syncFiles();
        lock.lock();
    }
}

/// Files to which nothing was added since cost next to nothing.
void DiskSync::syncFiles() const {
    std::error_code error;
    for (fs::directory_iterator entry(folder_, error), end; !error && entry != end; entry.increment(error)) {
        const fs::path extension = entry->path().extension();
        if (extension != ".mp4" && extension != ".dat")
            continue;
        const FileHandle file(open(entry->path().c_str(), O_RDONLY | O_CLOEXEC));
        if (file)
            fdatasync(file.get());
    }
    syncFolder(folder_);
    syncFolder(folder_.parent_path());
}

} // namespace Recorder
