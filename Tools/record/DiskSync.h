#pragma once

// Sees to it that what was recorded survives a loss of power.

#include <condition_variable>
#include <filesystem>
#include <mutex>
#include <thread>

namespace Recorder {

/// Has the files of a folder written to the disk once a second, on a thread of its own: a disk may take its time, and
/// whoever writes does not wait for it.
class DiskSync {
public:
    explicit DiskSync(const std::filesystem::path& folder);
    ~DiskSync();
    DiskSync(const DiskSync&) = delete;
    DiskSync& operator=(const DiskSync&) = delete;

private:
    void run();
    void syncFiles() const;

    std::filesystem::path folder_;
    std::mutex mutex_;
    std::condition_variable over_;
    bool isOver_ = false;
    std::thread thread_;
};

} // namespace Recorder
