#include "Tools/zulm/OutputFile.h"

#include "Tools/zulm/Command.h"
#include "Tools/zulm/Progress.h"

#include <fmt/core.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace Zulm {

namespace {

namespace fs = std::filesystem;

/// What a signal must remove: a handler can neither lock nor allocate.
volatile std::sig_atomic_t s_hasTemporary = 0;
std::array<char, 4096> s_temporary;

extern "C" void removeTemporaryAndEnd(int signal) {
    if (s_hasTemporary)
        unlink(s_temporary.data());
    std::signal(signal, SIG_DFL);
    std::raise(signal);
}

void forgetTemporary() {
    s_hasTemporary = 0;
}

void rememberTemporary(const std::string& path) {
    forgetTemporary();
    if (path.size() >= s_temporary.size())
        return;
    std::memcpy(s_temporary.data(), path.c_str(), path.size() + 1);
    s_hasTemporary = 1;
    for (const int signal : {SIGINT, SIGTERM, SIGHUP})
        if (std::signal(signal, removeTemporaryAndEnd) == SIG_IGN)
            std::signal(signal, SIG_IGN);
}

std::string failureText(const std::string& path, const char* what) {
    return fmt::format("{}: {}: {}", path, what, std::strerror(errno));
}

/// Creates it, readable as a new file would be.
std::string newTemporary(const fs::path& path) {
    const fs::path folder = path.has_parent_path() ? path.parent_path() : ".";
    const std::string extension = path.extension().string();
    std::string name = (folder / fmt::format(".{}.XXXXXX{}", path.stem().string(), extension)).string();
    const int file = mkstemps(name.data(), static_cast<int>(extension.size()));
    if (file < 0)
        throw Failure(failureText(path.string(), "cannot be created"));
    const mode_t mask = umask(0);
    umask(mask);
    fchmod(file, 0666 & ~mask);
    close(file);
    return name;
}

void sync(const std::string& path) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    const bool synced = file >= 0 && fsync(file) == 0;
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
    if (fs::exists(path) && !force)
        throw Failure(fmt::format("{}: exists already; --force replaces it", path));
    temporaryPath_ = newTemporary(path);
    rememberTemporary(temporaryPath_);
}

OutputFile::~OutputFile() {
    if (!committed_)
        unlink(temporaryPath_.c_str());
    forgetTemporary();
}

void OutputFile::copyFrom(const std::string& source) {
    std::ifstream from(source, std::ios::binary);
    std::ofstream to(temporaryPath_, std::ios::binary);
    Progress progress("copying " + source, fs::file_size(source));
    std::vector<char> piece(1 << 20);
    while (from.read(piece.data(), static_cast<std::streamsize>(piece.size())), from.gcount() > 0) {
        to.write(piece.data(), from.gcount());
        progress.advance(static_cast<std::uint64_t>(from.gcount()));
    }
    to.close();
    if (from.bad() || !to)
        throw Failure(failureText(path_, "cannot be written"));
}

void OutputFile::commit() {
    sync(temporaryPath_);
    if (std::rename(temporaryPath_.c_str(), path_.c_str()) != 0)
        throw Failure(failureText(path_, "cannot be put in place"));
    committed_ = true;
    const fs::path folder = fs::path(path_).parent_path();
    sync(folder.empty() ? "." : folder.string());
}

void writeWholeFile(const std::string& path, const std::string& contents, const std::vector<std::string>& inputs,
                    bool force) {
    OutputFile file(path, inputs, force);
    std::ofstream stream(file.temporaryPath(), std::ios::binary);
    stream.write(contents.data(), static_cast<std::streamsize>(contents.size()));
    stream.close();
    if (!stream)
        throw Failure(failureText(path, "cannot be written"));
    file.commit();
}

bool isSameFile(const std::string& left, const std::string& right) {
    std::error_code ignored;
    return fs::equivalent(left, right, ignored);
}

} // namespace Zulm
