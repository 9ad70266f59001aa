#include "Tools/zulm/OutputFile.h"

#include "Platform/Descriptor.h"
#include "Platform/FileSystem.h"
#include "SharedDependencies/EndianFile.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/FileAccess.h"
#include "Tools/zulm/InputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/TemporaryFile.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"

#include <fmt/core.h>

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace Zulm {

using ZULMetaData::Container;
using ZULMetaData::CopyError;
using ZULMetaData::copyFileRange;
using ZULMetaData::Descriptor;
using ZULMetaData::extensionFor;
using ZULMetaData::fileOpen;
using ZULMetaData::MetaDataParser;
using ZULMetaData::renameWithoutReplacing;
using ZULMetaData::uninterrupted;

namespace {

namespace fs = std::filesystem;

std::string existsText(const std::string& path) {
    return fmt::format("{}: exists already; --force replaces it", path);
}

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

} // namespace

OutputFile::OutputFile(const std::string& path, const std::vector<std::string>& inputs, bool force)
    : path_(path), force_(force) {
    for (const std::string& input : inputs)
        if (isInput(path, input))
            throw Failure(fmt::format("{}: is the input {} itself; choose another output", path, input));
    std::error_code error;
    const fs::file_status status = fs::status(path, error);
    if (error && status.type() != fs::file_type::not_found)
        throw Failure(fmt::format("{}: {}", path, error.message()));
    if (fs::exists(status) && !fs::is_regular_file(status))
        throw Failure(fmt::format("{}: not a regular file; choose another output", path));
    if (fs::exists(status) && !force)
        throw Failure(existsText(path));
    access_ = std::make_unique<FileAccess>(path, inputs);
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
    Progress progress("copying " + source, size);
    try {
        copyFileRange(source, offset, size, temporaryPath(), [&](std::uint64_t done) { progress.moveTo(done); });
    } catch (const CopyError& error) {
        throw Failure(fmt::format("{}: {}", error.side() == CopyError::Side::Source ? source : path_, error.what()));
    }
}

void OutputFile::commit() {
    syncByName(temporaryPath());
    access_->applyTo(temporaryPath()); // last: it may take the right to open the file
    putInPlace();
    temporary_->release();
    syncFolderOf(path_);
}

void OutputFile::putInPlace() {
    try {
        if (force_)
            fs::rename(temporaryPath(), path_);
        else
            renameWithoutReplacing(temporaryPath(), path_);
    } catch (const std::system_error& error) {
        if (error.code() == std::errc::file_exists)
            throw Failure(existsText(path_));
        throw Failure(fmt::format("{}: cannot be put in place: {}", path_, error.code().message()));
    }
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

void writePart(const InputFile& input, std::uint64_t offset, std::uint64_t size, const std::string& output,
               bool force) {
    OutputFile file(output, {input.name()}, force);
    file.copyFrom(input.path(), offset, size);
    file.commit();
}

void requireOutputName(const std::string& output, Container::Type type, const std::string& input) {
    const Container::Type named = MetaDataParser::streamTypeOf(output);
    if (isNamedOtherwise(output, type))
        throw Failure(fmt::format("{}: is named as a {} is, but would hold a {}; choose a name that ends in {}", output,
                                  containerName(named), containerName(type), extensionFor(type)));
    if (named == Container::Unknown && MetaDataParser::streamTypeOf(input) == type)
        warn(fmt::format("{}: programs that go by the name do not take it for a {}; one that ends in {} is safe",
                         output, containerName(type), extensionFor(type)));
}

void syncByName(const std::string& path) {
    const Descriptor file(uninterrupted([&] { return open(path.c_str(), O_RDONLY | O_CLOEXEC); }));
    if (!file.isOpen() || uninterrupted([&] { return fsync(file.number()); }) != 0)
        throw Failure(failureText(path, "cannot be synced"));
}

void syncFolderOf(const std::string& path) {
    const fs::path folder = fs::path(path).parent_path();
    syncByName(folder.empty() ? "." : folder.string());
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

} // namespace Zulm
