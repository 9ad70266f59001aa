#include "Bindings/JavaScript/SliceBuffer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <istream>
#include <random>
#include <stdexcept>
#include <string>

namespace ZULMetaData::Test {
namespace {

using Bindings::SliceBuffer;

constexpr std::size_t s_block = SliceBuffer::s_blockSize;

std::string numbered(std::size_t size) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(i * 2654435761U >> 13);
    return bytes;
}

/// Bytes that count how often they are asked for.
struct Slices {
    std::string bytes;
    std::size_t most = std::string::npos; ///< given at a time
    std::size_t reads = 0;
    std::size_t read = 0;

    Bindings::ReadSlice reader() {
        return [this](std::uint64_t position, void* target, std::size_t size) {
            ++reads;
            const std::size_t got =
                position < bytes.size() ? bytes.copy(static_cast<char*>(target), std::min(size, most), position) : 0;
            read += got;
            return got;
        };
    }
};

std::string readAt(std::istream& input, std::uint64_t position, std::size_t size) {
    input.clear();
    input.seekg(static_cast<std::streamoff>(position));
    std::string bytes(size, '\0');
    input.read(bytes.data(), static_cast<std::streamsize>(size));
    bytes.resize(static_cast<std::size_t>(input.gcount()));
    return bytes;
}

TEST(SliceBuffer, GivesTheSameBytesAtEveryPosition) {
    Slices slices{numbered(40 * s_block + 17)};
    SliceBuffer buffer(slices.reader(), slices.bytes.size());
    std::istream input(&buffer);
    std::mt19937 random(1);
    for (int i = 0; i < 5000; ++i) {
        const std::size_t position = random() % (slices.bytes.size() + 100);
        const std::size_t size = random() % (i % 50 == 0 ? 3 * s_block : 100);
        const std::string expected = position < slices.bytes.size() ? slices.bytes.substr(position, size) : "";
        ASSERT_EQ(readAt(input, position, size), expected) << position << '+' << size;
    }
}

TEST(SliceBuffer, TakesSlicesThatComeInPieces) {
    Slices slices{numbered(3 * s_block), 1000};
    SliceBuffer buffer(slices.reader(), slices.bytes.size());
    std::istream input(&buffer);
    EXPECT_EQ(readAt(input, 5, 2 * s_block), slices.bytes.substr(5, 2 * s_block));
}

TEST(SliceBuffer, ReadsABlockOnceWhileItIsInUse) {
    Slices slices{numbered(10 * s_block)};
    SliceBuffer buffer(slices.reader(), slices.bytes.size());
    std::istream input(&buffer);
    for (int i = 0; i < 100; ++i)
        for (const std::size_t block : {0U, 9U, 5U})
            readAt(input, block * s_block + static_cast<std::size_t>(i), 16);
    EXPECT_EQ(slices.reads, 3U);
    EXPECT_EQ(slices.read, 3 * s_block);
}

TEST(SliceBuffer, ReadsWhatIsLargerThanABlockAtOnce) {
    Slices slices{numbered(10 * s_block)};
    SliceBuffer buffer(slices.reader(), slices.bytes.size());
    std::istream input(&buffer);
    EXPECT_EQ(readAt(input, 0, 8 * s_block), slices.bytes.substr(0, 8 * s_block));
    EXPECT_EQ(slices.reads, 1U);
}

TEST(SliceBuffer, TellsItsSizeAndPosition) {
    Slices slices{numbered(s_block + 5)};
    SliceBuffer buffer(slices.reader(), slices.bytes.size());
    std::istream input(&buffer);
    input.seekg(0, std::ios_base::end);
    EXPECT_EQ(input.tellg(), static_cast<std::streamoff>(s_block + 5));
    input.seekg(-3, std::ios_base::cur);
    EXPECT_EQ(input.get(), std::char_traits<char>::to_int_type(slices.bytes[s_block + 2]));
    EXPECT_EQ(input.tellg(), static_cast<std::streamoff>(s_block + 3));
    EXPECT_FALSE(input.seekg(-1));
    EXPECT_EQ(slices.reads, 1U);
}

TEST(SliceBuffer, EndsWhereTheBytesEndBeforeItsSize) {
    Slices slices{numbered(100)};
    SliceBuffer buffer(slices.reader(), 1000);
    std::istream input(&buffer);
    EXPECT_EQ(readAt(input, 90, 20), slices.bytes.substr(90));
    EXPECT_TRUE(input.eof());
    EXPECT_FALSE(input.bad());
}

TEST(SliceBuffer, HasFailedWhereReadingFails) {
    SliceBuffer buffer([](std::uint64_t, void*, std::size_t) -> std::size_t { throw std::runtime_error("gone"); }, 100);
    std::istream input(&buffer);
    EXPECT_EQ(readAt(input, 0, 10), "");
    EXPECT_TRUE(input.bad());
}

} // namespace
} // namespace ZULMetaData::Test
