#pragma once

// Files that appear whole or not at all.

#include "ZULMetaData/Containers/ContainerType.h"

#include <cstdint>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

namespace Zulm {

class FileAccess;
class InputFile;
class TemporaryFile;

/// A file that is written under another name beside its place, then synced and renamed. A file that is not committed
/// is removed, also when a signal ends the program.
///
/// Only its owner may read it before it is committed. Then a new file gets the permissions that the process gives to
/// new files, but none that one of the inputs lacks. A file that replaces another one keeps the permissions of that
/// one, but nobody may read it who may not read all inputs.
class OutputFile {
public:
    /// `inputs` are the files that the contents come from, as they were named on the command line ("-" is standard
    /// input). Throws `Failure` if `path` is one of them, or exists and `force` is not given.
    OutputFile(const std::string& path, const std::vector<std::string>& inputs, bool force);
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    /// The path to write to: an empty file in the same folder and with the same extension.
    const std::string& temporaryPath() const;

    /// Fills the file with the bytes of `source` and shows progress. Holes stay holes. Throws `Failure`.
    void copyFrom(const std::string& source);

    /// Fills it with `size` bytes from `offset` on. Throws `Failure`, also if `source` ends before them.
    void copyFrom(const std::string& source, std::uint64_t offset, std::uint64_t size);

    /// Throws `Failure` if the file cannot be synced or renamed, or if without `force` another file has taken its name.
    void commit();

private:
    void putInPlace();

    std::string path_;
    bool force_;
    std::unique_ptr<FileAccess> access_;
    std::unique_ptr<TemporaryFile> temporary_;
};

/// Writes `contents` as a whole file. Throws `Failure` as `OutputFile` does.
void writeWholeFile(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs,
                    bool force);

/// Writes a part of `input` as a whole file. Throws `Failure`.
void writePart(const InputFile& input, std::uint64_t offset, std::uint64_t size, const std::string& output, bool force);

/// Throws `Failure` if the name of `output`, which gets a container of this type, tells another one. Warns if programs
/// that go by the name find no metadata in `output` though they did in `input`.
void requireOutputName(const std::string& output, ZULMetaData::Container::Type type, const std::string& input);

/// Returns when the bytes of a file, or the names in a folder, are on the disk. Throws `Failure`.
void syncByName(const std::string& path);

/// The same for the folder that the path is in, after a file was renamed to it.
void syncFolderOf(const std::string& path);

/// Throws `Failure`.
std::ifstream openInput(const std::string& path);

/// Empties a file to write into it. Throws `Failure`, which calls it `name`.
std::ofstream openOutput(const std::string& path, const std::string& name);

} // namespace Zulm
