// Stream files, byte by byte, and when those bytes reach the disk.

#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/FileSizeLimit.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaData/CursorImageSamples.h"

#include <gtest/gtest.h>

#include <csignal>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <list>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>

namespace ZULMetaData::Test {

namespace {

template <class T>
using Writer = MetaDataWriter<T, int, int>;

class StreamFile : public testing::Test {
protected:
    TemporaryFolder folder;
    const std::string path = folder / "Stream.dat";

    /// As another program sees it at this moment.
    std::string stored() const { return contentsOf(path); }

    template <class T>
    std::string streamOf(const uuid& kind, int version, double time, const T& value) {
        Writer<T> writer;
        writer.init(path, kind, version);
        writer.write(time, value, false);
        writer.close();
        return stored();
    }
};

// ---- The layout of every value type ---------------------------------------------------------------------------

TEST_F(StreamFile, OfPoints) {
    EXPECT_EQ(streamOf(s_cursorLocationUUID, 1, 0.25, Point(10, -4)),
              hex("2b7b6af2 7a1f 11e2 83d0 0017f200be7f 01000000 10000000") +
                  hex("000000000000d03f 0a000000 fcffffff"));
}

TEST_F(StreamFile, OfRects) {
    const std::string stream = streamOf(s_hoverRectUUID, 1, 5.0, Rect(1, -2, 300, 70000));
    EXPECT_EQ(stream, hex("2b7b6a09 7a1f 11e2 83d0 0017f200be7f 01000000 18000000") +
                          hex("0000000000001440 01000000 feffffff 2c010000 70110100"));
    EXPECT_EQ(stream.size(), 48U);
}

TEST_F(StreamFile, OfKeyStrokes) {
    EXPECT_EQ(streamOf(s_keyboardActionUUID, 1, 1.5, KeyStroke(0x61, 0x00100108)),
              hex("2b7b6af5 7a1f 11e2 83d0 0017f200be7f 01000000 10000000") +
                  hex("000000000000f83f 61000000 08011000"));
}

TEST_F(StreamFile, OfIntegers) {
    EXPECT_EQ(streamOf(s_cursorActionUUID, 1, -1.0, -2),
              hex("2b7b6af0 7a1f 11e2 83d0 0017f200be7f 01000000 0c000000") + hex("000000000000f0bf feffffff"));
}

TEST_F(StreamFile, OfFloats) {
    EXPECT_EQ(streamOf(s_cpuUsageUUID, 1, 0.25, 0.5F),
              hex("2b7b6a08 7a1f 11e2 83d0 0017f200be7f 01000000 0c000000") + hex("000000000000d03f 0000003f"));
}

TEST_F(StreamFile, OfDoubles) {
    EXPECT_EQ(streamOf(s_cursorOpacityUUID, 1, 0.25, 0.75),
              hex("2b7b6af3 7a1f 11e2 83d0 0017f200be7f 01000000 10000000") + hex("000000000000d03f 000000000000e83f"));
}

TEST_F(StreamFile, OfStrings) {
    EXPECT_EQ(streamOf(s_topmostAppNameUUID, 1, 5.0, std::string("Notes")),
              hex("2b7b6a06 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                  hex("0d000000 0000000000001440 4e6f746573"));
}

TEST_F(StreamFile, OfAnEmptyString) {
    EXPECT_EQ(streamOf(s_topmostAppNameUUID, 1, 5.0, std::string()),
              hex("2b7b6a06 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") + hex("08000000 0000000000001440"));
}

TEST_F(StreamFile, OfStringsHoldsTheirBytesAsTheyAre) {
    EXPECT_EQ(streamOf(s_topmostAppNameUUID, 1, 5.0, std::string("\0\n\xff\xc3\xbc", 5)),
              hex("2b7b6a06 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                  hex("0d000000 0000000000001440 000affc3bc"));
}

TEST_F(StreamFile, OfListsOfStrings) {
    EXPECT_EQ(streamOf(s_systemDataUUID, 1, 5.0, std::list<std::string>{"a", "bc"}),
              hex("2b7b6afc 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                  hex("1f000000 02000000 09000000 0000000000001440 61 0a000000 0000000000001440 6263"));
}

TEST_F(StreamFile, OfAListOfNoStrings) {
    EXPECT_EQ(streamOf(s_systemDataUUID, 1, 5.0, std::list<std::string>()),
              hex("2b7b6afc 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") + hex("04000000 00000000"));
}

TEST_F(StreamFile, OfAListOfEmptyStrings) {
    EXPECT_EQ(streamOf(s_systemDataUUID, 1, 5.0, std::list<std::string>{"", ""}),
              hex("2b7b6afc 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                  hex("1c000000 02000000 08000000 0000000000001440 08000000 0000000000001440"));
}

TEST_F(StreamFile, OfCursorImages) {
    EXPECT_EQ(streamOf(s_cursorImageUUID, 2, 0.25, arrow("PNG!")),
              hex("2b7b6af1 7a1f 11e2 83d0 0017f200be7f 02000000 00000000") +
                  hex("2c000000 000000000000d03f 0700000000000000 18000000"
                      "04000000 03000000 feffffff 504e4721 05000000 01000000"));
}

TEST_F(StreamFile, OfCursorImagesThatCameBefore) {
    EXPECT_EQ(streamOf(s_cursorImageUUID, 2, 0.25, arrow()),
              hex("2b7b6af1 7a1f 11e2 83d0 0017f200be7f 02000000 00000000") +
                  hex("1c000000 000000000000d03f 0700000000000000 08000000 00000000 01000000"));
}

TEST_F(StreamFile, OfCursorImagesInTheVersionOfTheStream) {
    EXPECT_EQ(streamOf(s_cursorImageUUID, 1, 0.25, arrow("PNG!")),
              hex("2b7b6af1 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                  hex("20000000 000000000000d03f 0700000000000000 0c000000 03000000 feffffff 504e4721"));
}

TEST_F(StreamFile, HoldsItsEntriesOneBehindTheOther) {
    Writer<std::string> writer;
    writer.init(path, s_slideTextUUID, 1);
    for (const char* text : {"a", "", "bc"})
        writer.write(0.25, text, false);
    writer.close();
    EXPECT_EQ(stored(), hex("2b7b6af9 7a1f 11e2 83d0 0017f200be7f 01000000 00000000") +
                            hex("09000000 000000000000d03f 61") + hex("08000000 000000000000d03f") +
                            hex("0a000000 000000000000d03f 6263"));
}

TEST_F(StreamFile, NamesAnyKindAndVersion) {
    Writer<Point>().init(path, uuid{}, -3);
    EXPECT_EQ(stored(), std::string(16, '\0') + hex("fdffffff 10000000"));
}

// ---- Encoding one entry ---------------------------------------------------------------------------------------

template <class T>
std::string encoded(double time, const T& value, int version = 1) {
    std::ostringstream out;
    metaDataWrite<T>(time, value, out, version);
    return out.str();
}

TEST(EncodedEntry, IsThatOfTheFile) {
    EXPECT_EQ(encoded<std::string>(5.0, "Notes"), hex("0d000000 0000000000001440 4e6f746573"));
    EXPECT_EQ(encoded<std::list<std::string>>(5.0, {"a"}), hex("11000000 01000000 09000000 0000000000001440 61"));
    EXPECT_EQ(encoded(0.25, arrow(), 1), hex("14000000 000000000000d03f 0700000000000000 00000000"));
    EXPECT_EQ(encoded(0.25, Point(10, -4)), hex("000000000000d03f 0a000000 fcffffff"));
}

TEST(EncodedEntry, OfATextIsTheSameInEveryVersion) {
    for (const int version : {-1, 0, 1, 2, 100})
        EXPECT_EQ(encoded<std::string>(5.0, "Notes", version), hex("0d000000 0000000000001440 4e6f746573"));
}

TEST(EncodedEntry, IsLostInAStreamThatFailed) {
    std::ostringstream out;
    out.setstate(std::ios_base::failbit);
    metaDataWrite<std::string>(5.0, "Notes", out, 1);
    EXPECT_EQ(out.str(), "");
}

template <class T>
concept Encodable = requires {
    metaDataFixedEntrySize<T>();
};

TEST(FixedEntrySize, CountsTheTimeAndTheValue) {
    EXPECT_EQ(metaDataFixedEntrySize<Point>(), 16U);
    EXPECT_EQ(metaDataFixedEntrySize<Rect>(), 24U);
    EXPECT_EQ(metaDataFixedEntrySize<KeyStroke>(), 16U);
    EXPECT_EQ(metaDataFixedEntrySize<int>(), 12U);
    EXPECT_EQ(metaDataFixedEntrySize<float>(), 12U);
    EXPECT_EQ(metaDataFixedEntrySize<double>(), 16U);
}

TEST(FixedEntrySize, IsNoneWhereEntriesVary) {
    EXPECT_EQ(metaDataFixedEntrySize<std::string>(), 0U);
    EXPECT_EQ(metaDataFixedEntrySize<std::list<std::string>>(), 0U);
    EXPECT_EQ(metaDataFixedEntrySize<CursorImage>(), 0U);
}

TEST(FixedEntrySize, IsNotToBeHadForOtherTypes) {
    EXPECT_TRUE(Encodable<Point>);
    EXPECT_FALSE(Encodable<std::int64_t>);
    EXPECT_FALSE(Encodable<bool>);
    EXPECT_FALSE(Encodable<const char*>);
    EXPECT_FALSE((Encodable<std::pair<int, int>>));
}

// ---- From opening to closing ----------------------------------------------------------------------------------

class StreamWriter : public StreamFile {
protected:
    const std::string header = hex("2b7b6af2 7a1f 11e2 83d0 0017f200be7f 01000000 10000000");
    const std::string entry = hex("000000000000d03f 0a000000 fcffffff");
    Writer<Point> writer;

    void open() { writer.init(path, s_cursorLocationUUID, 1); }
    void write(bool flush) { writer.write(0.25, Point(10, -4), flush); }
};

TEST_F(StreamWriter, BeginsIdle) {
    EXPECT_FALSE(writer.getStream().is_open());
    EXPECT_TRUE(writer.getStream().good());
}

TEST_F(StreamWriter, CreatesTheFileWithAHeaderThatIsThereAtOnce) {
    open();
    EXPECT_TRUE(writer.getStream().is_open());
    EXPECT_EQ(stored(), header);
}

TEST_F(StreamWriter, ReplacesAFile) {
    writeFile(path, std::string(1000, 'x'));
    open();
    writer.close();
    EXPECT_EQ(stored(), header);
}

TEST_F(StreamWriter, KeepsAnEntryBackThatIsNotFlushed) {
    open();
    write(false);
    EXPECT_EQ(stored(), header);
}

TEST_F(StreamWriter, FlushesAllEntriesUpToTheOneThatAsksForIt) {
    open();
    write(false);
    write(true);
    EXPECT_EQ(stored(), header + entry + entry);
    write(false);
    EXPECT_EQ(stored(), header + entry + entry);
}

TEST_F(StreamWriter, FlushesEntriesThatVaryInSize) {
    Writer<std::string> texts;
    texts.init(path, s_slideTextUUID, 1);
    texts.write(5.0, "Notes", true);
    EXPECT_EQ(stored().substr(24), hex("0d000000 0000000000001440 4e6f746573"));
}

TEST_F(StreamWriter, WritesWhatIsLeftWhenItCloses) {
    open();
    write(false);
    writer.close();
    EXPECT_FALSE(writer.getStream().is_open());
    EXPECT_TRUE(writer.getStream().good());
    EXPECT_EQ(stored(), header + entry);
}

TEST_F(StreamWriter, ClosesWhenItIsDestroyed) {
    {
        Writer<Point> shortLived;
        shortLived.init(path, s_cursorLocationUUID, 1);
        shortLived.write(0.25, Point(10, -4), false);
    }
    EXPECT_EQ(stored(), header + entry);
}

TEST_F(StreamWriter, MayBeClosedTwiceAndBeforeItOpens) {
    writer.close();
    EXPECT_TRUE(writer.getStream().good());
    open();
    writer.close();
    writer.close();
    EXPECT_TRUE(writer.getStream().good());
    EXPECT_EQ(stored(), header);
}

TEST_F(StreamWriter, LosesEntriesBehindTheEnd) {
    open();
    write(true);
    writer.close();
    write(true);
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_EQ(stored(), header + entry);
}

TEST_F(StreamWriter, LosesEntriesBeforeItOpens) {
    write(true);
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(StreamWriter, FailsSilentlyWhereThereIsNoFolder) {
    testing::internal::CaptureStdout();
    testing::internal::CaptureStderr();
    writer.init(folder / "no folder/Stream.dat", s_cursorLocationUUID, 1);
    write(true);
    writer.close();
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_FALSE(writer.getStream().is_open());
    EXPECT_EQ(testing::internal::GetCapturedStdout() + testing::internal::GetCapturedStderr(), "");
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(StreamWriter, FailsWhereTheDiskIsFull) {
    FileSizeLimit limit(header.size() + 8);
    open();
    EXPECT_TRUE(writer.getStream().good());
    write(true);
    EXPECT_TRUE(writer.getStream().fail());
}

TEST_F(StreamWriter, FailsWhereTheLastBytesCannotBeWrittenOnClosing) {
    FileSizeLimit limit(header.size());
    open();
    write(false);
    EXPECT_TRUE(writer.getStream().good());
    writer.close();
    EXPECT_TRUE(writer.getStream().fail());
}

TEST_F(StreamWriter, WritesNothingTwiceWhereTheDiskHasRoomAgain) {
    open();
    {
        FileSizeLimit limit(header.size() + 8);
        write(true);
    }
    writer.close();
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_TRUE(stored() == header + entry.substr(0, 8));
}

TEST_F(StreamWriter, KeepsTheBeginningOfTheStreamWhereTheDiskFillsUp) {
    constexpr std::size_t room = 200000;
    FileSizeLimit limit(room);
    open();
    std::string whole = header;
    for (int index = 0; index < 20000; ++index, whole += entry)
        write(false);
    writer.close();
    EXPECT_TRUE(writer.getStream().fail());
    EXPECT_TRUE(stored() == whole.substr(0, room));
}

using StreamWriterDeathTest = StreamWriter;

TEST_F(StreamWriterDeathTest, EndsTheProcessWhereClosingThrowsInTheDestructor) {
    const auto destroyWriterThatCannotClose = [this] {
        FileSizeLimit limit(header.size());
        Writer<Point> shortLived;
        shortLived.init(path, s_cursorLocationUUID, 1);
        shortLived.write(0.25, Point(10, -4), false);
        shortLived.getStream().exceptions(std::ios_base::failbit);
    };
    EXPECT_EXIT(destroyWriterThatCannotClose(), testing::KilledBySignal(SIGABRT), "");
}

// ---- The header and the stream on their own -------------------------------------------------------------------

TEST_F(StreamWriter, WritesAHeaderOnRequestAndFlushesIt) {
    open();
    writer.writeHeader(s_hoverRectUUID, 7);
    EXPECT_EQ(stored(), header + hex("2b7b6a09 7a1f 11e2 83d0 0017f200be7f 07000000 10000000"));
}

TEST_F(StreamWriter, KeepsTheVersionItWasOpenedWith) {
    Writer<CursorImage> images;
    images.init(path, s_cursorImageUUID, 1);
    images.writeHeader(s_cursorImageUUID, 2);
    images.write(0.25, arrow(), true);
    EXPECT_EQ(stored().substr(48), hex("14000000 000000000000d03f 0700000000000000 00000000"));
}

TEST_F(StreamWriter, LetsItsStreamTakeOtherBytes) {
    open();
    std::ofstream& stream = writer.getStream();
    stream << "abc";
    write(true);
    EXPECT_EQ(stored(), header + "abc" + entry);
}

TEST_F(StreamWriter, LetsItsStreamFlushByItself) {
    open();
    writer.getStream() << std::unitbuf;
    write(false);
    EXPECT_EQ(stored(), header + entry);
}

TEST_F(StreamWriter, LosesNothingWhereItIsOpenedAgainWithoutHavingBeenClosed) {
    open();
    write(false);
    writer.init(folder / "Other.dat", s_hoverRectUUID, 1);
    EXPECT_TRUE(writer.getStream().fail());
    writer.close();
    EXPECT_EQ(stored(), header + entry);
}

TEST_F(StreamWriter, MayBeginAnotherFileWhenItWasClosed) {
    open();
    write(false);
    writer.close();
    writer.init(folder / "Other.dat", s_scrollActionUUID, 1);
    write(true);
    EXPECT_EQ(stored(), header + entry);
    EXPECT_EQ(contentsOf(folder / "Other.dat"), hex("2b7b6a05 7a1f 11e2 83d0 0017f200be7f 01000000 10000000") + entry);
}

TEST_F(StreamWriter, GivesItsStreamThroughItsOnlyVirtualOperation) {
    struct OtherStream final : Writer<Point> {
        std::ofstream other;
        std::ofstream& getStream() override { return other; }
    } derived;
    Writer<Point>& base = derived;
    EXPECT_EQ(&base.getStream(), &derived.other);
    EXPECT_TRUE(std::is_polymorphic_v<Writer<Point>>);
    EXPECT_FALSE(std::has_virtual_destructor_v<Writer<Point>>);
}

} // namespace

} // namespace ZULMetaData::Test
