#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <sstream>

namespace ZULMetaData {

namespace {

using namespace Test;

const std::string s_locationHeader = streamHeader("2b7b6af2", 1, 16);

class StreamWriter : public testing::Test {
protected:
    std::string onDisk() const { return contentsOf(path); }

    TemporaryFolder folder;
    std::string path = folder / "Stream.dat";
    MetaDataWriter<Point, int, int> writer;
};

template <class T>
std::string entryOf(double time, const T& value, int version = 1) {
    std::ostringstream stream;
    metaDataWrite<T>(time, value, stream, version);
    return stream.str();
}

template <class T>
concept CanBeWritten = requires(const T& value, std::ostream& stream) {
    metaDataWrite<T>(0.0, value, stream, 1);
};

static_assert(CanBeWritten<Point> && CanBeWritten<std::list<std::string>>);
static_assert(!CanBeWritten<long> && !CanBeWritten<std::vector<int>> && !CanBeWritten<bool>);

TEST_F(StreamWriter, InitWritesAndFlushesTheHeader) {
    writer.init(path, s_cursorLocationUUID, 1);
    EXPECT_EQ(onDisk(), s_locationHeader);
}

TEST_F(StreamWriter, InitReplacesAnExistingFile) {
    writeFile(path, std::string(1000, 'x'));
    writer.init(path, s_cursorLocationUUID, 7);
    EXPECT_EQ(onDisk(), streamHeader("2b7b6af2", 7, 16));
}

TEST_F(StreamWriter, AStreamOfOneRectTakes48Bytes) {
    MetaDataWriter<Rect, int, int> rects;
    rects.init(path, s_hoverRectUUID, 1);
    rects.write(1.5, Rect(1, 2, 3, -4), true);
    EXPECT_EQ(onDisk(), streamHeader("2b7b6a09", 1, 24) + f64(1.5) + hex("01000000 02000000 03000000 fcffffff"));
}

TEST_F(StreamWriter, AFlushedEntryCanBeReadAtOnce) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.write(0.25, Point(10, -4), true);
    EXPECT_EQ(onDisk(), s_locationHeader + f64(0.25) + hex("0a000000 fcffffff"));
}

TEST_F(StreamWriter, AnEntryThatIsNotFlushedComesWithTheNextFlush) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), false);
    EXPECT_EQ(onDisk(), s_locationHeader);
    writer.write(2, Point(2, 2), true);
    EXPECT_EQ(onDisk().size(), 24U + 32U);
}

TEST_F(StreamWriter, ClosingWritesWhatWasNotFlushed) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), false);
    writer.close();
    EXPECT_EQ(onDisk().size(), 24U + 16U);
}

TEST_F(StreamWriter, DestructionCloses) {
    {
        MetaDataWriter<Point, int, int> shortLived;
        shortLived.init(path, s_cursorLocationUUID, 1);
        shortLived.write(1, Point(1, 1), false);
    }
    EXPECT_EQ(onDisk().size(), 24U + 16U);
}

TEST_F(StreamWriter, ManyEntriesLieBackToBack) {
    writer.init(path, s_cursorLocationUUID, 1);
    std::string expected = s_locationHeader;
    for (int i = 0; i < 20000; ++i) {
        writer.write(i, Point(i, -i), false);
        expected += f64(i) + le32(static_cast<std::uint32_t>(i)) + le32(static_cast<std::uint32_t>(-i));
    }
    writer.close();
    EXPECT_EQ(onDisk(), expected);
}

TEST_F(StreamWriter, BytesAddedThroughTheStreamStandBetweenTheEntries) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), false);
    writer.getStream() << "between";
    writer.write(2, Point(2, 2), false);
    writer.close();
    EXPECT_EQ(onDisk().substr(24 + 16, 7), "between");
    EXPECT_EQ(onDisk().size(), 24U + 16U + 7U + 16U);
}

TEST_F(StreamWriter, FlushesEveryEntryOfAStreamThatAsksForIt) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.getStream() << std::unitbuf;
    writer.write(1, Point(1, 1), false);
    EXPECT_EQ(onDisk().size(), 24U + 16U);
}

