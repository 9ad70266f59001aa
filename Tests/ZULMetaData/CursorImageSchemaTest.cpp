#include "ZULMetaData/CursorImageSchema.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData {

namespace {

class CursorImageSchemaTest : public testing::Test {
protected:
    ~CursorImageSchemaTest() override { image.freeImageData(imageIsOwned); }

    void giveImage(std::uint32_t size) {
        image.imageData = bytes;
        image.imageDataSize = size;
        imageIsOwned = false;
    }

    std::vector<std::string> presentFields(const CursorImageSchema& schema, CursorImageSchema::Steps steps,
                                           int version) {
        std::vector<std::string> names;
        for (const SchemaFieldStep& step : steps)
            if (step.minVersion <= version && version <= step.maxVersion && step.condition(record))
                names.emplace_back(step.name);
        (void)schema;
        return names;
    }

    std::pair<std::uint32_t, std::uint32_t> sizes(int version) {
        record.justMetadataSize = 0;
        CursorImageSchema(version).CalculateMetadataSizes(record);
        return {record.justMetadataSize, record.entrySize};
    }

    unsigned char bytes[100] = {};
    bool imageIsOwned = true;
    CursorImage image;
    double time = 2.5;
    Record record{image, time};
};

using Names = std::vector<std::string>;
using Sizes = std::pair<std::uint32_t, std::uint32_t>;

TEST_F(CursorImageSchemaTest, NamesItsStepsInTheOrderOfTheEntry) {
    Names base;
    Names data;
    for (const SchemaFieldStep& step : CursorImageSchema(2).GetBaseInfoSteps())
        base.emplace_back(step.name);
    for (const SchemaFieldStep& step : CursorImageSchema(2).GetDataSteps())
        data.emplace_back(step.name);
    EXPECT_EQ(base, (Names{"entrySize", "timestamp", "cursorID", "justMetadataSize"}));
    EXPECT_EQ(data, (Names{"imageSizeV2", "hotspotX", "hotspotY", "imageData", "cursorType", "cursorFlags"}));
}

TEST_F(CursorImageSchemaTest, KeepsTheVersionRangesOfItsSteps) {
    for (const int version : {1, 2}) {
        const CursorImageSchema schema(version);
        for (const SchemaFieldStep& step : schema.GetBaseInfoSteps())
            EXPECT_EQ(std::pair(step.minVersion, step.maxVersion), std::pair(1, 99)) << step.name;
        const std::vector<int> firstVersions{2, 1, 1, 1, 2, 2};
        for (std::size_t i = 0; i < firstVersions.size(); ++i) {
            EXPECT_EQ(schema.GetDataSteps()[i].minVersion, firstVersions[i]);
            EXPECT_EQ(schema.GetDataSteps()[i].maxVersion, 99);
        }
    }
}

TEST_F(CursorImageSchemaTest, EveryGetterPointsAtItsMember) {
    const CursorImageSchema schema(2);
    giveImage(100);
    const auto base = schema.GetBaseInfoSteps();
    const auto data = schema.GetDataSteps();
    const std::vector<std::pair<const void*, std::uint32_t>> expected{
        {&record.entrySize, 4},     {&time, 8},
        {&image.uniqueId, 8},       {&record.justMetadataSize, 4},
        {&image.imageDataSize, 4},  {&image.hotspotOffsetX, 4},
        {&image.hotspotOffsetY, 4}, {bytes, 100},
        {&image.cursorTypeId, 4},   {&image.flags, 4}};
    for (std::size_t i = 0; i < expected.size(); ++i) {
        const SchemaFieldStep& step = i < base.size() ? base[i] : data[i - base.size()];
        const FieldInfo field = step.fieldGetter(record);
        EXPECT_EQ(field.data, expected[i].first) << step.name;
        EXPECT_EQ(field.size, expected[i].second) << step.name;
    }
}

TEST_F(CursorImageSchemaTest, WithoutAnImageVersion2HasItsSizeAndFlags) {
    EXPECT_EQ(presentFields(CursorImageSchema(2), CursorImageSchema(2).GetDataSteps(), 2),
              (Names{"imageSizeV2", "cursorFlags"}));
    EXPECT_EQ(sizes(2), Sizes(8, 28));
}

TEST_F(CursorImageSchemaTest, WithAnImageVersion2HasEveryField) {
    giveImage(100);
    EXPECT_EQ(presentFields(CursorImageSchema(2), CursorImageSchema(2).GetDataSteps(), 2).size(), 6U);
    EXPECT_EQ(sizes(2), Sizes(120, 140));
}

TEST_F(CursorImageSchemaTest, Version1HasOnlyHotSpotAndImage) {
    EXPECT_EQ(sizes(1), Sizes(0, 20));
    giveImage(100);
    EXPECT_EQ(presentFields(CursorImageSchema(1), CursorImageSchema(1).GetDataSteps(), 1),
              (Names{"hotspotX", "hotspotY", "imageData"}));
    EXPECT_EQ(sizes(1), Sizes(108, 128));
}

TEST_F(CursorImageSchemaTest, VersionsOutside1To99SelectNothing) {
    giveImage(100);
    for (const int version : {0, -1, 100, 1000}) {
        const CursorImageSchema schema(version);
        EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record), 0U) << version;
        EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps(), record), 0U) << version;
        EXPECT_EQ(sizes(version), Sizes(0, 0xfffffffc)) << version;
    }
}

