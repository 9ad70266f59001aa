#include "Tools/zulm/OutputFile.h"

#include "SharedDependencies/EndianFile.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/Recording.h"
#include "Tools/zulm/TemporaryFile.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace Zulm {

using ZULMetaData::fileOpen;

namespace {

namespace fs = std::filesystem;

std::string failureText(const std::string& path, const char* what) {
    return fmt::format("{}: {}: {}", path, what, std::strerror(errno));
}

/// In the same folder, so that a rename can put it in place.
std::unique_ptr<TemporaryFile> newTemporary(const fs::path& path) {
    const fs::path folder = path.has_parent_path() ? path.parent_path() : ".";
    try {
        return std::make_unique<TemporaryFile>(folder.string(), path.stem().string(), path.extension().string());
    } catch (const std::system_error& error) {
        throw Failure(fmt::format("{}: cannot be created: {}", path.string(), error.code().message()));
    }
}

/// Repeats a system call that a signal interrupted.
template <class Call>
int uninterrupted(Call call) {
    int result = call();
    while (result < 0 && errno == EINTR)
        result = call();
    return result;
}

void sync(const std::string& path) {
    const int file = uninterrupted([&] { return open(path.c_str(), O_RDONLY | O_CLOEXEC); });
    const bool synced = file >= 0 && uninterrupted([file] { return fsync(file); }) == 0;
    const int reason = errno;
    if (file >= 0)
        close(file);
    errno = reason;
    if (!synced)
        throw Failure(failureText(path, "cannot be synced"));
}

} // namespace

OutputFile::OutputFile(const std::string& path, const std::vector<std::string>& inputs, bool force) : path_(path) {
    for (const std::string& input : inputs)
        if (isSameFile(path, input))
            throw Failure(fmt::format("{}: is the input {} itself; choose another output", path, input));
    if (fs::exists(path) && !fs::is_regular_file(path))
        throw Failure(fmt::format("{}: not a regular file; choose another output", path));
    if (fs::exists(path) && !force)
        throw Failure(fmt::format("{}: exists already; --force replaces it", path));
    temporary_ = newTemporary(path);
}

OutputFile::~OutputFile() = default;

const std::string& OutputFile::temporaryPath() const {
    return temporary_->path();
}

void OutputFile::copyFrom(const std::string& source) {
    copyFrom(source, 0, fs::file_size(source));
}

void OutputFile::copyFrom(const std::string& source, std::uint64_t offset, std::uint64_t size) {
    std::ifstream from = openInput(source);
    std::ofstream to = openOutput(temporaryPath(), path_);
    Progress progress("copying " + source, size);
    std::vector<char> piece(s_copyPieceSize);
    from.seekg(static_cast<std::streamoff>(offset));
    for (std::uint64_t left = size; left > 0 && to; progress.moveTo(size - left)) {
        from.read(piece.data(), static_cast<std::streamsize>(std::min<std::uint64_t>(left, piece.size())));
        requireRead(from, source);
        if (from.gcount() == 0)
            throw Failure(fmt::format("{}: ends at offset {}", source, offset + size - left));
        to.write(piece.data(), from.gcount());
        left -= static_cast<std::uint64_t>(from.gcount());
    }
    to.close();
    if (!to)
        throw Failure(failureText(path_, "cannot be written"));
}

void OutputFile::commit() {
    sync(temporaryPath());
    if (std::rename(temporaryPath().c_str(), path_.c_str()) != 0)
        throw Failure(failureText(path_, "cannot be put in place"));
    temporary_->release();
    const fs::path folder = fs::path(path_).parent_path();
    sync(folder.empty() ? "." : folder.string());
}

void writeWholeFile(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs,
                    bool force) {
    OutputFile file(path, inputs, force);
    std::ofstream stream = openOutput(file.temporaryPath(), path);
    stream.write(contents.data(), static_cast<std::streamsize>(contents.size()));
    stream.close();
    if (!stream)
        throw Failure(failureText(path, "cannot be written"));
    file.commit();
}

void writePart(const std::string& input, std::uint64_t offset, std::uint64_t size, const std::string& output,
               bool force) {
    OutputFile file(output, {input}, force);
    file.copyFrom(input, offset, size);
    file.commit();
}

std::ifstream openInput(const std::string& path) {
    std::ifstream file;
    fileOpen(file, path.c_str(), std::ios::binary);
    if (!file.is_open())
        throw Failure(failureText(path, "cannot be opened"));
    return file;
}

std::ofstream openOutput(const std::string& path, const std::string& name) {
    std::ofstream file;
    fileOpen(file, path.c_str(), std::ios::binary | std::ios::trunc);
    if (!file.is_open())
        throw Failure(fmt::format("{}: cannot be written: {}", name, std::strerror(errno)));
    return file;
}

bool isSameFile(const std::string& left, const std::string& right) {
    std::error_code ignored;
    return fs::equivalent(left, right, ignored);
}

} // namespace Zulm