TEST_F(StreamWriter, ClosingTwiceOrBeforeInitDoesNothing) {
    writer.close();
    EXPECT_TRUE(writer.getStream().good());
    writer.init(path, s_cursorLocationUUID, 1);
    writer.close();
    writer.close();
    EXPECT_TRUE(writer.getStream().good());
}

TEST_F(StreamWriter, AnEntryAfterCloseIsLostAndLeavesTheFileAlone) {
    writer.init(path, s_cursorLocationUUID, 1);
    writer.close();
    writer.write(1, Point(1, 1), true);
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_EQ(onDisk(), s_locationHeader);
}

TEST_F(StreamWriter, AFileThatCannotBeOpenedShowsInTheStreamAlone) {
    writer.init(folder / "no/such/folder.dat", s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), true);
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_FALSE(std::filesystem::exists(folder / "no"));
}

TEST_F(StreamWriter, AFullDiskShowsInTheStream) {
    writer.init("/dev/full", s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), true);
    EXPECT_TRUE(writer.getStream().fail());
}

TEST_F(StreamWriter, CanBeInitialisedAgainAfterClose) {
    writer.init(folder / "First.dat", s_cursorLocationUUID, 1);
    writer.close();
    writer.init(path, s_cursorLocationUUID, 1);
    writer.write(1, Point(1, 1), true);
    EXPECT_EQ(onDisk().size(), 24U + 16U);
    EXPECT_EQ(contentsOf(folder / "First.dat"), s_locationHeader);
}

TEST_F(StreamWriter, CarriesItsVersionIntoCursorImageEntries) {
    MetaDataWriter<CursorImage, int, int> images;
    images.init(path, s_cursorImageUUID, 1);
    images.write(2.5, CursorImage(), true);
    EXPECT_EQ(onDisk(), streamHeader("2b7b6af1", 1, 0) + le32(20) + f64(2.5) + le64(0) + le32(0));
}

TEST(EntryBytes, TheEmptyStringIsItsSizeAndTime) {
    EXPECT_EQ(entryOf<std::string>(3.5, ""), le32(8) + f64(3.5));
}

TEST(EntryBytes, AStringIsNeitherTerminatedNorEncoded) {
    EXPECT_EQ(entryOf<std::string>(1.0, std::string("a\0\xff", 3)), le32(11) + f64(1.0) + hex("61 00 ff"));
}

TEST(EntryBytes, AListRepeatsItsTimeInEveryElement) {
    EXPECT_EQ(entryOf<std::list<std::string>>(5.0, {"a", "bc"}),
              le32(31) + le32(2) + le32(9) + f64(5.0) + "a" + le32(10) + f64(5.0) + "bc");
}

TEST(EntryBytes, AnEmptyListIsItsTotalAndCount) {
    EXPECT_EQ(entryOf<std::list<std::string>>(5.0, {}), le32(4) + le32(0));
}

TEST(EntryBytes, LongStringsAndListsComeWhole) {
    const std::string text(100'000, 'x');
    EXPECT_EQ(entryOf<std::string>(1.0, text), le32(100'008) + f64(1.0) + text);
    EXPECT_EQ(entryOf<std::list<std::string>>(1.0, {text, text}).size(), 8U + 2 * (12U + 100'000U));
}

TEST(EntrySizes, AreTimeAndValueOrNone) {
    EXPECT_EQ(metaDataFixedEntrySize<Point>(), 16U);
    EXPECT_EQ(metaDataFixedEntrySize<Rect>(), 24U);
    EXPECT_EQ(metaDataFixedEntrySize<KeyStroke>(), 16U);
    EXPECT_EQ(metaDataFixedEntrySize<int>(), 12U);
    EXPECT_EQ(metaDataFixedEntrySize<float>(), 12U);
    EXPECT_EQ(metaDataFixedEntrySize<double>(), 16U);
    EXPECT_EQ(metaDataFixedEntrySize<std::string>(), 0U);
    EXPECT_EQ(metaDataFixedEntrySize<std::list<std::string>>(), 0U);
    EXPECT_EQ(metaDataFixedEntrySize<CursorImage>(), 0U);
}

} // namespace

} // namespace ZULMetaData
