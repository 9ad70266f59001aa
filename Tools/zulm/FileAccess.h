#pragma once

// Where outputs go, and who may read them: nobody who may not read all of their inputs.

#include <optional>
#include <string>
#include <sys/stat.h>
#include <vector>

namespace Zulm {

class FileAccess {
public:
    /// The output `path` may exist, and is replaced then. Inputs are named as on the command line.
    FileAccess(const std::string& path, const std::vector<std::string>& inputs);

    /// The output is a new file. Inputs are added.
    FileAccess() = default;

    /// Adds one more input, which takes memory only if none has had its permissions.
    void addInput(const std::string& input);

    /// Gives `file` the permissions of the output, as far as its file system and the process can. Whatever fails leaves
    /// fewer permissions, never more.
    void applyTo(const std::string& file) const;

private:
    std::optional<struct stat> replaced_;
    std::vector<struct stat> inputs_; ///< of files, not of pipes
};

/// Whether the input is the file at `path`, whatever both are called. The input "-" is standard input.
bool isInput(const std::string& path, const std::string& input);

/// Creates the folder if it does not exist. Throws `Failure`.
void createFolder(const std::string& folder);

/// Throws `Failure` if one of the outputs exists, before anything is written.
void requireFree(const std::vector<std::string>& outputs, bool force);

} // namespace Zulm
