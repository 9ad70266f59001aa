// Which fields a cursor image entry has, where their bytes are, and how many.

#include "ZULMetaData/CursorImageSchema.h"

#include "Tests/Support/MemoryWatch.h"
#include "Tests/ZULMetaData/CursorImageSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

using Steps = CursorImageSchema::Steps;

constexpr std::uint32_t s_imageSize = 100;

class Schema : public testing::Test {
protected:
    CursorImage image = arrow();
    double time = 2.5;
    Record record{image, time};

    void giveImage() { image = arrow(std::string(s_imageSize, 'x')); }

    /// A size without bytes, as while an entry is read.
    void promiseImage(std::uint32_t size) { image.imageDataSize = size; }

    std::vector<std::string_view> presentFields(int version, Steps steps) const {
        std::vector<std::string_view> names;
        for (const SchemaFieldStep& step : steps)
            if (step.minVersion <= version && version <= step.maxVersion && step.condition(record))
                names.push_back(step.name);
        return names;
    }

    std::vector<std::string_view> presentData(int version) const {
        return presentFields(version, CursorImageSchema(version).GetDataSteps());
    }

    FieldInfo imageField(int version) { return CursorImageSchema(version).GetImageFieldInfoFn()(record); }

    bool hasImage(int version) const { return CursorImageSchema(version).HasImageFn(record); }

    std::uint32_t imageSize(int version) const { return CursorImageSchema(version).GetImageSize(record); }

    /// Of a record whose sizes are not known yet.
    void expectSizes(int version, std::uint32_t justMetadataSize, std::uint32_t entrySize) {
        Record fresh{image, time};
        CursorImageSchema(version).CalculateMetadataSizes(fresh);
        EXPECT_EQ(fresh.justMetadataSize, justMetadataSize);
        EXPECT_EQ(fresh.entrySize, entrySize);
    }

    void expectField(const SchemaFieldStep& step, const char* name, const void* data, std::uint32_t size) {
        const FieldInfo field = step.fieldGetter(record);
        EXPECT_EQ(step.name, name);
        EXPECT_EQ(field.data, data) << name;
        EXPECT_EQ(field.size, size) << name;
    }
};

// ---- The lists ------------------------------------------------------------------------------------------------

TEST_F(Schema, BeginsEveryEntryWithItsSizeTimeIdentifierAndDataSize) {
    for (const int version : {1, 2, 99}) {
        const Steps steps = CursorImageSchema(version).GetBaseInfoSteps();
        ASSERT_EQ(steps.size(), 4U);
        expectField(steps[0], "entrySize", &record.entrySize, 4);
        expectField(steps[1], "timestamp", &time, 8);
        expectField(steps[2], "cursorID", &image.uniqueId, 8);
        expectField(steps[3], "justMetadataSize", &record.justMetadataSize, 4);
    }
}

TEST_F(Schema, GoesOnWithTheImageBetweenItsSizeAndItsType) {
    giveImage();
    for (const int version : {1, 2, 99}) {
        const Steps steps = CursorImageSchema(version).GetDataSteps();
        ASSERT_EQ(steps.size(), 6U);
        expectField(steps[0], "imageSizeV2", &image.imageDataSize, 4);
        expectField(steps[1], "hotspotX", &image.hotspotOffsetX, 4);
        expectField(steps[2], "hotspotY", &image.hotspotOffsetY, 4);
        expectField(steps[3], "imageData", image.imageData, s_imageSize);
        expectField(steps[4], "cursorType", &image.cursorTypeId, 4);
        expectField(steps[5], "cursorFlags", &image.flags, 4);
    }
}

TEST_F(Schema, SaysSinceWhichVersionEachFieldIsThere) {
    for (const int version : {1, 2}) {
        const CursorImageSchema schema(version);
        std::vector<int> firstVersions;
        for (const Steps steps : {schema.GetBaseInfoSteps(), schema.GetDataSteps()})
            for (const SchemaFieldStep& step : steps) {
                firstVersions.push_back(step.minVersion);
                EXPECT_EQ(step.maxVersion, 99) << step.name;
            }
        EXPECT_THAT(firstVersions, ElementsAre(1, 1, 1, 1, 2, 1, 1, 1, 2, 2));
    }
}

TEST_F(Schema, OfVersionTwoHasEveryFieldOfAnImage) {
    giveImage();
    EXPECT_THAT(presentData(2),
                ElementsAre("imageSizeV2", "hotspotX", "hotspotY", "imageData", "cursorType", "cursorFlags"));
}

TEST_F(Schema, OfVersionTwoHasSizeAndFlagsWithoutAnImage) {
    EXPECT_THAT(presentData(2), ElementsAre("imageSizeV2", "cursorFlags"));
}

