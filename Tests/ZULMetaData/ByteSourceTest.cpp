// Bytes that are read at any position, from streams, files, memory and functions.

#include "ZULMetaData/ByteSource.h"

#include "Tests/Support/Files.h"
#include "ZULMetaData/ByteReader.h"
#include "ZULMetaData/ByteSourceStream.h"

#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <new>
#include <sstream>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

namespace ZULMetaData::Test {

namespace {

std::string readFrom(const ByteSource& source, std::uint64_t position, std::size_t size) {
    std::string bytes(size, '?');
    bytes.resize(source.read(position, bytes));
    return bytes;
}

/// A device that breaks when it is read (or moved) after its first bytes.
class BrokenDevice : public std::stringbuf {
public:
    BrokenDevice(const std::string& bytes, bool failsToMove)
        : std::stringbuf(bytes, std::ios_base::in), failsToMove_(failsToMove) {}

protected:
    std::streamsize xsgetn(char* bytes, std::streamsize count) override {
        if (gptr() - eback() >= s_whole)
            throw std::runtime_error("broken");
        return std::stringbuf::xsgetn(bytes, count);
    }
    pos_type seekpos(pos_type position, std::ios_base::openmode mode) override {
        return failsToMove_ && position > s_whole ? pos_type(off_type(-1)) : std::stringbuf::seekpos(position, mode);
    }

private:
    static constexpr std::ptrdiff_t s_whole = 24;
    bool failsToMove_;
};

TEST(ByteSource, ReadsAtAnyPositionOfAStreamWhateverItsState) {
    std::istringstream input("12345678");
    input.seekg(1000);
    input.setstate(std::ios_base::eofbit | std::ios_base::failbit);
    const ByteSource source = ByteSource::stream(input);
    EXPECT_EQ(source.size(), 8U);
    EXPECT_EQ(readFrom(source, 4, 2), "56");
    EXPECT_EQ(readFrom(source, 0, 3), "123");
}

TEST(ByteSource, ReturnsFewerBytesOnlyAtTheEnd) {
    std::istringstream input("12345678");
    for (const ByteSource& source : {ByteSource::stream(input), ByteSource::memory("12345678")}) {
        EXPECT_EQ(readFrom(source, 4, 8), "5678");
        EXPECT_EQ(readFrom(source, 8, 8), "");
        EXPECT_EQ(readFrom(source, 9, 8), "");
        EXPECT_EQ(readFrom(source, ~std::uint64_t{0}, 8), "");
    }
}

TEST(ByteSource, HasPartsThatEndWithTheWhole) {
    const ByteSource whole = ByteSource::memory("0123456789");
    EXPECT_EQ(readFrom(whole.part(2, 3), 0, 10), "234");
    EXPECT_EQ(readFrom(whole.part(2, 3), 2, 10), "4");
    EXPECT_EQ(readFrom(whole.part(2).part(5, 100), 1, 10), "89");
    EXPECT_EQ(whole.part(4, 100).size(), 6U);
    EXPECT_EQ(whole.part(100, 1).size(), 0U);
    EXPECT_EQ(whole.part(3, ~std::uint64_t{0}).size(), 7U);
}

TEST(ByteSource, FailsIfADeviceDoesAndReadsTheNextPlace) {
    for (const bool failsToMove : {false, true}) {
        BrokenDevice device(std::string(64, 'x'), failsToMove);
        std::istream input(&device);
        const ByteSource source = ByteSource::stream(input);
        EXPECT_EQ(readFrom(source, 0, 8).size(), 8U);
        EXPECT_THROW(readFrom(source, 32, 8), std::system_error);
        EXPECT_EQ(readFrom(source, 16, 8).size(), 8U);
    }
}

TEST(ByteSource, FailsIfTheSizeOfAStreamCannotBeDetermined) {
    struct WithoutEnd : std::stringbuf {
        pos_type seekoff(off_type, std::ios_base::seekdir, std::ios_base::openmode) override { return off_type(-1); }
    } device;
    std::istream input(&device);
    EXPECT_THROW(ByteSource::stream(input), std::system_error);
}

TEST(ByteSource, KeepsItsFileOpen) {
    const TemporaryFolder folder;
    writeFile(folder / "bytes", "12345678");
    const ByteSource source = ByteSource::file(folder / "bytes");
    std::filesystem::remove(std::string(folder / "bytes"));
    EXPECT_EQ(readFrom(source, 6, 8), "78");
}

TEST(ByteSource, RefusesWhatIsNoFile) {
    const TemporaryFolder folder;
    const auto refusal = [](const std::string& path) {
        try {
            ByteSource::file(path);
        } catch (const std::system_error& error) {
            return std::string(error.what());
        }
        return std::string();
    };
    EXPECT_EQ(refusal(folder / "missing"), "cannot be opened: No such file or directory");
    EXPECT_EQ(refusal(folder / "."), "is not a regular file: Invalid argument");
    EXPECT_EQ(refusal("/dev/null"), "is not a regular file: Invalid argument");
}

TEST(ByteReader, ReturnsWhatTheSourceHoldsHoweverItIsAskedFor) {
    std::string bytes;
    for (int i = 0; i < 60000; ++i)
        bytes += std::to_string(i);
    detail::ByteReader reader(ByteSource::memory(bytes));
    std::uint64_t position = 1;
    for (int i = 0; i < 2000; ++i) {
        position = (position * 48271 + 11) % (bytes.size() + 10);
        const std::uint64_t size = position % 7 == 0 ? 150000 : position % 97;
        const std::string expected = position < bytes.size() ? bytes.substr(position, size) : std::string();
        ASSERT_EQ(reader.at(position, size), expected) << position << ' ' << size;
        ASSERT_EQ(reader.at(position, size / 2), expected.substr(0, size / 2));
    }
}

/// Returns how many bytes each read asked for while headers of 16 bytes were read at every `distance`.
std::vector<std::size_t> readSizes(std::uint64_t distance) {
    std::vector<std::size_t> sizes;
    constexpr std::uint64_t size = 1 << 20;
    detail::ByteReader reader(ByteSource(size, [&sizes](std::uint64_t, std::span<char> bytes) {
        sizes.push_back(bytes.size());
        return bytes.size();
    }));
    for (std::uint64_t position = 0; position < size; position += distance)
        reader.at(position, 16);
    return sizes;
}

TEST(ByteReader, ReadsLargeBlocksIfHeadersLieNearEachOther) {
    EXPECT_LT(readSizes(75).size(), 30U);
    EXPECT_LT(readSizes(2000).size(), 30U);
    EXPECT_EQ(readSizes(75)[1], 4096U);
}

TEST(ByteReader, ReadsSmallBlocksIfHeadersLieFarApart) {
    EXPECT_EQ(readSizes(10000), std::vector<std::size_t>(105, 2048));
}

TEST(ByteReader, HasNoNumberWhoseBytesDoNotExist) {
    detail::ByteReader reader(ByteSource::memory("12345"));
    EXPECT_EQ(reader.numberAt<char>(4), '5');
    EXPECT_FALSE(reader.numberAt<std::uint32_t>(2));
    detail::ByteCursor cursor(reader, 0, 4);
    std::uint32_t number = 0;
    EXPECT_TRUE(cursor.readBigEndian(number));
    EXPECT_EQ(number, 0x31323334U);
    char left = 'x';
    EXPECT_FALSE(cursor.read(left)) << "the cursor ends before the source";
    EXPECT_EQ(left, 'x');
}

TEST(ByteSourceStream, IsReadLikeAFile) {
    std::string bytes;
    for (int i = 0; i < 30000; ++i)
        bytes += std::to_string(i);
    ByteSourceStream stream(ByteSource::memory(bytes));
    std::istringstream expected(bytes);
    std::uint64_t position = 1;
    for (int i = 0; i < 500; ++i) {
        position = (position * 48271 + 11) % (bytes.size() + 10);
        std::string read(position % 5000, '\0');
        std::string wanted(read.size(), '\0');
        for (auto* input : {static_cast<std::istream*>(&stream), static_cast<std::istream*>(&expected)}) {
            input->clear();
            input->seekg(static_cast<std::streamoff>(std::min<std::uint64_t>(position, bytes.size())));
            input->read(input == &stream ? read.data() : wanted.data(), static_cast<std::streamsize>(read.size()));
        }
        ASSERT_EQ(read, wanted);
        ASSERT_EQ(stream.gcount(), expected.gcount());
        ASSERT_EQ(stream.rdstate(), expected.rdstate());
    }
    stream.clear();
    stream.seekg(-3, std::ios::end);
    EXPECT_EQ(stream.tellg(), static_cast<std::streamoff>(bytes.size() - 3));
}

TEST(ByteSourceStream, ThrowsWhatTheSourceThrows) {
    ByteSourceStream stream(ByteSource(100, [](std::uint64_t, std::span<char>) -> std::size_t {
        throw std::system_error(std::make_error_code(std::errc::io_error));
    }));
    EXPECT_THROW(stream.get(), std::system_error);
    EXPECT_TRUE(stream.bad());
    ByteSourceStream scarce(
        ByteSource(100, [](std::uint64_t, std::span<char>) -> std::size_t { throw std::bad_alloc(); }));
    EXPECT_THROW(scarce.get(), std::bad_alloc);
}

} // namespace

} // namespace ZULMetaData::Test
