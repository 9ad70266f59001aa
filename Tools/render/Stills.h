#pragma once

#include "Tools/render/YuvPicture.h"

#include <string>
#include <vector>

namespace Render {

/// Writes a picture as a PNG file that appears whole or not at all. Throws `Zulm::Failure`.
void writePng(const YuvPicture& picture, const std::string& path, const std::string& recording, bool force);

/// The files that a command writes one after the other. They are removed again if it ends before all are there.
class WrittenFiles {
public:
    /// Creates the folder if it does not exist. Throws `Zulm::Failure`.
    explicit WrittenFiles(const std::string& folder);
    ~WrittenFiles();
    WrittenFiles(const WrittenFiles&) = delete;
    WrittenFiles& operator=(const WrittenFiles&) = delete;

    void add(const std::string& path) { paths_.push_back(path); } ///< was written
    void keep() { isKept_ = true; }                               ///< all are there

private:
    std::string folder_;
    bool isNewFolder_;
    bool isKept_ = false;
    std::vector<std::string> paths_;
};

} // namespace Render
