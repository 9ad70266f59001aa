#include "Bindings/JavaScript/BlockCache.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <stdexcept>
#include <string>

namespace ZULMetaData::Test {
namespace {

constexpr std::size_t s_block = Bindings::s_blockSize;

std::string numbered(std::size_t size) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i)
        bytes[i] = static_cast<char>(i * 2654435761U >> 13);
    return bytes;
}

/// Bytes that count how often they are asked for.
struct Slices {
    std::string bytes;
    std::size_t most = std::string::npos; ///< bytes that one read returns
    std::size_t reads = 0;
    std::size_t read = 0;

    ByteSource cached(std::uint64_t size) {
        return Bindings::cachedInBlocks({size, [this](std::uint64_t position, std::span<char> to) {
                                             ++reads;
                                             const std::size_t got =
                                                 position < bytes.size()
                                                     ? bytes.copy(to.data(), std::min(to.size(), most), position)
                                                     : 0;
                                             read += got;
                                             return got;
                                         }});
    }
    ByteSource cached() { return cached(bytes.size()); }
};

std::string readAt(const ByteSource& source, std::uint64_t position, std::size_t size) {
    std::string bytes(size, '\0');
    bytes.resize(source.read(position, bytes));
    return bytes;
}

TEST(BlockCache, ReturnsTheSameBytesAtEveryPosition) {
    Slices slices{numbered(40 * s_block + 17)};
    const ByteSource source = slices.cached();
    std::mt19937 random(1);
    for (int i = 0; i < 5000; ++i) {
        const std::size_t position = random() % (slices.bytes.size() + 100);
        const std::size_t size = random() % (i % 50 == 0 ? 3 * s_block : 100);
        const std::string expected = position < slices.bytes.size() ? slices.bytes.substr(position, size) : "";
        ASSERT_EQ(readAt(source, position, size), expected) << position << '+' << size;
    }
}

TEST(BlockCache, TakesSlicesThatComeInPieces) {
    Slices slices{numbered(3 * s_block), 1000};
    const ByteSource source = slices.cached();
    EXPECT_EQ(readAt(source, 5, 2 * s_block), slices.bytes.substr(5, 2 * s_block));
    EXPECT_EQ(readAt(source, s_block - 5, 10), slices.bytes.substr(s_block - 5, 10));
}

TEST(BlockCache, ReadsABlockOnceWhileItIsInUse) {
    Slices slices{numbered(10 * s_block)};
    const ByteSource source = slices.cached();
    for (int i = 0; i < 100; ++i)
        for (const std::size_t block : {0U, 9U, 5U})
            readAt(source, block * s_block + static_cast<std::size_t>(i), 16);
    EXPECT_EQ(slices.reads, 3U);
    EXPECT_EQ(slices.read, 3 * s_block);
}

TEST(BlockCache, ReadsWhatIsLargerThanABlockAtOnce) {
    Slices slices{numbered(10 * s_block)};
    EXPECT_EQ(readAt(slices.cached(), 0, 8 * s_block), slices.bytes.substr(0, 8 * s_block));
    EXPECT_EQ(slices.reads, 1U);
}

TEST(BlockCache, EndsWhereTheBytesEndBeforeTheirSize) {
    Slices slices{numbered(100)};
    EXPECT_EQ(readAt(slices.cached(1000), 90, 20), slices.bytes.substr(90));
}

TEST(BlockCache, FailsWhereReadingFails) {
    bool fails = true;
    const ByteSource source = Bindings::cachedInBlocks({100, [&fails](std::uint64_t, std::span<char> to) {
                                                            if (fails)
                                                                throw std::runtime_error("gone");
                                                            std::fill(to.begin(), to.end(), 'x');
                                                            return to.size();
                                                        }});
    EXPECT_THROW(readAt(source, 0, 10), std::runtime_error);
    fails = false;
    EXPECT_EQ(readAt(source, 0, 3), "xxx");
}

} // namespace
} // namespace ZULMetaData::Test
