#include "ZULMetaData/CursorImageWriter.h"
#include "ZULMetaData/ZULMMetaDataReader.h"
#include "ZULMetaData/ZULMMetaDataWriter.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <sstream>
#include <stdexcept>

namespace ZULMetaData {

namespace {

using namespace Test;

/// Version 2, image "PNG!".
const std::string s_imageEntry = le32(44) + f64(2.5) + le64(0x1122334455667788) + le32(24) + le32(4) + le32(3) +
                                 hex("feffffff") + "PNG!" + le32(9) + le32(5);
const std::string s_imageEntryV1 = le32(32) + f64(2.5) + le64(7) + le32(12) + le32(3) + hex("feffffff") + "PNG!";
const std::string s_numberEntry = le32(28) + f64(1.0) + le64(7) + le32(8) + le32(0) + le32(3);

CursorImage cursor(std::uint64_t id, const std::string& bytes) {
    auto* data = static_cast<unsigned char*>(std::malloc(bytes.size()));
    std::memcpy(data, bytes.data(), bytes.size());
    return CursorImage(id, 3, -2, data, static_cast<std::uint32_t>(bytes.size()), static_cast<CursorTypeID>(9),
                       static_cast<CursorImage::CursorImageFlags>(5));
}

std::string written(const CursorImage& image, double time, int version) {
    std::ostringstream stream;
    metaDataWrite(time, image, stream, version);
    return stream.str();
}

struct Read {
    CursorImage image;
    double time = 0;
    std::streamoff position = 0;

    std::string bytes() const { return {reinterpret_cast<const char*>(image.imageData), image.imageDataSize}; }
};

Read readFrom(const std::string& bytes, int version) {
    std::istringstream stream(bytes);
    Read read;
    metaDataRead(stream, &read.time, &read.image, version);
    stream.clear();
    read.position = stream.tellg();
    return read;
}

TEST(CursorImageRecord, Version2IsWrittenByteForByte) {
    EXPECT_EQ(written(cursor(0x1122334455667788, "PNG!"), 2.5, 2), s_imageEntry);
}

TEST(CursorImageRecord, Version1IsWrittenByteForByte) {
    EXPECT_EQ(written(cursor(7, "PNG!"), 2.5, 1), s_imageEntryV1);
}

TEST(CursorImageRecord, WithoutAnImageOnlyItsSizeAndTheFlagsAreWritten) {
    CursorImage image;
    image.uniqueId = 7;
    EXPECT_EQ(written(image, 1.0, 2), s_numberEntry);
    EXPECT_EQ(written(image, 1.0, 1), le32(20) + f64(1.0) + le64(7) + le32(0));
}

TEST(CursorImageRecord, VersionsWithoutFieldsWriteNothing) {
    for (const int version : {0, -1, 100})
        EXPECT_EQ(written(cursor(7, "PNG!"), 1.0, version), "") << version;
}

TEST(CursorImageRecord, ASizeWithoutBytesIsWrittenAsZerosAndLeavesTheImageAlone) {
    CursorImage image;
    image.imageDataSize = 3;
    EXPECT_EQ(written(image, 0, 2).substr(36, 3), std::string(3, '\0'));
    EXPECT_EQ(written(image, 0, 2).size(), 47U);
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(image.imageDataSize, 3U);
}

TEST(CursorImageRecord, WritingLeavesTheImageWithItsBytes) {
    const CursorImage image = cursor(7, "PNG!");
    const auto* before = image.imageData;
    written(image, 0, 2);
    EXPECT_EQ(image.imageData, before);
}

TEST(CursorImageRecord, WritingThatThrowsLeavesTheImageWithItsBytes) {
    const CursorImage image = cursor(7, "PNG!");
    std::ostringstream stream;
    stream.setstate(std::ios_base::badbit);
    EXPECT_THROW(stream.exceptions(std::ios_base::badbit), std::ios_base::failure);
    EXPECT_THROW(metaDataWrite(0.0, image, stream, 2), std::ios_base::failure);
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(image.imageData), 4), "PNG!");
}

TEST(CursorImageRecord, Version2IsReadByteForByte) {
    const Read read = readFrom(s_imageEntry, 2);
    EXPECT_EQ(read.image, cursor(0x1122334455667788, "PNG!"));
    EXPECT_EQ(read.bytes(), "PNG!");
    EXPECT_EQ(read.time, 2.5);
}

TEST(CursorImageRecord, Version1IsReadByteForByte) {
    const Read read = readFrom(s_imageEntryV1, 1);
    EXPECT_EQ(read.bytes(), "PNG!");
    EXPECT_EQ(read.image.hotspotOffsetX, 3);
    EXPECT_EQ(read.image.hotspotOffsetY, -2);
    EXPECT_EQ(read.image.cursorTypeId, CursorTypeUnknown);
    EXPECT_EQ(read.image.flags, CursorImage::DefaultFlags);
}

