#include "Tools/zulm/FileAccess.h"

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <algorithm>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace Zulm {

namespace {

constexpr mode_t s_all = 0777;
constexpr mode_t s_group = 0070;
constexpr mode_t s_readByAll = 0444;

std::optional<struct stat> statusOf(const std::string& path) {
    struct stat status {};
    return stat(path.c_str(), &status) == 0 ? std::optional(status) : std::nullopt;
}

std::optional<struct stat> statusOfInput(const std::string& input) {
    struct stat status {};
    if (input == "-")
        return fstat(STDIN_FILENO, &status) == 0 ? std::optional(status) : std::nullopt;
    return statusOf(input);
}

/// Permissions of new files.
mode_t defaultMode() {
    const mode_t mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
}

/// The classes (owner, group, others) that may read, each with all of its bits.
mode_t readers(mode_t mode) {
    const mode_t read = mode & s_readByAll;
    return read | read >> 1 | read >> 2;
}

/// The permissions of a file, as they would be if its group were `group`: members of another group are others.
mode_t allowedBy(const struct stat& input, gid_t group) {
    const mode_t mode = input.st_mode & s_all;
    return input.st_gid == group ? mode : (mode & ~s_group) | (mode & mode << 3 & s_group);
}

} // namespace

FileAccess::FileAccess(const std::string& path, const std::vector<std::string>& inputs) : replaced_(statusOf(path)) {
    for (const std::string& input : inputs)
        addInput(input);
}

void FileAccess::addInput(const std::string& input) {
    auto status = statusOfInput(input);
    if (!status && input != "-") { // it may have been removed meanwhile
        status.emplace();
        status->st_mode = S_IFREG | S_IRUSR | S_IWUSR;
    }
    if (!status || !S_ISREG(status->st_mode))
        return;
    const auto isSame = [&](const struct stat& known) {
        return known.st_mode == status->st_mode && known.st_gid == status->st_gid;
    };
    if (std::none_of(inputs_.begin(), inputs_.end(), isSame))
        inputs_.push_back(*status);
}

void FileAccess::applyTo(const std::string& file) const {
    if (replaced_ && chown(file.c_str(), replaced_->st_uid, replaced_->st_gid) != 0)
        static_cast<void>(chown(file.c_str(), static_cast<uid_t>(-1), replaced_->st_gid) == 0); // if it is ours
    const auto status = statusOf(file);
    if (!status)
        return;
    mode_t mode = replaced_ ? allowedBy(*replaced_, status->st_gid) : defaultMode();
    for (const struct stat& input : inputs_) {
        const mode_t allowed = allowedBy(input, status->st_gid);
        mode &= replaced_ ? readers(allowed) : allowed;
    }
    static_cast<void>(chmod(file.c_str(), mode) == 0); // it stays private otherwise
}

bool isInput(const std::string& path, const std::string& input) {
    const auto output = statusOf(path);
    const auto status = statusOfInput(input);
    return output && status && output->st_dev == status->st_dev && output->st_ino == status->st_ino;
}

void createFolder(const std::string& folder) {
    std::error_code error;
    std::filesystem::create_directories(folder, error);
    if (error)
        throw Failure(fmt::format("{}: cannot be created: {}", folder, error.message()));
    if (!std::filesystem::is_directory(folder, error))
        throw Failure(error ? fmt::format("{}: {}", folder, error.message()) : fmt::format("{}: is no folder", folder));
}

void requireFree(const std::vector<std::string>& outputs, bool force) {
    for (const std::string& output : outputs)
        if (!force && std::filesystem::exists(output))
            throw Failure(fmt::format("{}: exists already; --force replaces it", output));
}

} // namespace Zulm