TEST_F(Schema, OfVersionOneHasHotSpotAndImageAlone) {
    giveImage();
    EXPECT_THAT(presentData(1), ElementsAre("hotspotX", "hotspotY", "imageData"));
}

TEST_F(Schema, OfVersionOneHasNothingWithoutAnImage) {
    EXPECT_THAT(presentData(1), IsEmpty());
}

TEST_F(Schema, OfLaterVersionsIsThatOfVersionTwo) {
    giveImage();
    for (const int version : {3, 50, 99})
        EXPECT_EQ(presentData(version), presentData(2)) << version;
}

TEST_F(Schema, BelowVersionOneAndAboveNinetyNineIsEmpty) {
    giveImage();
    for (const int version : {0, -1, 100, 1000}) {
        const CursorImageSchema schema(version);
        EXPECT_THAT(presentFields(version, schema.GetBaseInfoSteps()), IsEmpty()) << version;
        EXPECT_THAT(presentData(version), IsEmpty()) << version;
        EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record), 0U) << version;
        EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps(), record), 0U) << version;
    }
}

TEST_F(Schema, HasListsThatOutliveIt) {
    const Steps steps = CursorImageSchema(2).GetDataSteps();
    EXPECT_EQ(steps[1].name, "hotspotX");
    EXPECT_TRUE(steps[0].condition(record));
}

TEST_F(Schema, CanBeExtendedThroughItsVirtualOperations) {
    struct OneStep final : CursorImageSchema {
        using CursorImageSchema::CursorImageSchema;
        Steps GetBaseInfoSteps() const override { return CursorImageSchema::GetBaseInfoSteps().first(1); }
        Steps GetDataSteps() const override { return CursorImageSchema::GetDataSteps().last(1); }
        void CalculateMetadataSizes(Record& entry) const override { entry.entrySize = 1; }
    };
    const OneStep derived(2);
    const CursorImageSchema& schema = derived;
    EXPECT_EQ(schema.GetBaseInfoSteps()[0].name, "entrySize");
    EXPECT_EQ(schema.GetDataSteps()[0].name, "cursorFlags");
    schema.CalculateMetadataSizes(record);
    EXPECT_EQ(record.entrySize, 1U);
    EXPECT_TRUE(std::has_virtual_destructor_v<CursorImageSchema>);
}

// ---- Whether there is an image --------------------------------------------------------------------------------

TEST_F(Schema, AlwaysHoldsWhatAlwaysHolds) {
    for (const int version : {-1, 0, 1, 2, 100})
        EXPECT_TRUE(CursorImageSchema(version).AlwaysFn(record)) << version;
}

TEST_F(Schema, FindsNoImageWhereThereIsNeitherDataNorSize) {
    for (const int version : {1, 2, 99})
        EXPECT_FALSE(hasImage(version)) << version;
}

TEST_F(Schema, FindsAnImageByItsData) {
    giveImage();
    image.imageDataSize = 0;
    for (const int version : {1, 2, 99})
        EXPECT_TRUE(hasImage(version)) << version;
}

TEST_F(Schema, FindsAnImageByItsSize) {
    promiseImage(1);
    for (const int version : {1, 2, 99})
        EXPECT_TRUE(hasImage(version)) << version;
}

TEST_F(Schema, FindsAnImageByADataPartInVersionOneAlone) {
    record.justMetadataSize = 1;
    EXPECT_TRUE(hasImage(1));
    EXPECT_FALSE(hasImage(2));
    EXPECT_FALSE(hasImage(99));
}

TEST_F(Schema, MakesHotSpotImageAndTypeDependOnTheImage) {
    for (const int version : {1, 2}) {
        const Steps steps = CursorImageSchema(version).GetDataSteps();
        promiseImage(0);
        for (const std::size_t index : {1U, 2U, 3U, 4U})
            EXPECT_FALSE(steps[index].condition(record)) << steps[index].name;
        promiseImage(1);
        for (const std::size_t index : {1U, 2U, 3U, 4U})
            EXPECT_TRUE(steps[index].condition(record)) << steps[index].name;
    }
}

// ---- The image's bytes ----------------------------------------------------------------------------------------

TEST_F(Schema, GivesTheImageThatIsThere) {
    giveImage();
    record.justMetadataSize = 13; // counts for nothing then
    for (const int version : {1, 2}) {
        EXPECT_EQ(imageField(version).data, image.imageData);
        EXPECT_EQ(imageField(version).size, s_imageSize);
        EXPECT_EQ(imageSize(version), s_imageSize);
    }
}

TEST_F(Schema, AllocatesAnImageOfThePromisedSizeFilledWithZeros) {
    promiseImage(5);
    const FieldInfo field = imageField(2);
    EXPECT_EQ(field.size, 5U);
    EXPECT_EQ(field.data, image.imageData);
    EXPECT_EQ(image.imageDataSize, 5U);
    EXPECT_EQ(std::string(field.data, field.data + 5), std::string(5, '\0'));
}

