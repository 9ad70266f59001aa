#include "Tools/zulm/InputFile.h"

#include "Platform/Descriptor.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <limits>
#include <string_view>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace Zulm {

using ZULMetaData::uninterrupted;

namespace {

constexpr std::string_view s_standardInput = "-";

/// As much as there is, up to `size`. Throws `Failure`.
std::size_t readInput(char* bytes, std::size_t size) {
    std::size_t filled = 0;
    while (filled < size) {
        const ssize_t got = uninterrupted([&] { return read(STDIN_FILENO, bytes + filled, size - filled); });
        if (got < 0)
            throw Failure(fmt::format("{}: standard input cannot be read: {}", s_standardInput, std::strerror(errno)));
        if (got == 0)
            break;
        filled += static_cast<std::size_t>(got);
    }
    return filled;
}

void writeAll(int file, const char* bytes, std::size_t size) {
    while (size > 0) {
        const ssize_t put = uninterrupted([&] { return write(file, bytes, size); });
        if (put < 0)
            throw Failure(
                fmt::format("{}: standard input cannot be kept in a temporary file: {}; set TMPDIR to another folder",
                            s_standardInput, std::strerror(errno)));
        bytes += put;
        size -= static_cast<std::size_t>(put);
    }
}

/// Whether a path such as /dev/stdin names the pipe that standard input is.
bool isPipeOfStandardInput(const std::string& path) {
    struct stat named {};
    struct stat input {};
    return stat(path.c_str(), &named) == 0 && S_ISFIFO(named.st_mode) && fstat(STDIN_FILENO, &input) == 0 &&
           named.st_dev == input.st_dev && named.st_ino == input.st_ino;
}

/// Throws `Failure` if TMPDIR names no folder that can be written to.
std::unique_ptr<TemporaryFile> newSpoolFile(const std::string& extension) {
    std::error_code error;
    const std::string folder = std::filesystem::temp_directory_path(error).string();
    if (error)
        throw Failure(fmt::format("{}: standard input cannot be kept in a temporary file, because TMPDIR names no "
                                  "folder; set it to one, or unset it",
                                  s_standardInput));
    try {
        return std::make_unique<TemporaryFile>(folder, "zulm", extension);
    } catch (const std::system_error& failed) {
        throw Failure(fmt::format("{}: standard input cannot be kept in {}: {}; set TMPDIR to another folder",
                                  s_standardInput, folder, failed.code().message()));
    }
}

template <class Opened>
void sayWhatItIs(const std::string& path, const std::string& name, const Opened& recording) {
    const char* container = ZULMetaData::containerName(recording.container());
    if (isNamedOtherwise(path, recording.container()))
        warn(fmt::format("{}: is a {} by its contents, whatever its name says", name, container));
    say(fmt::format("{}: {} with {} streams", name, container, recording.streams().size()));
}

} // namespace

InputFile::InputFile(const std::string& argument) : name_(argument), path_(argument) {
    if (argument == s_standardInput || isPipeOfStandardInput(path_))
        spool();
    else if (std::error_code ignored; std::filesystem::is_fifo(path_, ignored))
        throw Failure(fmt::format("{}: not a regular file; '-' reads a pipe that is standard input", path_));
    else
        requireFile(path_);
}

InputFile::~InputFile() = default;
InputFile::InputFile(InputFile&&) noexcept = default;

ZULMetaData::RecordingFile InputFile::open() const {
    return openRecording(path_, name_);
}

ZULMetaData::Recording InputFile::openSession() const {
    requireFile(path_);
    ZULMetaData::Recording recording(ZULMetaData::openSource(path_, name_), name_);
    sayWhatItIs(path_, name_, recording);
    return recording;
}

void InputFile::spool() {
    std::array<char, 1 << 16> piece;
    std::size_t size = readInput(piece.data(), piece.size());
    constexpr auto unknownSize = std::numeric_limits<std::uint64_t>::max();
    const auto recognized = ZULMetaData::recognizeContainer({piece.data(), size}, unknownSize, {});
    const std::string_view extension = ZULMetaData::extensionFor(recognized.type);
    if (extension.empty())
        throw Failure(fmt::format("{}: standard input {}", name_, recognized.refusal()));
    temporary_ = newSpoolFile(std::string(extension));
    path_ = temporary_->path();
    const ZULMetaData::Descriptor file(::open(path_.c_str(), O_WRONLY | O_CLOEXEC));
    for (; size > 0; size = readInput(piece.data(), piece.size()))
        writeAll(file.number(), piece.data(), size);
    say(fmt::format("{}: standard input is kept in {} meanwhile", name_, path_));
}

ZULMetaData::RecordingFile openRecording(const std::string& path, const std::string& name) {
    requireFile(path);
    ZULMetaData::RecordingFile recording(path, name);
    sayWhatItIs(path, recording.name(), recording);
    return recording;
}

bool isNamedOtherwise(const std::string& path, ZULMetaData::Container::Type type) {
    const auto named = ZULMetaData::MetaDataParser::streamTypeOf(path);
    return named != ZULMetaData::Container::Unknown && named != type;
}

} // namespace Zulm
