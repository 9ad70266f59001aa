#pragma once

#include "Tools/render/YuvPicture.h"

#include <cstdint>
#include <string>
#include <vector>

namespace Render {

/// Writes a file that does not exist, into a folder that nobody else can look into. It gets the permissions of a file
/// made of the inputs. Throws `Zulm::Failure`.
void writeNew(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs);

/// The same for a picture, as a PNG file.
void writePng(const YuvPicture& picture, const std::string& path, const std::vector<std::string>& inputs);

/// Returns a count for a line of progress.
std::string countText(std::uint64_t count);

/// The files of one folder, which appear together when all are written, or not at all.
class NewFiles {
public:
    /// Creates the folder if it does not exist. Throws `Zulm::Failure`.
    explicit NewFiles(const std::string& folder);
    ~NewFiles();
    NewFiles(const NewFiles&) = delete;
    NewFiles& operator=(const NewFiles&) = delete;

    /// Returns where to write the file that will have this name.
    std::string add(const std::string& name);

    /// Puts all files in place. They replace what has their names. Throws `Zulm::Failure`.
    void keep();

private:
    std::string folder_;
    std::string temporary_; ///< a folder inside of it
    bool isNewFolder_;
    std::vector<std::string> names_;
};

} // namespace Render
