// Runs /usr/bin/pngcheck.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "Tests/ZULMetaDataBridge/StreamFixture.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <ios>
#include <memory>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

constexpr CursorTypeID s_arrow{5};
constexpr CursorImage::CursorImageFlags s_flags{1};

/// Every pixel another colour, from transparent to opaque.
Image arrow(std::uint32_t side) {
    std::vector<std::uint8_t> rgba;
    for (std::uint32_t pixel = 0; pixel < side * side; ++pixel)
        for (const std::uint32_t channel : {pixel * 7, pixel * 3 + 1, pixel % side * 5, pixel * 11})
            rgba.push_back(static_cast<std::uint8_t>(channel));
    return {side, side, rgba};
}

/// A side more than it has pixels for.
Image imageThatCannotBeEncoded() {
    return {2, 2, {1, 2, 3, 4}};
}

class CursorImages : public StreamFixture {
protected:
    // Where the fields of an entry with an image stand.
    static constexpr std::size_t timeAt = 4;
    static constexpr std::size_t idAt = 12;
    static constexpr std::size_t dataSizeAt = 20;
    static constexpr std::size_t imageSizeAt = 24;
    static constexpr std::size_t hotspotAt = 28;
    static constexpr std::size_t imageAt = 36;
    static constexpr std::size_t bytesAroundTheImage = 44;
    static constexpr std::size_t bytesWithoutAnImage = 32;

    const std::string header = streamHeader("2b7b6af1", 2, 0);
    CursorImageMetaDataWriter writer{file};

    static std::uint32_t numberAt(const std::string& bytes, std::size_t offset) {
        std::uint32_t number = 0;
        std::memcpy(&number, bytes.data() + offset, sizeof number);
        return number;
    }

    void writeArrow(std::uint32_t side = 2) {
        writer.writeCursorImage(arrow(side), 7, s_arrow, s_flags, {3, -2}, {1, 4});
    }

    std::shared_ptr<EntryList> readBack() {
        writer.finish();
        return CursorImageMetaDataParser(file).read();
    }

    std::vector<std::string> readEntries(const std::string& entries) const {
        return read<CursorImageMetaDataParser>(header + entries);
    }

    static std::string entryWithImage(const std::string& image) {
        const auto size = static_cast<std::uint32_t>(image.size());
        return le32(40 + size) + f64(0.25) + le64(7) + le32(20 + size) + le32(size) + hex("03000000 feffffff") + image +
               hex("05000000 01000000");
    }

    static constexpr const char* nilEntry = "image = text 'nil', id = int64 7, hotspotOffsetX = int32 3, "
                                            "hotspotOffsetY = int32 -2, timestamp = float 0.25";
    static constexpr const char* redAndGreenEntry =
        "image = image 2x1 ff0000ff 00ff0080, id = int64 7, hotspotOffsetX = int32 3, hotspotOffsetY = int32 -2, "
        "timestamp = float 0.25";
};

// ---- Writing images -------------------------------------------------------------------------------------------

TEST_F(CursorImages, AreStoredWithTheirSizesAroundThePNG) {
    writeArrow();
    const std::string entry = storedEntries();
    const auto size = static_cast<std::uint32_t>(entry.size() - bytesAroundTheImage);
    EXPECT_EQ(numberAt(entry, 0), 40 + size);
    EXPECT_EQ(entry.substr(timeAt, 8), hex("000000000000d03f"));
    EXPECT_EQ(entry.substr(idAt, 8), hex("0700000000000000"));
    EXPECT_EQ(numberAt(entry, dataSizeAt), 20 + size);
    EXPECT_EQ(numberAt(entry, imageSizeAt), size);
    EXPECT_EQ(entry.substr(hotspotAt, 8), hex("03000000 feffffff"));
    EXPECT_EQ(entry.substr(imageAt, 8), hex("89504e470d0a1a0a"));
    EXPECT_EQ(entry.substr(imageAt + size), hex("05000000 01000000"));
}

