#pragma once

// A file that is gone when its scope ends, and when a signal ends the program.

#include <string>

namespace Zulm {

class TemporaryFile {
public:
    /// Creates an empty file `.NAME.xxxxxx.EXTENSION` in `folder` that only its owner may read. `extension` begins with
    /// its dot. Throws `std::system_error`.
    TemporaryFile(const std::string& folder, const std::string& name, const std::string& extension);
    ~TemporaryFile();
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    const std::string& path() const { return path_; }

    /// Call this after the file was renamed: nothing is left to remove.
    void release();

private:
    std::string path_;
    bool isReleased_ = false;
};

/// From here on, signals that end the program remove all of them first.
void removeTemporaryFilesOnSignals();

/// All that there are, for when the program ends in the middle of something. Asks for no memory.
void removeTemporaryFiles() noexcept;

} // namespace Zulm