TEST_F(Schema, LeavesTheAllocatedImageToItsOwner) {
    MemoryWatch memory;
    promiseImage(5);
    imageField(2);
    EXPECT_EQ(memory.blocks(), 1);
    image.freeImageData(true);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST_F(Schema, AllocatesAnImageOnce) {
    promiseImage(5);
    const FieldInfo first = imageField(2);
    EXPECT_EQ(imageField(2).data, first.data);
}

TEST_F(Schema, DerivesTheSizeOfAnImageFromItsDataPartInVersionOne) {
    record.justMetadataSize = 13;
    promiseImage(77);
    const FieldInfo field = imageField(1);
    EXPECT_EQ(field.size, 5U);
    EXPECT_EQ(field.data, image.imageData);
    EXPECT_EQ(image.imageDataSize, 5U);
    EXPECT_EQ(std::string(field.data, field.data + 5), std::string(5, '\0'));
}

TEST_F(Schema, GivesNoImageOfSizeZero) {
    MemoryWatch memory;
    record.justMetadataSize = 8; // the hot spot alone
    for (const int version : {1, 2}) {
        EXPECT_EQ(imageField(version).data, nullptr);
        EXPECT_EQ(imageField(version).size, 0U);
        EXPECT_EQ(image.imageDataSize, 0U);
    }
    EXPECT_EQ(memory.blocks(), 0);
}

TEST_F(Schema, GivesNoImageWhereThereAreBytesButNoSize) {
    giveImage();
    image.imageDataSize = 0;
    EXPECT_EQ(imageField(2).size, 0U);
}

TEST_F(Schema, GivesASizeWithoutDataWhereMemoryRanOut) {
    MemoryWatch memory;
    memory.refuseAbove(4);
    promiseImage(5);
    const FieldInfo field = imageField(2);
    EXPECT_EQ(field.data, nullptr);
    EXPECT_EQ(field.size, 5U);
}

TEST_F(Schema, WrapsTheSizeOfAnImageAroundWhereADataPartHasNoRoomForTheHotSpot) {
    MemoryWatch memory;
    memory.refuseAbove(1U << 30);
    for (std::uint32_t size = 0; size < 8; ++size) {
        record.justMetadataSize = size;
        EXPECT_EQ(imageSize(1), 0xfffffff8U + size);
        EXPECT_EQ(imageField(1).size, 0xfffffff8U + size);
        EXPECT_EQ(memory.largestRequest(), 0xfffffff8U + size);
    }
}

TEST_F(Schema, TellsTheSizeOfAnImageWithoutAllocatingIt) {
    record.justMetadataSize = 20;
    promiseImage(5);
    EXPECT_EQ(imageSize(1), 12U);
    EXPECT_EQ(imageSize(2), 5U);
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(image.imageDataSize, 5U);
}

// ---- Sizes ----------------------------------------------------------------------------------------------------

TEST_F(Schema, SumsTheFieldsThatArePresent) {
    const CursorImageSchema schema(2);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record), 24U);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps(), record), 8U);
    giveImage();
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps(), record), 120U);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps().first(3), record), 12U);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(Steps(), record), 0U);
}

TEST_F(Schema, SumsTheFieldsOfItsOwnVersion) {
    giveImage();
    const CursorImageSchema schema(1);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetBaseInfoSteps(), record), 24U);
    EXPECT_EQ(schema.GetSizeOfSchemaFieldSteps(schema.GetDataSteps(), record), 108U);
}

TEST_F(Schema, BeginsARecordWithoutSizes) {
    EXPECT_EQ(record.entrySize, 0U);
    EXPECT_EQ(record.justMetadataSize, 0U);
}

TEST_F(Schema, SizesEntriesWithoutAnImage) {
    expectSizes(1, 0, 20);
    expectSizes(2, 8, 28);
    expectSizes(99, 8, 28);
}

TEST_F(Schema, SizesEntriesWithAnImage) {
    giveImage();
    expectSizes(1, 8 + s_imageSize, 28 + s_imageSize);
    expectSizes(2, 20 + s_imageSize, 40 + s_imageSize);
    expectSizes(99, 20 + s_imageSize, 40 + s_imageSize);
}

TEST_F(Schema, SizesAnImageThatIsOnlyPromised) {
    promiseImage(5);
    expectSizes(2, 25, 45);
}

TEST_F(Schema, ReplacesTheSizesOfARecord) {
    record.entrySize = 1000;
    record.justMetadataSize = 1000;
    CursorImageSchema(2).CalculateMetadataSizes(record);
    EXPECT_EQ(record.justMetadataSize, 8U);
    EXPECT_EQ(record.entrySize, 28U);
}

} // namespace

} // namespace ZULMetaData::Test