TEST_F(CursorImages, AreStoredAsPNGThatAnotherProgramAccepts) {
    for (const std::uint32_t side : {1U, 16U, 32U, 64U}) {
        CursorImageMetaDataWriter(file).writeCursorImage(arrow(side), 7, s_arrow, s_flags, {0, 0}, {1, 4});
        const std::string entry = storedEntries();
        writeFile(folder / "arrow.png", entry.substr(imageAt, numberAt(entry, imageSizeAt)));
        const std::string verdict = outputOf("/usr/bin/pngcheck '" + folder / "arrow.png" + "'");
        const std::string length = std::to_string(side);
        EXPECT_THAT(verdict, StartsWith("OK: "));
        EXPECT_THAT(verdict, HasSubstr('(' + length + 'x' + length + ", 32-bit RGB+alpha, non-interlaced"));
    }
}

TEST_F(CursorImages, ComeBackPixelByPixelAtSingleAndDoubleResolution) {
    for (const std::uint32_t side : {16U, 32U})
        writer.writeCursorImage(arrow(side), side, s_arrow, s_flags, {side / 2.0, side / 4.0}, {1, 4});
    const auto entries = readBack();
    ASSERT_EQ(entries->size(), 2U);
    EXPECT_EQ(asText(*entries->at(0).get<std::shared_ptr<const Image>>("image")), asText(arrow(16)));
    EXPECT_EQ(asText(*entries->at(1).get<std::shared_ptr<const Image>>("image")), asText(arrow(32)));
    EXPECT_EQ(entries->at(1).get<std::int32_t>("hotspotOffsetX"), 16);
    EXPECT_EQ(entries->at(1).get<std::int32_t>("hotspotOffsetY"), 8);
    EXPECT_EQ(entries->at(1).get<std::int64_t>("id"), 32);
}

TEST_F(CursorImages, LoseTheFractionOfTheirHotSpot) {
    writer.writeCursorImage(arrow(1), 7, s_arrow, s_flags, {3.9, -2.7}, {1, 4});
    EXPECT_EQ(storedEntries().substr(hotspotAt, 8), hex("03000000 feffffff"));
    EXPECT_EQ(asTexts(*readBack()), std::vector<std::string>{"image = image 1x1 00010000, id = int64 7, "
                                                             "hotspotOffsetX = int32 3, hotspotOffsetY = int32 -2, "
                                                             "timestamp = float 0.25"});
}

TEST_F(CursorImages, KeepAHotSpotWithin32Bits) {
    writer.writeCursorImage(arrow(1), 7, s_arrow, s_flags, {1e10, -1e10}, {1, 4});
    EXPECT_EQ(storedEntries().substr(hotspotAt, 8), hex("ffffff7f 00000080"));
}

TEST_F(CursorImages, AreStoredWithAnyTypeFlagsAndIdentifier) {
    writer.writeCursorImage(arrow(1), -2, -1234567, 0xfedcba98, {0, 0}, {1, 4});
    const std::string entry = storedEntries();
    EXPECT_EQ(entry.substr(idAt, 8), hex("feffffffffffffff"));
    EXPECT_EQ(entry.substr(entry.size() - 8), hex("7929edff 98badcfe"));
    EXPECT_EQ(readBack()->at(0).get<std::int64_t>("id"), -2);
}

TEST_F(CursorImages, HaveTheTimeThatTheyWereGiven) {
    writer.writeCursorImage(arrow(1), 7, s_arrow, s_flags, {0, 0}, {1, 3, 0xffffffff, 9});
    EXPECT_EQ(storedEntries().substr(timeAt, 8), hex("555555555555d53f"));
    EXPECT_EQ(readBack()->at(0).get<float>("timestamp"), 0.3333333432674407958984375F);
}

TEST_F(CursorImages, ThatCannotBeEncodedLeaveOnlyIdentifierTimeAndFlags) {
    writer.writeCursorImage(imageThatCannotBeEncoded(), 7, s_arrow, s_flags, {3, -2}, {3, 2});
    EXPECT_EQ(storedEntries(), hex("1c000000 000000000000f83f 0700000000000000 08000000 00000000 01000000"));
    EXPECT_THAT(asTexts(*readBack()), ElementsAre("image = text 'nil', id = int64 7, hotspotOffsetX = int32 0, "
                                                  "hotspotOffsetY = int32 0, timestamp = float 1.5"));
}

