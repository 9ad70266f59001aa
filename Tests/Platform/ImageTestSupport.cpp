#include "Tests/Platform/ImageTestSupport.h"

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <new>
#include <utility>

#ifndef ZULM_TEST_IMAGE_CONVERTER
#define ZULM_TEST_IMAGE_CONVERTER "/usr/bin/convert-im6.q16"
#endif

namespace ZULMetaData::Test {

namespace {

constexpr std::array<std::uint8_t, 3> s_damages{0x01, 0x80, 0xFF};

std::string quoted(const std::filesystem::path& path) {
    std::string text("'");
    text += path.string();
    return text += '\'';
}

void runConverter(const std::string& arguments) {
    const auto result = run(std::string(ZULM_TEST_IMAGE_CONVERTER) + " " + arguments);
    EXPECT_EQ(result.status, 0) << arguments;
    EXPECT_EQ(result.output, "") << arguments;
}

std::size_t addressSpaceInUse() {
    std::size_t pages = 0;
    std::ifstream("/proc/self/statm") >> pages;
    return pages * static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
}

[[noreturn]] void runInLittleMemory(const std::function<bool()>& work) {
    constexpr std::size_t more = std::size_t{64} << 20;
    const auto inUse = addressSpaceInUse();
    const rlimit limit{inUse + more, inUse + more};
    bool succeeded = false;
    try {
        succeeded = inUse > 0 && setrlimit(RLIMIT_AS, &limit) == 0 && work();
    } catch (const std::bad_alloc&) {
        succeeded = false;
    }
    _exit(succeeded ? 0 : 1);
}

} // namespace

ScratchFolder::ScratchFolder() {
    std::string name = (std::filesystem::temp_directory_path() / "platform-test-XXXXXX").string();
    EXPECT_NE(mkdtemp(name.data()), nullptr);
    path_ = name;
}

ScratchFolder::~ScratchFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

Bytes readFile(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    EXPECT_TRUE(file.is_open()) << path;
    return Bytes(std::istreambuf_iterator<char>(file), {});
}

void writeFile(const std::filesystem::path& path, const Bytes& bytes) {
    std::ofstream file(path, std::ios::binary);
    file.write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(bytes.size()));
    EXPECT_TRUE(file.good()) << path;
}

CommandResult run(const std::string& command) {
    CommandResult result{-1, {}};
    FILE* pipe = popen((command + " 2>&1").c_str(), "r");
    if (pipe == nullptr) {
        return result;
    }
    std::array<char, 4096> buffer{};
    while (const auto count = std::fread(buffer.data(), 1, buffer.size(), pipe)) {
        result.output.append(buffer.data(), count);
    }
    result.status = pclose(pipe);
    return result;
}

Bytes encodedElsewhere(const std::string& arguments, const std::string& fileName) {
    const ScratchFolder folder;
    const auto format = fileName.substr(0, fileName.find(':') + 1);
    const auto path = folder / fileName.substr(format.size());
    runConverter(arguments + " " + format + quoted(path));
    return readFile(path);
}

Bytes rgbaDecodedElsewhere(const Bytes& encoded, const std::string& fileName) {
    const ScratchFolder folder;
    writeFile(folder / fileName, encoded);
    // That program cuts off low bits when it writes eight of them: sixteen are asked for and rounded here.
    runConverter(quoted(folder / fileName) + " -depth 16 -endian MSB RGBA:" + quoted(folder / "pixels"));
    const auto samples = readFile(folder / "pixels");
    Bytes rgba;
    for (std::size_t i = 0; i + 1 < samples.size(); i += 2) {
        rgba.push_back(static_cast<std::uint8_t>((samples[i] * 256 + samples[i + 1] + 128) / 257));
    }
    return rgba;
}

std::optional<Image> decoded(std::span<const std::uint8_t> encoded) {
    const EncodedImageCheck check = Image::checkEncodedBytes(encoded);
    auto image = Image::fromEncodedBytes(encoded);
    EXPECT_NE(check.state, image ? EncodedImageCheck::Undecodable : EncodedImageCheck::Decodable);
    if (image) {
        EXPECT_EQ(check.width, image->width());
        EXPECT_EQ(check.height, image->height());
    }
    return image;
}

Image randomImage(std::mt19937& random, std::uint32_t maximumSide) {
    std::uniform_int_distribution<std::uint32_t> side(1, maximumSide);
    const auto width = side(random);
    const auto height = side(random);
    Bytes rgba(std::size_t{4} * width * height);
    for (auto& byte : rgba) {
        byte = static_cast<std::uint8_t>(random());
    }
    return {width, height, std::move(rgba)};
}

Bytes toBytes(std::span<const std::uint8_t> bytes) {
    return {bytes.begin(), bytes.end()};
}

Bytes bigEndian(std::uint64_t value, int count) {
    Bytes bytes;
    for (int shift = 8 * (count - 1); shift >= 0; shift -= 8) {
        bytes.push_back(static_cast<std::uint8_t>(value >> shift));
    }
    return bytes;
}

Bytes operator+(Bytes left, const Bytes& right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

void expectPixels(const std::optional<Image>& image, std::uint32_t width, std::uint32_t height, const Bytes& rgba) {
    ASSERT_TRUE(image.has_value());
    EXPECT_EQ(image->width(), width);
    EXPECT_EQ(image->height(), height);
    EXPECT_EQ(toBytes(image->rgba()), rgba);
}

void expectSameAsElsewhere(const Bytes& encoded, const std::string& fileName) {
    const auto image = Image::fromEncodedBytes(encoded);
    ASSERT_TRUE(image.has_value());
    const auto expected = rgbaDecodedElsewhere(encoded, fileName);
    EXPECT_EQ(expected.size(), std::size_t{4} * image->width() * image->height());
    EXPECT_TRUE(toBytes(image->rgba()) == expected);
}

void expectNoImageFromAnyPrefix(const Bytes& encoded) {
    ASSERT_TRUE(decoded(encoded).has_value());
    for (std::size_t length = 0; length < encoded.size(); ++length) {
        // A copy of its own, so that a read behind its end is seen by an address checker.
        const Bytes prefix(encoded.begin(), encoded.begin() + static_cast<std::ptrdiff_t>(length));
        EXPECT_FALSE(decoded(prefix).has_value()) << "cut at " << length;
    }
}

void forEverySingleByteChange(const Bytes& encoded, const std::function<void(const Bytes&)>& examine) {
    for (std::size_t position = 0; position < encoded.size(); ++position) {
        for (const auto damage : s_damages) {
            SCOPED_TRACE("byte " + std::to_string(position) + " changed by " + std::to_string(damage));
            Bytes damaged = encoded;
            damaged[position] = static_cast<std::uint8_t>(damaged[position] ^ damage);
            examine(damaged);
        }
    }
}

bool succeedsInLittleMemory(const std::function<bool()>& work) {
    const pid_t child = fork();
    if (child == 0) {
        runInLittleMemory(work);
    }
    int status = -1;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    return status == 0;
}

std::string printedBy(const std::function<void()>& work) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    work();
    auto printed = testing::internal::GetCapturedStderr();
    return printed + testing::internal::GetCapturedStdout();
}

} // namespace ZULMetaData::Test
