#pragma once

// Files that appear whole or not at all.

#include <cstddef>
#include <cstdint>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

namespace Zulm {

class TemporaryFile;

constexpr std::size_t s_copyPieceSize = 1 << 20; ///< in bytes: what is copied at once

/// Written beside its place under another name, then synced and renamed. What is not committed is removed, also when
/// a signal ends the program.
class OutputFile {
public:
    /// Throws `Failure` where `path` is one of `inputs` (whatever its name), or exists and `force` is not given.
    OutputFile(const std::string& path, const std::vector<std::string>& inputs, bool force);
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    /// Where to write: an empty file in the same folder and with the same extension, which tells containers apart.
    const std::string& temporaryPath() const;

    /// Fills the file with the bytes of `source`, showing progress. Throws `Failure`.
    void copyFrom(const std::string& source);

    /// Only with `size` bytes from `offset` on. Throws `Failure` also where `source` ends before them.
    void copyFrom(const std::string& source, std::uint64_t offset, std::uint64_t size);

    /// Throws `Failure` where the file cannot be synced or renamed.
    void commit();

private:
    std::string path_;
    std::unique_ptr<TemporaryFile> temporary_;
};

/// Writes `contents` as a whole file. Throws `Failure` as `OutputFile` does.
void writeWholeFile(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs,
                    bool force);

/// Writes a part of `input` as a whole file. Throws `Failure`.
void writePart(const std::string& input, std::uint64_t offset, std::uint64_t size, const std::string& output,
               bool force);

/// Throws `Failure`.
std::ifstream openInput(const std::string& path);

/// Empties a file to write into it. Throws `Failure`, which calls it `name`.
std::ofstream openOutput(const std::string& path, const std::string& name);

/// Whether both paths are the same file.
bool isSameFile(const std::string& left, const std::string& right);

} // namespace Zulm