// ---- Writing identifiers of earlier images --------------------------------------------------------------------

TEST_F(CursorImages, ThatCameBeforeTake32Bytes) {
    writer.writeCursorWithExistingUID(0x0102030405060708, {3, 2});
    EXPECT_EQ(storedEntries(), hex("1c000000 000000000000f83f 0807060504030201 08000000 00000000 03000000"));
}

TEST_F(CursorImages, ThatCameBeforeAreReadAsNil) {
    writer.writeCursorWithExistingUID(-1, {1, 3});
    EXPECT_THAT(asTexts(*readBack()), ElementsAre("image = text 'nil', id = int64 -1, hotspotOffsetX = int32 0, "
                                                  "hotspotOffsetY = int32 0, timestamp = float 0.333333343"));
}

// ---- Writing what is encoded already --------------------------------------------------------------------------

TEST_F(CursorImages, AreWrittenFromBytesThatStayTheCallers) {
    std::array<unsigned char, 3> bytes{1, 2, 3};
    CursorImage cursor(7, 3, -2, bytes.data(), bytes.size(), s_arrow, s_flags);
    writer.writeCursorImage(cursor, 0.25);
    EXPECT_EQ(cursor.imageData, nullptr);
    EXPECT_EQ(cursor.imageDataSize, 0U);
    EXPECT_THAT(bytes, ElementsAre(1, 2, 3));
    EXPECT_EQ(storedEntries(), entryWithImage("\1\2\3"));
}

TEST_F(CursorImages, KeepEverythingButTheirBytesWhenTheyAreWritten) {
    std::array<unsigned char, 3> bytes{1, 2, 3};
    CursorImage cursor(7, 3, -2, bytes.data(), bytes.size(), s_arrow, s_flags);
    writer.writeCursorImage(cursor, 0.25);
    EXPECT_EQ(cursor, CursorImage(7, 3, -2, nullptr, 0, s_arrow, s_flags));
}

TEST_F(CursorImages, GiveTheirBytesBackAlsoWhenWritingThrows) {
    std::array<unsigned char, 3> bytes{1, 2, 3};
    CursorImage cursor(7, 3, -2, bytes.data(), bytes.size(), s_arrow, s_flags);
    writer.finish();
    writer.metaDataWriter()->getStream().exceptions(std::ios_base::badbit | std::ios_base::failbit);
    EXPECT_THROW(writer.writeCursorImage(cursor, 0.25), std::ios_base::failure);
    EXPECT_EQ(cursor.imageData, nullptr);
    EXPECT_EQ(cursor.imageDataSize, 0U);
    EXPECT_THAT(bytes, ElementsAre(1, 2, 3));
}

TEST_F(CursorImages, ThatAreEncodedHereAreFreedOnceAlsoWhenWritingThrows) {
    writer.finish();
    writer.metaDataWriter()->getStream().exceptions(std::ios_base::badbit | std::ios_base::failbit);
    EXPECT_THROW(writeArrow(), std::ios_base::failure);
    EXPECT_EQ(contentsOf(file), header);
}

TEST_F(CursorImages, WithASizeButNoBytesAreStoredAsZeros) {
    CursorImage cursor(7, 3, -2, nullptr, 4, s_arrow, s_flags);
    writer.writeCursorImage(cursor, 0.25);
    EXPECT_EQ(storedEntries(), entryWithImage(std::string(4, '\0')));
    EXPECT_EQ(cursor.imageData, nullptr);
    EXPECT_EQ(cursor.imageDataSize, 0U);
}

TEST_F(CursorImages, AreTakenOffAlsoByAWriterWithoutAFile) {
    std::array<unsigned char, 3> bytes{1, 2, 3};
    CursorImage cursor(7, 3, -2, bytes.data(), bytes.size(), s_arrow, s_flags);
    CursorImageMetaDataWriter idle;
    idle.writeCursorImage(cursor, 0.25);
    EXPECT_EQ(cursor.imageData, nullptr);
    EXPECT_EQ(idle.cursorsWritten(), 1U);
}

