// Cursor image entries, byte by byte in both directions, and what is made of hostile ones.

#include "ZULMetaData/CursorImageWriter.h"
#include "ZULMetaData/StreamEntries.h"
#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/MemoryWatch.h"
#include "Tests/ZULMetaData/CursorImageSamples.h"
#include "Tests/ZULMetaData/ReadStream.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <ios>
#include <new>
#include <sstream>
#include <stdexcept>
#include <streambuf>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;

/// An arrow with the image "PNG!" at 0.25 s, then one without.
const std::string s_arrowV2 = hex("2c000000 000000000000d03f 0700000000000000 18000000"
                                  "04000000 03000000 feffffff 504e4721 05000000 01000000");
const std::string s_bareV2 = hex("1c000000 000000000000d03f 0700000000000000 08000000 00000000 01000000");
const std::string s_arrowV1 = hex("20000000 000000000000d03f 0700000000000000 0c000000 03000000 feffffff 504e4721");
const std::string s_bareV1 = hex("14000000 000000000000d03f 0700000000000000 00000000");

/// What comes of them.
const std::string s_readArrow = "id 7, hotspot 3 -2, type 5, flags 1, 4 bytes 504e4721";
const std::string s_readBare = "id 7, hotspot 0 0, type -1, flags 1, no image";
const std::string s_readArrowV1 = "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e4721";
const std::string s_readNothing = "id 7, hotspot 0 0, type -1, flags 3, no image";

// ---- Writing --------------------------------------------------------------------------------------------------

std::string written(const CursorImage& image, int version) {
    std::ostringstream out;
    metaDataWrite<CursorImage>(0.25, image, out, version);
    return out.str();
}

TEST(WrittenRecord, OfVersionTwo) {
    EXPECT_EQ(hexDigits(written(arrow("PNG!"), 2)), hexDigits(s_arrowV2));
}

TEST(WrittenRecord, OfVersionTwoWithoutAnImage) {
    EXPECT_EQ(hexDigits(written(arrow(), 2)), hexDigits(s_bareV2));
}

TEST(WrittenRecord, OfVersionOne) {
    EXPECT_EQ(hexDigits(written(arrow("PNG!"), 1)), hexDigits(s_arrowV1));
}

TEST(WrittenRecord, OfVersionOneWithoutAnImage) {
    EXPECT_EQ(hexDigits(written(arrow(), 1)), hexDigits(s_bareV1));
}

TEST(WrittenRecord, OfLaterVersionsIsThatOfVersionTwo) {
    for (const int version : {3, 99})
        EXPECT_EQ(hexDigits(written(arrow("PNG!"), version)), hexDigits(s_arrowV2)) << version;
}

TEST(WrittenRecord, OfVersionsWithoutFieldsIsNothing) {
    for (const int version : {0, -1, 100})
        EXPECT_EQ(written(arrow("PNG!"), version), "") << version;
}

