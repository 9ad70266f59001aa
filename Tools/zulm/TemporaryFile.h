#pragma once

// A file that is gone when its scope ends, and when a signal ends the program.

#include <string>

namespace Zulm {

class TemporaryFile {
public:
    /// An empty file `.NAME.xxxxxx.EXTENSION` in `folder`, readable as any new file would be; `extension` begins with
    /// its dot. Throws `std::system_error`.
    TemporaryFile(const std::string& folder, const std::string& name, const std::string& extension);
    ~TemporaryFile();
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    const std::string& path() const { return path_; }

    /// It has been renamed: there is nothing to remove any more.
    void release();

private:
    std::string path_;
    bool isReleased_ = false;
};

/// All that there are, for when the program ends in the middle of something. Asks for no memory.
void removeTemporaryFiles() noexcept;

} // namespace Zulm