// ---- Counting and flushing ------------------------------------------------------------------------------------

TEST_F(CursorImages, AreFlushedAtTheFirstAndEveryFifteenthEntryAfterIt) {
    for (std::size_t number = 1; number <= 35; ++number) {
        writer.writeCursorWithExistingUID(7, {1, 4});
        const std::size_t lastFlushed = number < 16 ? 1 : number < 31 ? 16 : 31;
        EXPECT_EQ(storedBytes(), lastFlushed * bytesWithoutAnImage) << "after entry " << number;
    }
    writer.finish();
    EXPECT_EQ(storedBytes(), 35 * bytesWithoutAnImage);
}

TEST_F(CursorImages, AreCountedWhicheverWayTheyAreWritten) {
    EXPECT_EQ(writer.cursorsWritten(), 0U);
    writeArrow();
    writer.writeCursorWithExistingUID(7, {1, 4});
    CursorImage cursor;
    writer.writeCursorImage(cursor, 0.25);
    EXPECT_EQ(writer.cursorsWritten(), 3U);
    for (int number = 4; number <= 32; ++number)
        writer.writeCursorWithExistingUID(7, {1, 4});
    EXPECT_EQ(writer.cursorsWritten(), 32U);
}

TEST_F(CursorImages, AreFlushedAtCountsThatAreMultiplesOfFifteen) {
    for (const std::uint32_t count : {0U, 15U, 30U, 4294967295U}) {
        writer.setCursorsWritten(count);
        EXPECT_TRUE(writer.shouldFlush()) << count;
        EXPECT_EQ(writer.cursorsWritten(), count) << "asking does not count";
        const std::size_t before = storedBytes();
        writer.writeCursorWithExistingUID(7, {1, 4});
        EXPECT_EQ(storedBytes(), before + bytesWithoutAnImage) << count;
        EXPECT_EQ(writer.cursorsWritten(), count + 1);
    }
}

TEST_F(CursorImages, AreNotFlushedAtOtherCounts) {
    for (const std::uint32_t count : {1U, 14U, 16U, 4294967294U}) {
        writer.setCursorsWritten(count);
        EXPECT_FALSE(writer.shouldFlush()) << count;
        writer.writeCursorWithExistingUID(7, {1, 4});
        EXPECT_EQ(storedBytes(), 0U) << count;
        EXPECT_EQ(writer.cursorsWritten(), count + 1);
    }
}

TEST_F(CursorImages, AreNumberedByTheApplicationAlone) {
    EXPECT_EQ(writer.currentUniqueID(), 0);
    writer.setCurrentUniqueID(-42);
    writeArrow();
    writer.writeCursorWithExistingUID(99, {1, 4});
    writer.finish();
    EXPECT_EQ(writer.currentUniqueID(), -42);
    EXPECT_EQ(storedEntries().substr(idAt, 8), hex("0700000000000000"));
}

TEST_F(CursorImages, AreLostAfterTheEnd) {
    writer.writeCursorWithExistingUID(7, {1, 4});
    writer.finish();
    writer.finish();
    writer.writeCursorWithExistingUID(8, {1, 4});
    EXPECT_EQ(storedBytes(), bytesWithoutAnImage);
    EXPECT_TRUE(writer.metaDataWriter()->getStream().fail());
}

// ---- Reading --------------------------------------------------------------------------------------------------

TEST_F(CursorImages, AreReadWithTheirPixels) {
    EXPECT_THAT(readEntries(entryWithImage(redAndGreenPNG())), ElementsAre(redAndGreenEntry));
}

TEST_F(CursorImages, AreReadFromTIFFDataAsWell) {
    const auto tiff = Image(2, 1, {255, 0, 0, 255, 0, 255, 0, 128}).tiffRepresentation();
    EXPECT_THAT(readEntries(entryWithImage(std::string(tiff.begin(), tiff.end()))), ElementsAre(redAndGreenEntry));
}

