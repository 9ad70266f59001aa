#pragma once

// Where everything of a recording lies while it runs, and the space that is kept free to end it well.

#include "Tools/record/FileHandle.h"

#include <cstdint>
#include <filesystem>
#include <mutex>
#include <vector>

namespace Recorder {

/// The folder OUT.recording beside OUT. It is kept unless `remove` is called.
class RecordingFolder {
public:
    /// Creates the folder and the reserve in it. Throws `Refusal` if OUT or the folder exists or cannot be made, and
    /// `Failure` if the file system is full; nothing is created then.
    explicit RecordingFolder(const std::filesystem::path& output);

    const std::filesystem::path& output() const { return output_; }
    const std::filesystem::path& folder() const { return folder_; }
    std::filesystem::path movie() const { return folder_ / "movie.mp4"; }

    /// Returns the folder in which a recording of `output` lies.
    static std::filesystem::path folderOf(const std::filesystem::path& output);

    /// Makes the reserve at least this large. Returns false if the file system has no room for it.
    bool reserve(std::uint64_t bytes);

    /// Returns the reserve to the file system. Returns false if that has happened before.
    bool releaseReserve();

    /// Returns how many bytes the file system has left, beside the reserve.
    std::uint64_t freeBytes() const;

    /// Makes the movie OUT. Never replaces a file: throws `Failure` if OUT has appeared meanwhile.
    void publish();

    /// Does what `removeRecording` does.
    void remove();

private:
    std::filesystem::path output_;
    std::filesystem::path folder_;
    std::mutex mutex_;
    FileHandle reserve_;
    std::uint64_t reserved_ = 0;
};

/// Returns the files of a recording's folder that hold streams.
std::vector<std::filesystem::path> streamFilesIn(const std::filesystem::path& folder);

/// Removes the files that a recorder makes in its folder, and the folder if it holds nothing else. Returns whether the
/// folder is removed.
bool removeRecording(const std::filesystem::path& folder);

/// Renames a file unless there is one of the new name. Throws `Failure` with `advice` as the end of its sentence.
void renameWithoutReplacing(const std::filesystem::path& from, const std::filesystem::path& to,
                            const std::string& advice);

/// Returns when the names in a folder are on the disk.
void syncFolder(const std::filesystem::path& folder);

} // namespace Recorder
