// How much of a stream is whole.

#include "ZULMetaData/StreamExtent.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/Containers/RepairPlan.h"

#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <sstream>
#include <stdexcept>
#include <string>
#include <system_error>
#include <vector>

namespace ZULMetaData::Test {

namespace {

std::optional<StreamExtent> extentOf(const std::string& stream) {
    std::istringstream input(stream);
    return measureStream(input, 0, stream.size());
}

void expectExtent(const std::string& stream, std::uint64_t wholeBytes, std::uint64_t entries, StreamExtent::End end) {
    const auto extent = extentOf(stream);
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->wholeBytes, wholeBytes);
    EXPECT_EQ(extent->entries, entries);
    EXPECT_EQ(extent->end, end);
}

TEST(StreamExtent, CountsEntriesOfOneSize) {
    expectExtent(locationStream(), 56, 2, StreamExtent::AtEntry);
    expectExtent(streamHeader(s_cursorLocations, 1, 16), 24, 0, StreamExtent::AtEntry);
}

TEST(StreamExtent, WalksEntriesThatCarryTheirSize) {
    expectExtent(appNameStream(), 56, 2, StreamExtent::AtEntry);
    expectExtent(streamHeader(s_appNames, 1, 0), 24, 0, StreamExtent::AtEntry);
}

TEST(StreamExtent, GivesTheHeader) {
    const auto extent = extentOf(locationStream());
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->header.uuid, kind(s_cursorLocations));
    EXPECT_EQ(extent->header.version, 1);
    EXPECT_EQ(extent->header.fixedEntrySize, 16U);
}

TEST(StreamExtent, EndsBehindTheLastWholeEntryWhereverAStreamIsCut) {
    struct Case {
        std::string stream;
        std::vector<std::uint64_t> entryEnds;
    };
    for (const auto& [stream, entryEnds] : {Case{locationStream(), {24, 40, 56}}, Case{appNameStream(), {24, 39, 56}}})
        for (std::uint64_t length = 24; length <= stream.size(); ++length) {
            std::uint64_t entries = 0;
            while (entries + 1 < entryEnds.size() && entryEnds[entries + 1] <= length)
                ++entries;
            const bool isWhole = entryEnds[entries] == length;
            SCOPED_TRACE(length);
            expectExtent(stream.substr(0, length), entryEnds[entries], entries,
                         isWhole ? StreamExtent::AtEntry : StreamExtent::InsideEntry);
        }
}

TEST(StreamExtent, IsNoneWithoutAWholeHeader) {
    for (std::size_t length = 0; length < 24; ++length)
        EXPECT_FALSE(extentOf(locationStream().substr(0, length))) << length;
}

TEST(StreamExtent, StopsAtAnEntryOfNoBytes) {
    expectExtent(streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + le32(0) + textEntry(2.0, "Notes"), 39, 1,
                 StreamExtent::EmptyEntry);
}

TEST(StreamExtent, TrustsNoSize) {
    for (const std::uint32_t size : {5U, 0x7fffffffU, 0xffffffffU})
        expectExtent(streamHeader(s_appNames, 1, 0) + le32(size) + "four", 24, 0, StreamExtent::InsideEntry);
    for (const std::uint32_t size : {5U, 0x7fffffffU, 0xffffffffU})
        expectExtent(streamHeader(s_cursorLocations, 1, size) + "four", 24, 0, StreamExtent::InsideEntry);
    expectExtent(streamHeader(s_cursorLocations, 1, 1) + "four", 28, 4, StreamExtent::AtEntry);
}

TEST(StreamExtent, ReadsStreamsOfAnyLengthInPieces) {
    std::string stream = streamHeader(s_appNames, 1, 0);
    for (int i = 0; i < 5000; ++i)
        stream += textEntry(i, std::string(static_cast<std::size_t>(i % 97), 'x'));
    stream += textEntry(0, std::string(200000, 'y')) + textEntry(1, "last");
    expectExtent(stream, stream.size(), 5002, StreamExtent::AtEntry);
    expectExtent(stream.substr(0, stream.size() - 1), stream.size() - 16, 5001, StreamExtent::InsideEntry);
}

TEST(StreamExtent, MeasuresAPartOfAnInputThatHasFailed) {
    std::istringstream input("front" + locationStream() + "behind");
    input.seekg(1000);
    input.get();
    ASSERT_FALSE(input.good());
    const auto extent = measureStream(input, 5, 50);
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->wholeBytes, 40U);
}

/// Of a device that breaks when it is read (or moved) behind its first bytes.
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

TEST(StreamExtent, IsNoneOfWhatCannotBeRead) {
    for (const bool failsToMove : {false, true}) {
        BrokenDevice device(appNameStream(), failsToMove);
        std::istream input(&device);
        const ReadBytes read = readingFrom(input);
        std::array<char, 8> bytes{};
        EXPECT_EQ(read(0, bytes), 8U);
        EXPECT_THROW(read(32, bytes), std::system_error);
        EXPECT_EQ(read(16, bytes), 8U) << "the next place may be whole";
    }
}

TEST(StreamExtent, FindsNothingBehindTheEndOfMemory) {
    std::istringstream input("12345678");
    const ReadBytes read = readingFrom(input);
    std::array<char, 8> bytes{};
    EXPECT_EQ(read(4, bytes), 4U);
    EXPECT_EQ(read(8, bytes), 0U);
    EXPECT_EQ(read(9, bytes), 0U);
}

TEST(StreamExtent, FindsNothingInMemoryWithoutBytes) {
    std::istringstream input;
    const ReadBytes read = readingFrom(input);
    std::array<char, 8> bytes{};
    EXPECT_EQ(read(0, bytes), 0U);
    EXPECT_EQ(read(1, bytes), 0U);
}

TEST(SizeOfInput, IsThatOfAllBytesWhateverTheState) {
    std::istringstream input("12345678");
    input.seekg(3);
    input.setstate(std::ios_base::eofbit | std::ios_base::failbit);
    EXPECT_EQ(sizeOfInput(input), 8U);
    EXPECT_TRUE(input.good());
}

TEST(SizeOfInput, IsNoNumberWhereItCannotBeTold) {
    struct WithoutEnd : std::stringbuf {
        pos_type seekoff(off_type, std::ios_base::seekdir, std::ios_base::openmode) override { return off_type(-1); }
    } device;
    std::istream input(&device);
    EXPECT_THROW(sizeOfInput(input), std::system_error);
    EXPECT_THROW(planRepair(input), std::system_error);
}

TEST(StreamExtent, TakesAnInputThatEndsEarlyForTorn) {
    std::istringstream input(appNameStream());
    const auto extent = measureStream(input, 0, 1000);
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->wholeBytes, 56U);
    EXPECT_EQ(extent->end, StreamExtent::InsideEntry);
    EXPECT_FALSE(measureStream(input, 40, 1000));
}

} // namespace

} // namespace ZULMetaData::Test