TEST_F(CursorImages, ThatCannotBeDecodedAreReadAsNil) {
    std::string damaged = redAndGreenPNG();
    damaged[50] = '!';
    for (const std::string& image : {std::string("x"), std::string("no image at all"), std::string(100, '\0'), damaged,
                                     redAndGreenPNG().substr(0, 40)})
        EXPECT_THAT(readEntries(entryWithImage(image)), ElementsAre(nilEntry));
}

TEST_F(CursorImages, AreReadInTheOrderOfTheStreamWithTheirRepetitions) {
    const std::string again = hex("1c000000 000000000000f83f 0700000000000000 08000000 00000000 03000000");
    const char* againEntry = "image = text 'nil', id = int64 7, hotspotOffsetX = int32 0, hotspotOffsetY = int32 0, "
                             "timestamp = float 1.5";
    EXPECT_THAT(readEntries(again + entryWithImage(redAndGreenPNG()) + again + again),
                ElementsAre(againEntry, redAndGreenEntry, againEntry, againEntry));
}

TEST_F(CursorImages, ThatAreCutAreReadAsNil) {
    const std::string entry = entryWithImage(redAndGreenPNG());
    for (std::size_t size = imageAt; size < imageAt + 77; ++size)
        EXPECT_THAT(readEntries(entry.substr(0, size)), ElementsAre(nilEntry)) << size;
}

TEST_F(CursorImages, ThatAreWholeAreReadAlsoWhereTheEntryIsCutBehindThem) {
    const std::string entry = entryWithImage(redAndGreenPNG());
    for (std::size_t size = imageAt + 77; size < entry.size(); ++size)
        EXPECT_THAT(readEntries(entry.substr(0, size)), ElementsAre(redAndGreenEntry)) << size;
}

TEST_F(CursorImages, ThatClaimMoreBytesThanTheirEntryHasAreReadAsNil) {
    std::string entry = entryWithImage(redAndGreenPNG());
    entry.replace(imageSizeAt, 4, hex("ffffff7f"));
    EXPECT_THAT(readEntries(entry + entryWithImage(redAndGreenPNG())), ElementsAre(nilEntry, redAndGreenEntry));
}

TEST_F(CursorImages, OfTheFirstVersionAreReadToo) {
    const std::string stream = streamHeader("2b7b6af1", 1, 0) +
                               hex("69000000 000000000000d03f 0700000000000000 55000000 03000000 feffffff") +
                               redAndGreenPNG() + hex("14000000 000000000000f83f 0700000000000000 00000000");
    EXPECT_THAT(read<CursorImageMetaDataParser>(stream),
                ElementsAre(redAndGreenEntry, "image = text 'nil', id = int64 7, hotspotOffsetX = int32 0, "
                                              "hotspotOffsetY = int32 0, timestamp = float 1.5"));
}

TEST_F(CursorImages, AreReadPastFieldsOfLaterVersions) {
    const std::string longer =
        hex("24000000 000000000000f83f 0700000000000000 10000000 00000000 03000000") + hex("0102030405060708");
    EXPECT_THAT(readEntries(longer + entryWithImage(redAndGreenPNG())),
                ElementsAre(StartsWith("image = text 'nil', id = int64 7"), redAndGreenEntry));
}

TEST_F(CursorImages, AreSharedWithTheApplicationForAsLongAsItKeepsThem) {
    writeFile(file, header + entryWithImage(redAndGreenPNG()));
    auto parser = std::make_unique<CursorImageMetaDataParser>(file);
    const auto image = parser->read()->at(0).get<std::shared_ptr<const Image>>("image");
    parser->read();
    parser.reset();
    EXPECT_EQ(asText(*image), "2x1 ff0000ff 00ff0080");
}

TEST_F(CursorImages, HaveAnEmptyListWhereNoneWasWritten) {
    EXPECT_THAT(*readBack(), IsEmpty());
}

} // namespace

} // namespace ZULMetaData::Test