TEST(WrittenRecord, HasZerosForBytesThatAreMissingAndLeavesTheOriginalAlone) {
    MemoryWatch memory;
    const CursorImage image = arrowWithoutItsBytes(4);
    EXPECT_EQ(hexDigits(written(image, 2)), hexDigits(hex("2c000000 000000000000d03f 0700000000000000 18000000"
                                                          "04000000 03000000 feffffff 00000000 05000000 01000000")));
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(image.imageDataSize, 4U);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(WrittenRecord, HasZerosForBytesThatAreMissingEvenWhereMemoryRanOut) {
    std::ostringstream out(std::string(0x110000, '?')); // which has all the room it needs
    {
        MemoryWatch memory;
        memory.refuseAbove(0xfffff);
        metaDataWrite<CursorImage>(0.25, arrowWithoutItsBytes(0x100000), out, 2);
        EXPECT_EQ(memory.largestRequest(), 0x100000U);
    }
    EXPECT_EQ(out.tellp(), 0x10002c);
    EXPECT_TRUE(out.str().substr(0, 0x10002c) ==
                hex("28001000 000000000000d03f 0700000000000000 14001000 00001000 03000000 feffffff") +
                    std::string(0x100000, '\0') + hex("05000000 01000000"));
}

TEST(WrittenRecord, LeavesTheOriginalItsBytes) {
    const CursorImage image = arrow("PNG!");
    const unsigned char* const bytes = image.imageData;
    written(image, 2);
    EXPECT_EQ(image.imageData, bytes);
    EXPECT_EQ(asText(image), s_readArrow);
}

/// A device without room.
class FullBuffer : public std::streambuf {
protected:
    int_type overflow(int_type) override { throw std::runtime_error("no room"); }
};

TEST(WrittenRecord, LeavesTheOriginalItsBytesWhereTheOutputThrows) {
    const CursorImage image = arrow("PNG!");
    FullBuffer buffer;
    std::ostream out(&buffer);
    out.exceptions(std::ios_base::badbit);
    EXPECT_THROW(metaDataWrite<CursorImage>(0.25, image, out, 2), std::runtime_error);
    EXPECT_EQ(asText(image), s_readArrow);
}

// ---- Reading --------------------------------------------------------------------------------------------------

/// One entry, read into an image, and where it ended.
struct ReadRecord {
    double time = -1.0;
    CursorImage image;
    std::string error;
    std::streamoff end = -1;

    ReadRecord(const std::string& bytes, int version, const CursorImage& before = CursorImage()) : image(before) {
        std::istringstream stream(bytes);
        try {
            metaDataRead<CursorImage>(stream, &time, &image, version);
        } catch (const std::runtime_error& exception) {
            error = exception.what();
        }
        stream.clear();
        end = stream.tellg();
    }

    std::string text() const { return error.empty() ? asText(image) : error; }
};

TEST(ReadRecord, OfVersionTwo) {
    EXPECT_EQ(ReadRecord(s_arrowV2, 2).text(), s_readArrow);
    EXPECT_EQ(ReadRecord(s_arrowV2, 2).time, 0.25);
}

TEST(ReadRecord, OfVersionTwoWithoutAnImage) {
    EXPECT_EQ(ReadRecord(s_bareV2, 2).text(), s_readBare);
    EXPECT_EQ(ReadRecord(s_bareV2, 2).time, 0.25);
}

TEST(ReadRecord, OfVersionOne) {
    EXPECT_EQ(ReadRecord(s_arrowV1, 1).text(), s_readArrowV1);
    EXPECT_EQ(ReadRecord(s_arrowV1, 1).time, 0.25);
}

TEST(ReadRecord, OfVersionOneWithoutAnImage) {
    EXPECT_EQ(ReadRecord(s_bareV1, 1).text(), s_readNothing);
    EXPECT_EQ(ReadRecord(s_bareV1, 1).time, 0.25);
}

TEST(ReadRecord, OfLaterVersionsIsThatOfVersionTwo) {
    for (const int version : {3, 99})
        EXPECT_EQ(ReadRecord(s_arrowV2, version).text(), s_readArrow) << version;
}

TEST(ReadRecord, OfVersionsWithoutFieldsTakesNothing) {
    for (const int version : {0, -1, 100}) {
        const ReadRecord record(s_arrowV2, version);
        EXPECT_EQ(record.text(), "id 0, hotspot 0 0, type -1, flags 3, no image") << version;
        EXPECT_EQ(record.time, -1.0) << version;
        EXPECT_EQ(record.end, 0) << version;
    }
}

TEST(ReadRecord, OfVersionTwoTakenForVersionOneHasItsSizeAsHotSpot) {
    const ReadRecord record(s_arrowV2, 1);
    EXPECT_EQ(record.text(), "id 7, hotspot 4 3, type -1, flags 3, 16 bytes feffffff504e47210500000001000000");
    EXPECT_EQ(record.end, 48);
}

TEST(ReadRecord, DoesNotNeedTheEntrySize) {
    for (const std::uint32_t entrySize : {0U, 1U, 0xffffffffU}) {
        const ReadRecord record(le32(entrySize) + s_arrowV2.substr(4) + "next", 2);
        EXPECT_EQ(record.text(), s_readArrow) << entrySize;
        EXPECT_EQ(record.end, 48) << entrySize;
    }
}

TEST(ReadRecord, ReplacesTheImageThatWasThere) {
    MemoryWatch memory;
    {
        const CursorImage before = cursorImage(1, 1, 1, 1, 8, "old image");
        EXPECT_EQ(ReadRecord(s_arrowV2, 2, before).text(), s_readArrow);
        EXPECT_EQ(ReadRecord(s_arrowV1, 1, before).text(), "id 7, hotspot 3 -2, type 1, flags 8, 4 bytes 504e4721");
        EXPECT_EQ(memory.blocks(), 1);
    }
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(ReadRecord, ReleasesTheImageThatWasThereWhereItHasNone) {
    const CursorImage before = cursorImage(1, 1, 1, 1, 8, "old image");
    EXPECT_EQ(ReadRecord(s_bareV2, 2, before).text(), "id 7, hotspot 1 1, type 1, flags 1, no image");
    EXPECT_EQ(ReadRecord(s_bareV1, 1, before).text(), "id 7, hotspot 1 1, type 1, flags 8, no image");
    EXPECT_EQ(ReadRecord("", 100, before).text(), "id 1, hotspot 1 1, type 1, flags 8, no image");
}

TEST(ReadRecord, ThatEndsWithTheInputIsWholeAndTheNextIsInvalid) {
    std::istringstream stream(s_arrowV2);
    double time = 0;
    CursorImage image;
    metaDataRead<CursorImage>(stream, &time, &image, 2);
    EXPECT_EQ(asText(image), s_readArrow);
    EXPECT_TRUE(stream.good());
    EXPECT_THROW(metaDataRead<CursorImage>(stream, &time, &image, 2), InvalidEntry);
}

TEST(ReadRecord, AtTheReportedEndOfTheInputIsInvalidInEveryVersion) {
    for (const int version : {-1, 0, 1, 2, 100}) {
        std::istringstream stream;
        stream.setstate(std::ios_base::eofbit);
        double time = 0;
        CursorImage image;
        EXPECT_THROW(metaDataRead<CursorImage>(stream, &time, &image, version), InvalidEntry) << version;
    }
}

// ---- Data parts of any size -----------------------------------------------------------------------------------

/// An entry whose data part is `data`.
std::string recordOf(const std::string& data) {
    const auto size = static_cast<std::uint32_t>(data.size());
    return le32(20 + size) + hex("000000000000d03f 0700000000000000") + le32(size) + data;
}

/// What is read of it, with another entry behind it that must be found.
std::string readOf(const std::string& data, int version) {
    const std::string record = recordOf(data);
    const ReadRecord read(record + "next", version);
    EXPECT_EQ(read.end, static_cast<std::streamoff>(record.size()));
    return read.text();
}

TEST(DataPart, LongerThanItsFieldsIsSkippedToTheNextEntry) {
    const std::string later = s_arrowV2.substr(24) + "a later field";
    EXPECT_EQ(readOf(later, 2), s_readArrow);
    const Reading reading = readStream<CursorImage>(streamHeader("2b7b6af1", 2, 0) + recordOf(later) + s_bareV2);
    EXPECT_THAT(reading.entries, ElementsAre("000000000000d03f " + s_readArrow, "000000000000d03f " + s_readBare));
}

TEST(DataPart, LongerThanItsFieldsMayEndInsideWhatIsSkipped) {
    const std::string record = recordOf(s_arrowV2.substr(24) + "a later field");
    const std::string cut = record.substr(0, record.size() - 5);
    const Reading reading = readStream<CursorImage>(streamHeader("2b7b6af1", 2, 0) + cut);
    EXPECT_THAT(reading.entries, ElementsAre("000000000000d03f " + s_readArrow));
    EXPECT_EQ(reading.error, "");
}

TEST(DataPart, OfVersionTwoKeepsTheFieldsThatFitIntoIt) {
    const std::string whole = s_arrowV2.substr(24) + "more";
    const auto expect = [&whole](std::size_t first, std::size_t last, const std::string& text) {
        for (std::size_t size = first; size <= last; ++size)
            EXPECT_EQ(readOf(whole.substr(0, size), 2), text) << size;
    };
    expect(0, 3, "id 7, hotspot 0 0, type -1, flags 3, no image");
    expect(4, 7, "id 7, hotspot 0 0, type -1, flags 3, 4 bytes missing");
    expect(8, 11, "id 7, hotspot 3 0, type -1, flags 3, 4 bytes missing");
    expect(12, 12, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes missing");
    expect(13, 15, "id 7, hotspot 3 -2, type -1, flags 3, no image"); // does not fit, and leaves no size
    expect(16, 19, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e4721");
    expect(20, 23, "id 7, hotspot 3 -2, type 5, flags 3, 4 bytes 504e4721");
    expect(24, 28, "id 7, hotspot 3 -2, type 5, flags 1, 4 bytes 504e4721");
}

TEST(DataPart, OfVersionTwoWithoutAnImageKeepsTheFieldsThatFitIntoIt) {
    const std::string whole = s_bareV2.substr(24) + "more";
    for (std::size_t size = 0; size < 8; ++size)
        EXPECT_EQ(readOf(whole.substr(0, size), 2), s_readNothing) << size;
    for (std::size_t size = 8; size <= 12; ++size)
        EXPECT_EQ(readOf(whole.substr(0, size), 2), s_readBare) << size;
}

TEST(DataPart, OfVersionOneHasNoImageWithoutRoomBehindTheHotSpot) {
    MemoryWatch memory;
    const std::string whole = s_arrowV1.substr(24);
    for (std::size_t size = 0; size < 4; ++size)
        EXPECT_EQ(readOf(whole.substr(0, size), 1), s_readNothing) << size;
    for (std::size_t size = 4; size < 8; ++size)
        EXPECT_EQ(readOf(whole.substr(0, size), 1), "id 7, hotspot 3 0, type -1, flags 3, no image") << size;
    EXPECT_EQ(readOf(whole.substr(0, 8), 1), "id 7, hotspot 3 -2, type -1, flags 3, no image");
    EXPECT_LT(memory.largestRequest(), 0x10000U);
}

TEST(DataPart, OfVersionOneIsHotSpotAndImage) {
    const std::string whole = s_arrowV1.substr(24);
    EXPECT_EQ(readOf(whole.substr(0, 9), 1), "id 7, hotspot 3 -2, type -1, flags 3, 1 bytes 50");
    EXPECT_EQ(readOf(whole, 1), s_readArrowV1);
    EXPECT_EQ(readOf(whole + "more", 1), "id 7, hotspot 3 -2, type -1, flags 3, 8 bytes 504e47216d6f7265");
}

// ---- Images larger than what there is -------------------------------------------------------------------------

/// An entry of version 2 that ends behind two bytes of its image.
std::string tornImage(std::uint32_t dataSize, std::uint32_t imageSize) {
    return hex("00000000 000000000000d03f 0700000000000000") + le32(dataSize) + le32(imageSize) +
           hex("03000000 feffffff 504e");
}

TEST(ImageLargerThanItsDataPart, IsLeftOutWithItsSize) {
    MemoryWatch memory;
    const std::string promised = hex("03000000 feffffff") + "twelve bytes";
    for (const std::uint32_t size : {13U, 1000U, 0x7fffffffU, 0xffffffffU})
        EXPECT_EQ(readOf(le32(size) + promised, 2), "id 7, hotspot 3 -2, type -1, flags 3, no image") << size;
    EXPECT_LT(memory.largestRequest(), 0x10000U);
}

TEST(ImageLargerThanItsDataPart, IsNotAskedMemoryForHoweverLargeTheDataPartIs) {
    MemoryWatch memory;
    EXPECT_EQ(ReadRecord(tornImage(0xffffffff, 0xfffffff4), 2).text(),
              "id 7, hotspot 3 -2, type -1, flags 3, no image");
    EXPECT_LT(memory.largestRequest(), 0x10000U);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(ImageLargerThanTheInput, HasZerosBehindTheBytesThatAreThere) {
    EXPECT_EQ(ReadRecord(tornImage(20, 4), 2).text(), "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e0000");
    const ReadRecord large(tornImage(0x100010, 0x100000), 2);
    EXPECT_EQ(large.image.imageDataSize, 0x100000U);
    const std::string bytes(large.image.imageData, large.image.imageData + 0x100000);
    EXPECT_TRUE(bytes == "PN" + std::string(0x100000 - 2, '\0'));
}

TEST(ImageLargerThanTheInput, OfVersionOneHasZerosBehindTheBytesThatAreThere) {
    const std::string torn = hex("00000000 000000000000d03f 0700000000000000 0c000000 03000000 feffffff 504e");
    EXPECT_EQ(ReadRecord(torn, 1).text(), "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e0000");
}

TEST(ImageLargerThanMemory, IsLeftOutWithItsSize) {
    MemoryWatch memory;
    memory.refuseAbove(1U << 30);
    EXPECT_EQ(ReadRecord(tornImage(0xffffffff, 0xfffffff3), 2).text(),
              "id 7, hotspot 3 -2, type -1, flags 3, no image");
    const std::string torn = hex("00000000 000000000000d03f 0700000000000000 ffffffff 03000000 feffffff 504e");
    EXPECT_EQ(ReadRecord(torn, 1).text(), "id 7, hotspot 3 -2, type -1, flags 3, no image");
    EXPECT_EQ(memory.blocks(), 0);
}

/// An entry with an image of one MiB.
std::string largeRecord() {
    const std::string image(0x100000, 'x');
    return recordOf(le32(0x100000) + hex("03000000 feffffff") + image + hex("05000000 01000000"));
}

TEST(ImageLargerThanMemory, IsSkippedToTheNextEntry) {
    std::istringstream stream(largeRecord() + s_arrowV2);
    MemoryWatch memory;
    memory.refuseAbove(0xfffff);
    double time = 0;
    CursorImage read;
    metaDataRead<CursorImage>(stream, &time, &read, 2);
    EXPECT_EQ(asText(read), "id 7, hotspot 3 -2, type -1, flags 3, no image");
    metaDataRead<CursorImage>(stream, &time, &read, 2);
    EXPECT_EQ(asText(read), s_readArrow);
}

TEST(ImageLargerThanMemory, IsReportedByTheReader) {
    std::istringstream stream(s_arrowV2 + largeRecord());
    MemoryWatch memory;
    memory.refuseAbove(0xfffff);
    CursorImage image;
    double time = 0;
    Record record{image, time};
    CursorImageReader reader(2);
    reader.ReadCursorImageMetaData(stream, CursorImageSchema(2), record);
    EXPECT_FALSE(reader.hasRunOutOfMemory());
    reader.ReadCursorImageMetaData(stream, CursorImageSchema(2), record);
    EXPECT_TRUE(reader.hasRunOutOfMemory());
}

TEST(ImageLargerThanMemory, IsNotLeftOutOfADecodedEntry) {
    const std::string entry = largeRecord();
    EXPECT_EQ(decodeEntry<CursorImage>(entry, 2)->value.imageDataSize, 0x100000U);
    MemoryWatch memory;
    memory.refuseAbove(0xfffff);
    EXPECT_THROW(decodeEntry<CursorImage>(entry, 2), std::bad_alloc);
}

// ---- Entries cut at every byte --------------------------------------------------------------------------------

class CutRecord : public testing::Test {
protected:
    std::string whole;
    int version = 2;

    /// What is read where only `first` to `last` bytes are there.
    void expect(std::size_t first, std::size_t last, const std::string& text) const {
        for (std::size_t size = first; size <= last; ++size)
            EXPECT_EQ(ReadRecord(whole.substr(0, size), version).text(), text) << size;
    }
};

TEST_F(CutRecord, OfVersionTwoKeepsWhatIsThere) {
    whole = s_arrowV2;
    expect(0, 19, "invalid meta data entry");
    expect(20, 24, "id 7, hotspot 0 0, type -1, flags 3, no image");
    expect(25, 28, "id 7, hotspot 0 0, type -1, flags 3, 4 bytes missing");
    expect(29, 31, "id 7, hotspot 3 0, type -1, flags 3, 4 bytes missing");
    expect(32, 32, "id 7, hotspot 3 0, type -1, flags 3, no image");
    expect(33, 33, "id 7, hotspot 3 254, type -1, flags 3, no image");
    expect(34, 34, "id 7, hotspot 3 65534, type -1, flags 3, no image");
    expect(35, 35, "id 7, hotspot 3 16777214, type -1, flags 3, no image");
    expect(36, 36, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 00000000");
    expect(37, 37, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 50000000");
    expect(38, 38, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e0000");
    expect(39, 39, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e4700");
    expect(40, 40, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e4721");
    expect(41, 41, "id 7, hotspot 3 -2, type -251, flags 3, 4 bytes 504e4721");
    expect(42, 42, "id 7, hotspot 3 -2, type -65531, flags 3, 4 bytes 504e4721");
    expect(43, 43, "id 7, hotspot 3 -2, type -16777211, flags 3, 4 bytes 504e4721");
    expect(44, 44, "id 7, hotspot 3 -2, type 5, flags 3, 4 bytes 504e4721");
    expect(45, 48, "id 7, hotspot 3 -2, type 5, flags 1, 4 bytes 504e4721");
}

TEST_F(CutRecord, OfVersionTwoWithoutAnImageKeepsWhatIsThere) {
    whole = s_bareV2;
    expect(0, 19, "invalid meta data entry");
    expect(20, 28, s_readNothing);
    expect(29, 32, s_readBare);
}

TEST_F(CutRecord, OfVersionOneKeepsWhatIsThere) {
    whole = s_arrowV1;
    version = 1;
    expect(0, 19, "invalid meta data entry");
    expect(20, 24, s_readNothing);
    expect(25, 28, "id 7, hotspot 3 0, type -1, flags 3, no image");
    expect(29, 29, "id 7, hotspot 3 254, type -1, flags 3, no image");
    expect(30, 30, "id 7, hotspot 3 65534, type -1, flags 3, no image");
    expect(31, 31, "id 7, hotspot 3 16777214, type -1, flags 3, no image");
    expect(32, 32, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 00000000");
    expect(33, 33, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 50000000");
    expect(34, 34, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e0000");
    expect(35, 35, "id 7, hotspot 3 -2, type -1, flags 3, 4 bytes 504e4700");
    expect(36, 36, s_readArrowV1);
}

TEST_F(CutRecord, OfVersionOneWithoutAnImageKeepsWhatIsThere) {
    whole = s_bareV1;
    version = 1;
    expect(0, 19, "invalid meta data entry");
    expect(20, 24, s_readNothing);
}

TEST_F(CutRecord, ReleasesTheImageThatWasThereOnlyWithItsDataPart) {
    const CursorImage before = cursorImage(1, 1, 1, 1, 8, "old");
    EXPECT_EQ(asText(ReadRecord(s_arrowV2.substr(0, 19), 2, before).image),
              "id 7, hotspot 1 1, type 1, flags 8, 3 bytes 6f6c64");
    EXPECT_EQ(asText(ReadRecord(s_arrowV2.substr(0, 20), 2, before).image),
              "id 7, hotspot 1 1, type 1, flags 8, no image");
}

// ---- Writer and reader on their own ---------------------------------------------------------------------------

class RecordParts : public testing::Test {
protected:
    CursorImage image = arrow("PNG!");
    double time = 0.25;
    Record record{image, time};
    CursorImageSchema schema{2};
    std::ostringstream out;
    std::array<unsigned char, 8> bytes{'0', '1', '2', '3', '4', '5', '6', '7'};

    FieldInfo field(std::uint32_t size) { return {bytes.data(), size}; }
};

TEST_F(RecordParts, WriterWritesAndCountsFields) {
    CursorImageWriter writer(2);
    EXPECT_EQ(writer.bytesWritten(), 0U);
    writer.Write(out, field(3));
    writer.Write(out, field(0));
    writer.Write(out, {nullptr, 0});
    writer.Write(out, field(8));
    EXPECT_EQ(out.str(), "01201234567");
    EXPECT_EQ(writer.bytesWritten(), 11U);
}

TEST_F(RecordParts, WriterCountsWhetherTheOutputTakesTheBytesOrNot) {
    CursorImageWriter writer(2);
    out.setstate(std::ios_base::failbit);
    writer.Write(out, field(3));
    EXPECT_EQ(writer.bytesWritten(), 3U);
    EXPECT_EQ(out.str(), "");
}

TEST_F(RecordParts, WriterCountsEachEntryAnew) {
    CursorImageWriter writer(2);
    writer.Write(out, field(3));
    writer.WriteCursorImageMetaData(out, schema, record);
    EXPECT_EQ(writer.bytesWritten(), 48U);
    writer.WriteCursorImageMetaData(out, schema, record);
    EXPECT_EQ(writer.bytesWritten(), 48U);
    EXPECT_EQ(hexDigits(out.str()), hexDigits("012" + s_arrowV2 + s_arrowV2));
}

TEST_F(RecordParts, WriterFillsInTheSizesOfTheRecord) {
    CursorImageWriter(2).WriteCursorImageMetaData(out, schema, record);
    EXPECT_EQ(record.entrySize, 44U);
    EXPECT_EQ(record.justMetadataSize, 24U);
}

TEST_F(RecordParts, WriterWritesBaseInformationAndDataApart) {
    CursorImageWriter writer(2);
    record.entrySize = 0x01020304;
    record.justMetadataSize = 0x11121314;
    writer.WriteMetaDataFields(out, schema, record);
    EXPECT_EQ(hexDigits(out.str()), hexDigits(s_arrowV2.substr(24)));
    writer.WriteBaseInfo(out, schema, record);
    EXPECT_EQ(hexDigits(out.str().substr(24)), "04030201000000000000d03f070000000000000014131211");
    EXPECT_EQ(writer.bytesWritten(), 48U);
}

TEST_F(RecordParts, WriterSelectsFieldsByItsOwnVersion) {
    CursorImageWriter(1).WriteMetaDataFields(out, schema, record);
    EXPECT_EQ(hexDigits(out.str()), hexDigits(s_arrowV1.substr(24)));
}

TEST_F(RecordParts, AreWrittenWithASchemaAndARecordOfTheCaller) {
    metaDataWriteWithSchema(schema, record, out, 2);
    EXPECT_EQ(hexDigits(out.str()), hexDigits(s_arrowV2));
    EXPECT_EQ(record.justMetadataSize, 24U);
}

/// What a later version might look like: one more field behind the others.
class LaterSchema final : public CursorImageSchema {
public:
    LaterSchema() : CursorImageSchema(3) {
        const Steps known = CursorImageSchema::GetDataSteps();
        steps_.assign(known.begin(), known.end());
        steps_.push_back({"cursorScale", 3, 99, steps_.front().condition, scale});
    }
    Steps GetDataSteps() const override { return steps_; }

private:
    static FieldInfo scale(Record&) {
        static std::array<unsigned char, 5> bytes{'s', 'c', 'a', 'l', 'e'};
        return {bytes.data(), 5};
    }

    std::vector<SchemaFieldStep> steps_;
};

TEST_F(RecordParts, OfALaterSchemaAreReadByThisOneWithoutTheirNewField) {
    LaterSchema later;
    metaDataWriteWithSchema(later, record, out, 3);
    EXPECT_EQ(hexDigits(out.str()),
              hexDigits(le32(49) + s_arrowV2.substr(4, 16) + le32(29) + s_arrowV2.substr(24) + "scale"));
    const ReadRecord read(out.str() + "next", 2);
    EXPECT_EQ(read.text(), s_readArrow);
    EXPECT_EQ(read.end, 53);
}

TEST_F(RecordParts, ReaderReadsAFieldAndCountsWhatIsLeftDown) {
    std::istringstream in(recordOf(s_arrowV2.substr(24) + "12345").substr(24) + "abcdefgh");
    CursorImageReader reader(2);
    EXPECT_EQ(reader.bytesLeft(), 0U);
    record.justMetadataSize = 29;
    reader.ReadMetaDataFields(in, schema, record);
    EXPECT_EQ(reader.bytesLeft(), 5U);
    reader.Read(in, field(3));
    EXPECT_EQ(reader.bytesLeft(), 2U);
    reader.Read(in, field(0));
    EXPECT_EQ(reader.bytesLeft(), 2U);
    reader.Read(in, field(4));
    EXPECT_EQ(reader.bytesLeft(), 2U); // never below zero
    EXPECT_EQ(std::string(bytes.begin(), bytes.begin() + 4), "defg");
}

TEST_F(RecordParts, ReaderLeavesTheInputAloneForAFieldOfNoBytes) {
    std::istringstream in;
    CursorImageReader(2).Read(in, {nullptr, 0});
    EXPECT_TRUE(in.good());
}

TEST_F(RecordParts, ReaderReadsBaseInformationAndDataApart) {
    std::istringstream in(s_arrowV2);
    CursorImageReader reader(2);
    image.freeImageData(true);
    image.uniqueId = 0;
    time = 0;
    reader.ReadBaseInfo(in, schema, record);
    EXPECT_EQ(in.tellg(), 24);
    EXPECT_EQ(record.entrySize, 44U);
    EXPECT_EQ(record.justMetadataSize, 24U);
    EXPECT_EQ(time, 0.25);
    EXPECT_EQ(image.uniqueId, 7U);
    reader.ReadMetaDataFields(in, schema, record);
    EXPECT_EQ(asText(image), s_readArrow);
    EXPECT_EQ(reader.bytesLeft(), 0U);
}

TEST_F(RecordParts, ReaderReadsAWholeEntry) {
    std::istringstream in(s_bareV2);
    CursorImageReader(2).ReadCursorImageMetaData(in, schema, record);
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(record.entrySize, 28U);
    EXPECT_EQ(record.justMetadataSize, 8U);
}

TEST_F(RecordParts, ReaderSelectsFieldsByItsOwnVersion) {
    std::istringstream in(s_arrowV2.substr(24));
    record.justMetadataSize = 24;
    image = CursorImage();
    CursorImageReader(1).ReadMetaDataFields(in, CursorImageSchema(1), record);
    EXPECT_EQ(image.hotspotOffsetX, 4);
    EXPECT_EQ(image.imageDataSize, 16U);
}

TEST_F(RecordParts, ReaderSkipsAnyBytes) {
    std::istringstream in("a\nb\nc");
    CursorImageReader reader(2);
    reader.IgnoreLeftoverBytes(in, 0);
    EXPECT_EQ(in.tellg(), 0);
    reader.IgnoreLeftoverBytes(in, 3);
    EXPECT_EQ(in.tellg(), 3);
    EXPECT_TRUE(in.good());
}

TEST_F(RecordParts, ReaderSkipsToTheEndWhereMoreIsToBeSkippedThanThereIs) {
    std::istringstream in("abc");
    CursorImageReader(2).IgnoreLeftoverBytes(in, 0xffffffff);
    EXPECT_TRUE(in.eof());
}

} // namespace

} // namespace ZULMetaData::Test