TEST(CursorImageRecord, WithoutAnImageTheRestKeepsItsDefaults) {
    const Read read = readFrom(s_numberEntry, 2);
    EXPECT_EQ(read.image.uniqueId, 7U);
    EXPECT_EQ(read.image.imageData, nullptr);
    EXPECT_EQ(read.image.imageDataSize, 0U);
    EXPECT_EQ(read.image.cursorTypeId, CursorTypeUnknown);
}

TEST(CursorImageRecord, Version2ReadAsVersion1TakesTheSizeForTheHotSpot) {
    const Read read = readFrom(s_imageEntry, 1);
    EXPECT_EQ(read.image.hotspotOffsetX, 4);
    EXPECT_EQ(read.image.hotspotOffsetY, 3);
    EXPECT_EQ(read.image.imageDataSize, 16U);
    EXPECT_EQ(read.position, static_cast<std::streamoff>(s_imageEntry.size()));
}

TEST(CursorImageRecord, FieldsOfALaterVersionAreSkipped) {
    const std::string longer = le32(28 + 6) + f64(1.0) + le64(7) + le32(8 + 6) + le32(0) + le32(3) + "future";
    std::istringstream stream(longer + s_imageEntry);
    Read first;
    Read second;
    metaDataRead(stream, &first.time, &first.image, 2);
    metaDataRead(stream, &second.time, &second.image, 2);
    EXPECT_EQ(first.image.uniqueId, 7U);
    EXPECT_EQ(second.bytes(), "PNG!");
}

TEST(CursorImageRecord, ReadingReplacesAnEarlierImage) {
    std::istringstream stream(s_numberEntry);
    Read read{cursor(1, "bytes of before")};
    metaDataRead(stream, &read.time, &read.image, 2);
    EXPECT_EQ(read.image.imageData, nullptr);
}

TEST(CursorImageRecord, ReadingAtTheEndOfTheInputThrows) {
    std::istringstream stream(s_imageEntry);
    Read read;
    metaDataRead(stream, &read.time, &read.image, 2);
    EXPECT_EQ(read.bytes(), "PNG!");
    try {
        metaDataRead(stream, &read.time, &read.image, 2);
        FAIL() << "nothing was thrown";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "invalid meta data entry");
    }
}

TEST(CursorImageRecord, AnEntryCutInItsBaseInformationThrows) {
    for (std::size_t size = 0; size < 20; ++size)
        EXPECT_THROW(readFrom(s_imageEntry.substr(0, size), 2), std::runtime_error) << size;
}

TEST(CursorImageRecord, AnEntryCutInItsDataPartKeepsWhatWasRead) {
    for (std::size_t size = 24; size < s_imageEntry.size(); ++size) {
        const Read read = readFrom(s_imageEntry.substr(0, size), 2);
        EXPECT_EQ(read.image.uniqueId, 0x1122334455667788U) << size;
        EXPECT_EQ(read.image.hotspotOffsetX, size >= 32 ? 3 : read.image.hotspotOffsetX) << size;
        if (size >= 36) {
            const std::string bytes = std::string("PNG!").substr(0, std::min<std::size_t>(size - 36, 4));
            EXPECT_EQ(read.bytes(), bytes + std::string(4 - bytes.size(), '\0')) << size;
        } else {
            EXPECT_EQ(read.image.imageData, nullptr) << size;
        }
    }
}

TEST(CursorImageRecord, AnImageLargerThanTheDataPartLeavesNeitherDataNorSize) {
    const std::string entry =
        le32(44) + f64(1) + le64(7) + le32(24) + le32(0xfffffff0) + le32(3) + le32(4) + std::string(12, 'x');
    const Read read = readFrom(entry + s_numberEntry, 2);
    EXPECT_EQ(read.image.imageData, nullptr);
    EXPECT_EQ(read.image.imageDataSize, 0U);
    EXPECT_EQ(read.image.hotspotOffsetY, 4);
    EXPECT_EQ(read.position, static_cast<std::streamoff>(entry.size()));
}

TEST(CursorImageRecord, DataPartsTooSmallForAVersion1ImageAreSkipped) {
    for (std::uint32_t size = 1; size < 8; ++size) {
        const std::string entry = le32(20 + size) + f64(1) + le64(7) + le32(size) + std::string(size, '\1');
        const Read read = readFrom(entry + "next", 1);
        EXPECT_EQ(read.image.imageData, nullptr) << size;
        EXPECT_EQ(read.image.imageDataSize, 0U) << size;
        EXPECT_EQ(read.position, static_cast<std::streamoff>(entry.size())) << size;
    }
}

