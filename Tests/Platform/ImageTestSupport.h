#pragma once

// What the tests of the image codecs share: files made and read by another program, damage, and random pictures.

#include "Platform/Image.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <random>
#include <span>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

using Bytes = std::vector<std::uint8_t>;

/// A folder of its own, removed with everything in it.
class ScratchFolder {
public:
    ScratchFolder();
    ScratchFolder(const ScratchFolder&) = delete;
    ScratchFolder& operator=(const ScratchFolder&) = delete;
    ~ScratchFolder();

    std::filesystem::path operator/(const std::string& name) const { return path_ / name; }

private:
    std::filesystem::path path_;
};

Bytes readFile(const std::filesystem::path& path);
void writeFile(const std::filesystem::path& path, const Bytes& bytes);

/// Exit status and everything printed of a shell command.
struct CommandResult {
    int status;
    std::string output;
};
CommandResult run(const std::string& command);

/// Another program's encoder and decoder. A failure to run it fails the test; so does anything that it prints.
Bytes encodedElsewhere(const std::string& arguments, const std::string& fileName);
Bytes rgbaDecodedElsewhere(const Bytes& encoded, const std::string& fileName);

/// Decodes, and expects that a check of the file has foretold whether that works and how large the image is.
std::optional<Image> decoded(std::span<const std::uint8_t> encoded);

Image randomImage(std::mt19937& random, std::uint32_t maximumSide);
Bytes toBytes(std::span<const std::uint8_t> bytes);

/// A number of `count` bytes, most significant byte first.
Bytes bigEndian(std::uint64_t value, int count);
Bytes operator+(Bytes left, const Bytes& right);

void expectPixels(const std::optional<Image>& image, std::uint32_t width, std::uint32_t height, const Bytes& rgba);
void expectSameAsElsewhere(const Bytes& encoded, const std::string& fileName);
void expectNoImageFromAnyPrefix(const Bytes& encoded);

/// Calls `examine` with the bytes after each change of a single byte: one bit, the highest bit, all bits.
void forEverySingleByteChange(const Bytes& encoded, const std::function<void(const Bytes&)>& examine);

/// Whether `work` gives true in a child process that may take at most 64 MiB more of address space.
bool succeedsInLittleMemory(const std::function<bool()>& work);

/// What `work` prints to standard output and standard error.
std::string printedBy(const std::function<void()>& work);

} // namespace ZULMetaData::Test
