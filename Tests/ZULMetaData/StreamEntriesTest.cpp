#include "ZULMetaData/StreamEntries.h"

#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gtest/gtest.h>

#include <sstream>

namespace ZULMetaData::Test {
namespace {

/// Keeps the bytes.
StreamEntries entriesOf(const std::string& stream) {
    return StreamEntries(ByteSource(stream.size(), [stream](std::uint64_t position, std::span<char> bytes) {
        return ByteSource::memory(stream).read(position, bytes);
    }));
}

std::vector<std::string> allOf(StreamEntries& entries) {
    std::vector<std::string> all;
    while (const auto entry = entries.next())
        all.emplace_back(entries.bytesOf(*entry));
    return all;
}

TEST(StreamEntries, GivesEveryEntryOfEqualSize) {
    StreamEntries entries = entriesOf(locationStream());
    EXPECT_EQ(entries.header()->uuid, s_cursorLocationUUID);
    EXPECT_EQ(allOf(entries), (std::vector{pointEntry(0.5, 10, 20), pointEntry(1.0, -3, 7)}));
    EXPECT_EQ(entries.end(), StreamExtent::AtEntry);
    EXPECT_EQ(entries.wholeBytes(), 56U);
}

TEST(StreamEntries, GivesEveryEntryThatCarriesItsSize) {
    StreamEntries entries = entriesOf(appNameStream());
    EXPECT_EQ(allOf(entries), (std::vector{textEntry(0.5, "Abc"), textEntry(2.0, "Notes")}));
    EXPECT_EQ(entries.end(), StreamExtent::AtEntry);
}

TEST(StreamEntries, TellsWhereAnEntryIs) {
    StreamEntries entries = entriesOf(appNameStream());
    entries.next();
    const auto second = entries.next();
    ASSERT_TRUE(second);
    EXPECT_EQ(second->offset, 39U);
    EXPECT_EQ(second->size, 17U);
    EXPECT_EQ(second->end(), 56U);
}

TEST(StreamEntries, StopsInFrontOfWhatIsCutShortAtEveryByte) {
    for (const std::string& stream : {locationStream(), appNameStream()}) {
        for (std::size_t length = s_metaDataHeaderSize; length < stream.size(); ++length) {
            StreamEntries entries = entriesOf(stream.substr(0, length));
            const std::uint64_t whole = [&] {
                std::uint64_t end = s_metaDataHeaderSize;
                while (const auto entry = entries.next())
                    end = entry->end();
                return end;
            }();
            EXPECT_LE(whole, length);
            EXPECT_EQ(entries.wholeBytes(), whole);
            EXPECT_EQ(entries.end(), whole == length ? StreamExtent::AtEntry : StreamExtent::InsideEntry) << length;
        }
    }
}

TEST(StreamEntries, HasNoneWithoutAWholeHeader) {
    for (std::size_t length = 0; length < s_metaDataHeaderSize; ++length) {
        StreamEntries entries = entriesOf(locationStream().substr(0, length));
        EXPECT_FALSE(entries.header());
        EXPECT_FALSE(entries.next());
        EXPECT_EQ(entries.wholeBytes(), 0U);
    }
}

TEST(StreamEntries, DoesNotGetPastAnEntryOfNoBytes) {
    StreamEntries entries = entriesOf(streamHeader(s_appNames, 1, 0) + textEntry(1, "a") + le32(0) + textEntry(2, "b"));
    EXPECT_EQ(allOf(entries).size(), 1U);
    EXPECT_EQ(entries.end(), StreamExtent::EmptyEntry);
}

TEST(StreamEntries, BelievesNoSizeBeyondTheEnd) {
    for (const std::uint32_t size : {14U, 0x7fffffffU, 0xffffffffU}) {
        StreamEntries entries = entriesOf(streamHeader(s_appNames, 1, 0) + le32(size) + f64(1) + "texts");
        EXPECT_TRUE(allOf(entries).empty()) << size;
        EXPECT_EQ(entries.end(), StreamExtent::InsideEntry);
    }
}

TEST(StreamEntries, ReadsEntriesLargerThanItsPieces) {
    const std::string large(200000, 'x');
    StreamEntries entries =
        entriesOf(streamHeader(s_appNames, 1, 0) + textEntry(1, "a") + textEntry(2, large) + textEntry(3, "b"));
    EXPECT_EQ(allOf(entries), (std::vector{textEntry(1, "a"), textEntry(2, large), textEntry(3, "b")}));
}

TEST(StreamEntries, GivesFewerBytesWhereTheInputFails) {
    const std::string stream = appNameStream();
    StreamEntries entries(ByteSource(stream.size(), [&](std::uint64_t position, std::span<char> bytes) {
        return ByteSource::memory(stream).part(0, 45).read(position, bytes); // the size said more
    }));
    entries.next();
    const auto second = entries.next();
    ASSERT_TRUE(second);
    EXPECT_LT(entries.bytesOf(*second).size(), second->size);
    EXPECT_FALSE(decodeEntry<std::string>(entries.bytesOf(*second), 1));
}

TEST(DecodeEntry, ReadsFixedValuesOfTheirExactSize) {
    const auto decoded = decodeEntry<Point>(pointEntry(0.5, 10, -20), 1);
    ASSERT_TRUE(decoded);
    EXPECT_EQ(decoded->time, 0.5);
    EXPECT_EQ(decoded->value, Point(10, -20));
    EXPECT_FALSE(decodeEntry<Point>(pointEntry(0.5, 10, -20) + "x", 1));
    EXPECT_FALSE(decodeEntry<Point>(pointEntry(0.5, 10, -20).substr(1), 1));
}

TEST(DecodeEntry, ReadsATextWithoutCharacters) {
    EXPECT_EQ(decodeEntry<std::string>(textEntry(2.5, ""), 1)->value, "");
}

TEST(DecodeEntry, RefusesATextWhoseSizeDisagreesWithItsBytes) {
    const std::string entry = textEntry(2.5, "Notes");
    EXPECT_EQ(decodeEntry<std::string>(entry, 1)->value, "Notes");
    EXPECT_EQ(decodeEntry<std::string>(entry, 1)->time, 2.5);
    EXPECT_FALSE(decodeEntry<std::string>(entry + "x", 1));
    for (std::size_t length = 0; length < entry.size(); ++length)
        EXPECT_FALSE(decodeEntry<std::string>(entry.substr(0, length), 1)) << length;
    EXPECT_FALSE(decodeEntry<std::string>(le32(7) + "1234567", 1)); // too small for a time
}

std::string listEntry(std::uint32_t count, const std::string& texts) {
    return le32(static_cast<std::uint32_t>(4 + texts.size())) + le32(count) + texts;
}

TEST(DecodeEntry, TakesTheTimeOfAListFromItsTexts) {
    const auto decoded = decodeEntry<std::list<std::string>>(listEntry(2, textEntry(5, "a") + textEntry(5, "bc")), 1);
    ASSERT_TRUE(decoded);
    EXPECT_EQ(decoded->time, 5);
    EXPECT_EQ(decoded->value, (std::list<std::string>{"a", "bc"}));
    EXPECT_EQ(decodeEntry<std::list<std::string>>(listEntry(0, ""), 1)->time, 0);
}

TEST(DecodeEntry, RefusesAListWhoseTextsDoNotFillIt) {
    const std::string texts = textEntry(5, "a") + textEntry(5, "bc");
    for (const std::uint32_t count : {0U, 1U, 3U, 0xffffffffU})
        EXPECT_FALSE(decodeEntry<std::list<std::string>>(listEntry(count, texts), 1)) << count;
    EXPECT_FALSE(decodeEntry<std::list<std::string>>(listEntry(1, le32(0xfffffff0) + f64(5) + "a"), 1));
    EXPECT_FALSE(decodeEntry<std::list<std::string>>(listEntry(1, le32(7) + "1234567"), 1));
}

TEST(DecodeEntry, RefusesAListWhoseSizeDisagreesWithItsBytes) {
    const std::string entry = listEntry(1, textEntry(5, "a"));
    for (std::size_t length = 0; length < entry.size(); ++length)
        EXPECT_FALSE(decodeEntry<std::list<std::string>>(entry.substr(0, length), 1)) << length;
    EXPECT_FALSE(decodeEntry<std::list<std::string>>(entry + "x", 1));
    EXPECT_FALSE(decodeEntry<std::list<std::string>>(le32(99) + entry.substr(4), 1));
}

std::string cursorEntry(std::uint32_t entrySize, std::uint32_t dataSize, const std::string& data) {
    return le32(entrySize) + f64(1.5) + le64(7) + le32(dataSize) + data;
}

TEST(DecodeEntry, ReadsACursorImage) {
    const std::string data = le32(3) + raw(4) + raw(5) + "png" + raw(-1) + le32(3);
    const auto decoded = decodeEntry<CursorImage>(cursorEntry(43, 23, data), 2);
    ASSERT_TRUE(decoded);
    EXPECT_EQ(decoded->time, 1.5);
    EXPECT_EQ(decoded->value.uniqueId, 7U);
    EXPECT_EQ(decoded->value.hotspotOffsetY, 5);
    EXPECT_EQ(decoded->value.imageDataSize, 3U);
}

TEST(DecodeEntry, RefusesACursorImageWhoseSizesDisagree) {
    const std::string data = le32(0) + le32(3);
    EXPECT_TRUE(decodeEntry<CursorImage>(cursorEntry(28, 8, data), 2));
    EXPECT_FALSE(decodeEntry<CursorImage>(cursorEntry(29, 8, data), 2));
    EXPECT_FALSE(decodeEntry<CursorImage>(cursorEntry(28, 0xffffffff, data), 2));
    EXPECT_FALSE(decodeEntry<CursorImage>(cursorEntry(28, 8, data).substr(0, 20), 2));
    EXPECT_FALSE(decodeEntry<CursorImage>("", 2));
    EXPECT_FALSE(decodeEntry<CursorImage>(cursorEntry(28, 8, data), 100)) << "of a version without fields";
}

TEST(CursorFields, HaveRoomInAWholeEntry) {
    const std::string data = le32(3) + raw(4) + raw(5) + "png" + raw(-1) + le32(3);
    EXPECT_TRUE(hasRoomForCursorFields(cursorEntry(43, 23, data), 2));
    EXPECT_TRUE(hasRoomForCursorFields(cursorEntry(45, 25, data + "xx"), 2)) << "bytes may be left over";
    EXPECT_TRUE(hasRoomForCursorFields(cursorEntry(28, 8, le32(0) + le32(3)), 2));
    EXPECT_TRUE(hasRoomForCursorFields(cursorEntry(20, 0, ""), 1));
    EXPECT_TRUE(hasRoomForCursorFields(cursorEntry(31, 11, raw(4) + raw(5) + "png"), 1));
}

TEST(CursorFields, HaveNoRoomInAnEntryThatIsCutShort) {
    const std::string whole = cursorEntry(43, 23, le32(3) + raw(4) + raw(5) + "png" + raw(-1) + le32(3));
    for (std::size_t size = 0; size < whole.size(); ++size)
        EXPECT_FALSE(hasRoomForCursorFields(whole.substr(0, size), 2)) << size;
    EXPECT_FALSE(hasRoomForCursorFields(cursorEntry(36, 16, le32(0xffffffff) + raw(4) + raw(5) + "pngs"), 2));
    EXPECT_FALSE(hasRoomForCursorFields(cursorEntry(24, 4, raw(4)), 1)) << "half a hot spot";
}

TEST(DecodeEntry, ReadsACursorImageOfTheFirstVersionWithoutADataPart) {
    const auto decoded = decodeEntry<CursorImage>(cursorEntry(20, 0, ""), 1);
    ASSERT_TRUE(decoded);
    EXPECT_EQ(decoded->value.uniqueId, 7U);
    EXPECT_EQ(decoded->value.imageData, nullptr);
}

TEST(DecodeEntry, LeavesOutAnImageLargerThanItsRecord) {
    const auto decoded = decodeEntry<CursorImage>(cursorEntry(36, 16, le32(0xffffffff) + raw(4) + raw(5) + "pngs"), 2);
    ASSERT_TRUE(decoded);
    EXPECT_EQ(decoded->value.imageData, nullptr);
    EXPECT_EQ(decoded->value.imageDataSize, 0U);
}

} // namespace
} // namespace ZULMetaData::Test