TEST(CursorImageRecord, AVersion1DataPartOfJustAHotSpotHasNoImage) {
    const Read read = readFrom(le32(28) + f64(1) + le64(7) + le32(8) + le32(3) + le32(4), 1);
    EXPECT_EQ(read.image.hotspotOffsetY, 4);
    EXPECT_EQ(read.image.imageData, nullptr);
}

TEST(CursorImageRecord, EveryDataPartSizeLeavesTheNextEntryInPlace) {
    for (std::uint32_t size = 0; size <= 28; ++size) {
        const std::string data = (s_imageEntry.substr(24) + "xxxx").substr(0, size);
        const std::string entry = le32(20 + size) + f64(1) + le64(7) + le32(size) + data;
        EXPECT_EQ(readFrom(entry + "next", 2).position, static_cast<std::streamoff>(entry.size())) << size;
    }
}

TEST(CursorImageRecord, TheDataPartAloneDelimitsTheEntry) {
    const std::string entry = le32(0xffffffff) + s_numberEntry.substr(4);
    EXPECT_EQ(readFrom(entry + "next", 2).position, 32);
}

TEST(CursorImageWriting, CountsTheBytesOfOneEntry) {
    CursorImage image = cursor(7, "PNG!");
    double time = 1;
    Record record{image, time};
    const CursorImageSchema schema(2);
    CursorImageWriter writer(2);
    std::ostringstream stream;
    writer.WriteCursorImageMetaData(stream, schema, record);
    writer.WriteCursorImageMetaData(stream, schema, record);
    EXPECT_EQ(writer.bytesWritten(), 48U);
    EXPECT_EQ(stream.str().size(), 96U);
    EXPECT_EQ(record.entrySize, 44U);
    EXPECT_EQ(record.justMetadataSize, 24U);
}

TEST(CursorImageWriting, BaseInformationAndDataCanBeWrittenApart) {
    CursorImage image = cursor(7, "PNG!");
    double time = 1;
    Record record{image, time};
    const CursorImageSchema schema(2);
    schema.CalculateMetadataSizes(record);
    CursorImageWriter writer(2);
    std::ostringstream stream;
    writer.WriteBaseInfo(stream, schema, record);
    EXPECT_EQ(stream.str(), le32(44) + f64(1) + le64(7) + le32(24));
    writer.WriteMetaDataFields(stream, schema, record);
    EXPECT_EQ(writer.bytesWritten(), 48U);
}

TEST(CursorImageWriting, TakesASchemaAndARecordOfTheCaller) {
    CursorImage image = cursor(0x1122334455667788, "PNG!");
    double time = 2.5;
    Record record{image, time};
    CursorImageSchema schema(2);
    std::ostringstream stream;
    metaDataWriteWithSchema(schema, record, stream, 2);
    EXPECT_EQ(stream.str(), s_imageEntry);
}

TEST(CursorImageWriting, AFieldWithoutBytesWritesNothing) {
    CursorImageWriter writer(2);
    std::ostringstream stream;
    writer.Write(stream, FieldInfo{nullptr, 0});
    EXPECT_EQ(stream.str(), "");
    EXPECT_EQ(writer.bytesWritten(), 0U);
}

TEST(CursorImageReading, CountsWhatIsLeftOfTheDataPart) {
    CursorImage image;
    double time = 0;
    Record record{image, time};
    record.justMetadataSize = 30;
    std::istringstream stream(s_imageEntry.substr(24) + std::string(20, 'x'));
    CursorImageReader reader(2);
    reader.ReadMetaDataFields(stream, CursorImageSchema(2), record);
    EXPECT_EQ(reader.bytesLeft(), 6U);
    EXPECT_EQ(stream.tellg(), std::streampos(30));
}

TEST(CursorImageReading, NeverCountsBelowZero) {
    std::uint32_t number = 0;
    CursorImageReader reader(2);
    std::istringstream stream(le32(7));
    reader.Read(stream, FieldInfo{reinterpret_cast<unsigned char*>(&number), 4});
    EXPECT_EQ(number, 7U);
    EXPECT_EQ(reader.bytesLeft(), 0U);
}

TEST(CursorImageReading, SkipsBytesWhateverTheyAre) {
    CursorImageReader reader(2);
    std::istringstream stream("a\nb\nrest");
    reader.IgnoreLeftoverBytes(stream, 0);
    EXPECT_EQ(stream.tellg(), std::streampos(0));
    reader.IgnoreLeftoverBytes(stream, 4);
    EXPECT_EQ(stream.tellg(), std::streampos(4));
}

} // namespace

} // namespace ZULMetaData
