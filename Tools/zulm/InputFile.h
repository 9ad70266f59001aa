#pragma once

// A file to read that was named on the command line, where "-" is standard input.

#include <memory>
#include <string>

namespace Zulm {

class TemporaryFile;

/// Standard input is copied into a temporary file first, whose extension tells what it is by its first bytes.
class InputFile {
public:
    /// Throws `Failure` where there is no such regular file, or where standard input cannot be read or is nothing
    /// that can hold a recording's metadata.
    explicit InputFile(const std::string& argument);
    ~InputFile();
    InputFile(InputFile&&) noexcept;
    InputFile& operator=(InputFile&&) = delete;

    /// What to open.
    const std::string& path() const { return path_; }

    /// What to call it towards a person or in a report: as it was named.
    const std::string& name() const { return name_; }

private:
    void spool();

    std::string name_;
    std::string path_;
    std::unique_ptr<TemporaryFile> temporary_;
};

} // namespace Zulm