TEST_F(CursorImageSchemaTest, Version99HasTheFieldsOfVersion2) {
    giveImage(100);
    EXPECT_EQ(sizes(99), Sizes(120, 140));
}

TEST_F(CursorImageSchemaTest, AnImageIsPresentByItsDataOrItsSize) {
    EXPECT_FALSE(CursorImageSchema(2).HasImageFn(record));
    image.imageDataSize = 1;
    EXPECT_TRUE(CursorImageSchema(2).HasImageFn(record));
    giveImage(0);
    EXPECT_TRUE(CursorImageSchema(2).HasImageFn(record));
    EXPECT_TRUE(CursorImageSchema(1).HasImageFn(record));
}

TEST_F(CursorImageSchemaTest, OnlyInVersion1DoesADataPartMeanAnImage) {
    record.justMetadataSize = 1;
    EXPECT_TRUE(CursorImageSchema(1).HasImageFn(record));
    EXPECT_FALSE(CursorImageSchema(2).HasImageFn(record));
    EXPECT_TRUE(CursorImageSchema(2).AlwaysFn(record));
}

TEST_F(CursorImageSchemaTest, TheImageGetterAllocatesWhatTheSizeSays) {
    image.imageDataSize = 10;
    const FieldInfo field = CursorImageSchema(2).GetImageFieldInfoFn()(record);
    EXPECT_EQ(field.size, 10U);
    EXPECT_EQ(field.data, image.imageData);
    EXPECT_EQ(std::vector<unsigned char>(field.data, field.data + 10), std::vector<unsigned char>(10, 0));
}

TEST_F(CursorImageSchemaTest, TheImageGetterOfVersion1TakesWhatTheDataPartLeaves) {
    record.justMetadataSize = 13;
    image.imageDataSize = 77;
    const FieldInfo field = CursorImageSchema(1).GetImageFieldInfoFn()(record);
    EXPECT_EQ(field.size, 5U);
    EXPECT_EQ(image.imageDataSize, 5U);
    EXPECT_EQ(field.data, image.imageData);
}

TEST_F(CursorImageSchemaTest, TheImageGetterGivesNothingForSizeZero) {
    const FieldInfo field = CursorImageSchema(2).GetImageFieldInfoFn()(record);
    EXPECT_EQ(field.data, nullptr);
    EXPECT_EQ(field.size, 0U);
    record.justMetadataSize = 8;
    EXPECT_EQ(CursorImageSchema(1).GetImageFieldInfoFn()(record).size, 0U);
    EXPECT_EQ(image.imageData, nullptr);
}

TEST_F(CursorImageSchemaTest, KnowsTheImageSizeOfEitherVersion) {
    record.justMetadataSize = 20;
    image.imageDataSize = 5;
    EXPECT_EQ(CursorImageSchema(1).GetImageSize(record), 12U);
    EXPECT_EQ(CursorImageSchema(2).GetImageSize(record), 5U);
    giveImage(7);
    EXPECT_EQ(CursorImageSchema(1).GetImageSize(record), 7U);
    record.justMetadataSize = 3;
    giveImage(0);
    image.imageData = nullptr;
    EXPECT_EQ(CursorImageSchema(1).GetImageSize(record), 0xfffffffbU);
}

TEST_F(CursorImageSchemaTest, ItsStepsOutliveIt) {
    const auto steps = CursorImageSchema(2).GetDataSteps();
    EXPECT_EQ(steps[1].name, "hotspotX");
    EXPECT_TRUE(steps[0].condition(record));
}

} // namespace

} // namespace ZULMetaData
