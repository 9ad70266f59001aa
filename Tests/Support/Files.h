#pragma once

// Folders and files that exist as long as a test.

#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

/// An empty folder, removed with what is in it.
class TemporaryFolder {
public:
    TemporaryFolder();
    ~TemporaryFolder();
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    const std::filesystem::path& path() const { return path_; }

    /// The path of a file in it.
    std::string operator/(const std::string& name) const { return (path_ / name).string(); }

private:
    std::filesystem::path path_;
};

/// Returns the names of what is in a folder, sorted.
std::vector<std::string> namesIn(const std::filesystem::path& folder);

std::string contentsOf(const std::filesystem::path& file);
void writeFile(const std::filesystem::path& file, const std::string& contents);

/// `size` bytes of which none is stored, but for `head` at the start and `tail` at the end.
void writeSparseFile(const std::filesystem::path& file, std::uint64_t size, const std::string& head,
                     const std::string& tail = {});

/// What a shell command prints on standard output. Fails the test where it does not end with 0.
std::string outputOf(const std::string& command);

} // namespace ZULMetaData::Test
