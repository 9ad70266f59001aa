// How much of a stream is whole.

#include "ZULMetaData/StreamEntries.h"

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <span>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

std::optional<StreamExtent> extentOf(const std::string& stream) {
    return measureStream(ByteSource::memory(stream));
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

TEST(StreamExtent, MeasuresAPart) {
    const std::string bytes = "front" + locationStream() + "behind";
    const auto extent = measureStream(ByteSource::memory(bytes).part(5, 50));
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->wholeBytes, 40U);
}

TEST(StreamExtent, TakesAnInputThatEndsEarlyForTorn) {
    const std::string stream = appNameStream();
    const ByteSource source(1000, [&](std::uint64_t position, std::span<char> bytes) {
        return ByteSource::memory(stream).read(position, bytes);
    });
    const auto extent = measureStream(source);
    ASSERT_TRUE(extent);
    EXPECT_EQ(extent->wholeBytes, 56U);
    EXPECT_EQ(extent->end, StreamExtent::InsideEntry);
    EXPECT_FALSE(measureStream(source.part(40)));
}

} // namespace

} // namespace ZULMetaData::Test
