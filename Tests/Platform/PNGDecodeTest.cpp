#include "Platform/Image.h"

#include "Tests/Platform/ImageTestSupport.h"
#include "Tests/Platform/PNGFile.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

// One row of samples, given with its filter byte left out.
Bytes oneRow(std::uint32_t width, int depth, ColourType type, const Bytes& row, const Bytes& chunks = {}) {
    return s_signature + header(width, 1, depth, type) + chunks + chunk("IDAT", stored(Bytes{0} + row)) + end();
}

void expectRow(const Bytes& png, const Bytes& rgba) {
    expectPixels(decoded(png), static_cast<std::uint32_t>(rgba.size() / 4), 1, rgba);
}

bool givesNoImage(const Bytes& png) {
    return !decoded(png).has_value();
}

TEST(PNGDecode, GreyOfOneBit) {
    expectRow(oneRow(2, 1, Grey, {0x40}), {0, 0, 0, 255, 255, 255, 255, 255});
}

TEST(PNGDecode, GreyOfTwoBits) {
    expectRow(oneRow(4, 2, Grey, {0x1B}), {0, 0, 0, 255, 85, 85, 85, 255, 170, 170, 170, 255, 255, 255, 255, 255});
}

TEST(PNGDecode, GreyOfFourBits) {
    expectRow(oneRow(2, 4, Grey, {0x3F}), {51, 51, 51, 255, 255, 255, 255, 255});
}

TEST(PNGDecode, GreyOfEightBits) {
    expectRow(oneRow(2, 8, Grey, {0, 200}), {0, 0, 0, 255, 200, 200, 200, 255});
}

TEST(PNGDecode, SixteenBitsAreScaledToTheNearestOfEight) {
    // 0x0180 is 1.494 of 255ths, 0x0182 is 1.502; cutting the low byte off would make 1 and 254 of all four.
    expectRow(oneRow(4, 16, Grey, {0x01, 0x80, 0x01, 0x82, 0xFE, 0x7D, 0xFE, 0x7F}),
              {1, 1, 1, 255, 2, 2, 2, 255, 253, 253, 253, 255, 254, 254, 254, 255});
}

TEST(PNGDecode, GreyWithAlpha) {
    expectRow(oneRow(2, 8, GreyAlpha, {9, 0, 200, 3}), {9, 9, 9, 0, 200, 200, 200, 3});
    expectRow(oneRow(1, 16, GreyAlpha, {0xFF, 0xFF, 0x80, 0x80}), {255, 255, 255, 128});
}

TEST(PNGDecode, ColourWithoutAlphaIsOpaque) {
    expectRow(oneRow(2, 8, RGB, {1, 2, 3, 4, 5, 6}), {1, 2, 3, 255, 4, 5, 6, 255});
    expectRow(oneRow(1, 16, RGB, {0x11, 0x11, 0x22, 0x22, 0x33, 0x33}), {0x11, 0x22, 0x33, 255});
}

TEST(PNGDecode, ColourWithAlphaIsKeptAsItIs) {
    expectRow(oneRow(2, 8, RGBA, {255, 128, 1, 0, 4, 5, 6, 7}), {255, 128, 1, 0, 4, 5, 6, 7});
    expectRow(oneRow(1, 16, RGBA, {0, 0, 0x80, 0x80, 0xFF, 0xFF, 0x40, 0x40}), {0, 128, 255, 64});
}

TEST(PNGDecode, PaletteOfEveryDepth) {
    const auto palette = chunk("PLTE", {10, 20, 30, 40, 50, 60});
    for (const auto& [depth, row] : {std::pair{1, 0x40}, std::pair{2, 0x10}, std::pair{4, 0x01}}) {
        expectRow(oneRow(2, depth, Palette, {static_cast<std::uint8_t>(row)}, palette),
                  {10, 20, 30, 255, 40, 50, 60, 255});
    }
    expectRow(oneRow(2, 8, Palette, {0, 1}, palette), {10, 20, 30, 255, 40, 50, 60, 255});
}

TEST(PNGDecode, PaletteWithAShorterListOfAlphaValues) {
    const auto palette = chunk("PLTE", {10, 20, 30, 40, 50, 60}) + chunk("tRNS", {77});
    expectRow(oneRow(2, 8, Palette, {1, 0}, palette), {40, 50, 60, 255, 10, 20, 30, 77});
}

TEST(PNGDecode, OneGreyLevelMarkedAsTransparent) {
    expectRow(oneRow(2, 2, Grey, {0x60}, chunk("tRNS", {0, 2})), {85, 85, 85, 255, 170, 170, 170, 0});
    expectRow(oneRow(2, 8, Grey, {7, 8}, chunk("tRNS", {0, 7})), {7, 7, 7, 0, 8, 8, 8, 255});
}

TEST(PNGDecode, AMarkedColourOfSixteenBitsIsComparedInAllOfThem) {
    expectRow(oneRow(2, 16, Grey, {0x80, 0x80, 0x80, 0x81}, chunk("tRNS", {0x80, 0x81})),
              {128, 128, 128, 255, 128, 128, 128, 0});
}

TEST(PNGDecode, OneColourMarkedAsTransparent) {
    expectRow(oneRow(2, 8, RGB, {1, 2, 3, 1, 2, 4}, chunk("tRNS", {0, 1, 0, 2, 0, 4})), {1, 2, 3, 255, 1, 2, 4, 0});
}

TEST(PNGDecode, GammaIsNotApplied) {
    expectRow(oneRow(1, 8, Grey, {100}, chunk("gAMA", bigEndian(100000, 4))), {100, 100, 100, 255});
}

TEST(PNGDecode, ChunksThatAreNotNeededAreSkipped) {
    const auto chunks = chunk("tEXt", {'k', 0, 'v'}) + chunk("zzZz", Bytes(100, 1)) + chunk("iCCP", {1, 2, 3});
    expectRow(oneRow(1, 8, Grey, {100}, chunks), {100, 100, 100, 255});
}

TEST(PNGDecode, PixelsMayBeSplitIntoChunksOfEightBytes) {
    constexpr std::size_t chunkSize = 8;
    const Bytes stream = stored(Bytes(16385)); // a filter byte and a row
    auto png = s_signature + header(16384, 1, 8, Grey);
    for (auto rest = stream.begin(); rest != stream.end();) {
        const auto next = rest + std::min<std::ptrdiff_t>(chunkSize, stream.end() - rest);
        png = std::move(png) + chunk("IDAT", {rest, next});
        rest = next;
    }
    EXPECT_TRUE(decoded(png + end()).has_value());
}

TEST(PNGDecode, BytesBehindTheEndDoNotMatter) {
    expectRow(oneRow(1, 8, Grey, {100}) + Bytes(50, 'x'), {100, 100, 100, 255});
}

TEST(PNGDecode, FilesOfAnotherEncoderShowTheSamePixels) {
    const std::string picture = "-size 37x23 plasma:red-blue -seed 3 ";
    const std::string translucent =
        "-size 37x23 plasma:red-blue -seed 3 -alpha set -channel A -evaluate UniformNoise 1 +channel ";
    const std::vector<std::pair<std::string, std::string>> recipes{
        {picture, "PNG24:a.png"},
        {translucent, "PNG32:a.png"},
        {picture, "PNG48:a.png"},
        {translucent, "PNG64:a.png"},
        {picture + "-interlace PNG", "PNG24:a.png"},
        {translucent + "-interlace PNG", "PNG32:a.png"},
        {translucent + "-interlace PNG", "PNG64:a.png"},
        {picture + "-colors 200", "PNG8:a.png"},
        {picture + "-colors 13", "PNG8:a.png"},
        {picture + "-colors 4 -interlace PNG", "PNG8:a.png"},
        {picture + "-colors 2", "PNG8:a.png"},
        {"-size 20x20 xc:none -fill red -draw 'circle 10,10 4,4'", "PNG8:a.png"},
        {picture + "-colorspace gray -define png:color-type=0 -define png:bit-depth=8", "a.png"},
        {picture + "-colorspace gray -define png:color-type=0 -define png:bit-depth=16", "a.png"},
        {picture + "-colorspace gray -depth 4 -define png:color-type=0 -define png:bit-depth=4", "a.png"},
        {picture + "-colorspace gray -depth 2 -define png:color-type=0 -define png:bit-depth=2", "a.png"},
        {picture + "-threshold 50% -define png:color-type=0 -define png:bit-depth=1", "a.png"},
        {picture + "-threshold 50% -interlace PNG -define png:color-type=0 -define png:bit-depth=1", "a.png"},
        {translucent + "-colorspace gray -define png:color-type=4 -define png:bit-depth=8", "a.png"},
        {translucent + "-colorspace gray -define png:color-type=4 -define png:bit-depth=16", "a.png"},
    };
    for (const auto& [arguments, name] : recipes) {
        SCOPED_TRACE(testing::Message() << arguments << ' ' << name);
        expectSameAsElsewhere(encodedElsewhere(arguments, name), "a.png");
    }
}

TEST(PNGDecode, LargePicturesOfOneColourAreNotTakenForHostileOnes) {
    const auto image = decoded(encodedElsewhere("-size 3000x3000 xc:'#102030'", "PNG32:a.png"));
    ASSERT_TRUE(image.has_value());
    EXPECT_EQ(image->width(), 3000U);
    EXPECT_EQ(toBytes(image->rgba().last(4)), (Bytes{0x10, 0x20, 0x30, 0xFF}));
    EXPECT_TRUE(decoded(encodedElsewhere("-size 5000x5000 xc:white -monochrome", "a.png")).has_value());
}

TEST(PNGDecode, EveryTruncationGivesNoImage) {
    expectNoImageFromAnyPrefix(oneRow(2, 8, RGBA, {255, 128, 1, 0, 4, 5, 6, 7}));
    expectNoImageFromAnyPrefix(encodedElsewhere("-size 17x19 plasma:fractal -interlace PNG", "PNG32:a.png"));
    const Image image(5, 4, Bytes(80, 0x33));
    expectNoImageFromAnyPrefix(BitmapImageRep::fromTIFF(image.tiffRepresentation())->pngRepresentation());
}

TEST(PNGDecode, EverySingleByteChangeIsNoticed) {
    const auto alpha = chunk("PLTE", {10, 20, 30, 40, 50, 60}) + chunk("tRNS", {77, 88}) + chunk("tEXt", {'k', 0, 'v'});
    const auto expectNoImage = [](const Bytes& damaged) { EXPECT_TRUE(givesNoImage(damaged)); };
    forEverySingleByteChange(oneRow(2, 8, Palette, {1, 0}, alpha), expectNoImage);
    forEverySingleByteChange(encodedElsewhere("-size 9x11 plasma:fractal -interlace PNG", "PNG32:a.png"),
                             expectNoImage);
}

TEST(PNGDecode, PixelsThatEndEarlyGiveNoImageThoughAllCheckSumsAreRight) {
    const auto head = s_signature + header(2, 2, 8, Grey);
    const Bytes whole{0, 1, 2, 0, 3, 4};
    EXPECT_FALSE(givesNoImage(head + chunk("IDAT", stored(whole)) + end()));
    EXPECT_TRUE(givesNoImage(head + chunk("IDAT", stored({0, 1, 2, 0, 3})) + end()));
    EXPECT_TRUE(givesNoImage(head + chunk("IDAT", stored({0, 1, 2})) + end()));
    EXPECT_TRUE(givesNoImage(head + end()));
}

TEST(PNGDecode, ACompressedStreamWithoutItsEndGivesNoImage) {
    const auto head = s_signature + header(2, 1, 8, Grey);
    auto stream = stored({0, 1, 2});
    for (int missing = 1; missing <= 4; ++missing) {
        stream.pop_back();
        EXPECT_TRUE(givesNoImage(head + chunk("IDAT", stream) + end())) << missing;
    }
}

TEST(PNGDecode, AWrongSumOfThePixelsGivesNoImage) {
    auto stream = stored({0, 1, 2});
    ++stream.back();
    EXPECT_TRUE(givesNoImage(s_signature + header(2, 1, 8, Grey) + chunk("IDAT", stream) + end()));
}

TEST(PNGDecode, MorePixelsThanTheHeaderNamesGiveNoImage) {
    EXPECT_FALSE(givesNoImage(oneRow(2, 8, Grey, {1, 2})));
    EXPECT_TRUE(givesNoImage(oneRow(2, 8, Grey, {1, 2, 3})));
}

TEST(PNGDecode, AnAlphaListOfTheWrongLengthGivesNoImage) {
    EXPECT_TRUE(givesNoImage(oneRow(1, 8, Grey, {1}, chunk("tRNS", {0}))));
    EXPECT_TRUE(givesNoImage(oneRow(1, 8, RGB, {1, 2, 3}, chunk("tRNS", {0, 1}))));
    EXPECT_TRUE(givesNoImage(oneRow(1, 8, Palette, {0}, chunk("PLTE", {1, 2, 3}) + chunk("tRNS", {5, 6}))));
}

TEST(PNGDecode, AWholePictureOverTheLimitGivesNoImage) {
    EXPECT_FALSE(givesNoImage(oneRow(16384, 8, Grey, Bytes(16384))));
    EXPECT_TRUE(givesNoImage(oneRow(16385, 8, Grey, Bytes(16385))));
}

TEST(PNGDecode, MissingChunksGiveNoImage) {
    const auto data = chunk("IDAT", stored({0, 1, 2}));
    EXPECT_TRUE(givesNoImage(s_signature + header(2, 1, 8, Grey) + data));
    EXPECT_TRUE(givesNoImage(s_signature + data + end()));
    EXPECT_TRUE(givesNoImage(oneRow(2, 8, Palette, {0, 0})));
}

TEST(PNGDecode, AnUnknownChunkThatIsNeededGivesNoImage) {
    EXPECT_TRUE(givesNoImage(oneRow(1, 8, Grey, {1}, chunk("ABCD", {}))));
}

TEST(PNGDecode, DepthsThatDoNotExistGiveNoImage) {
    EXPECT_TRUE(givesNoImage(oneRow(1, 3, Grey, {1})));
    EXPECT_TRUE(givesNoImage(oneRow(1, 4, RGB, {1, 2})));
    EXPECT_TRUE(givesNoImage(oneRow(1, 8, static_cast<ColourType>(5), {1})));
}

TEST(PNGDecode, HostileSizesGiveNoImageAndTakeNoMemory) {
    for (const auto& [width, height] : std::vector<std::pair<std::uint32_t, std::uint32_t>>{{0, 0},
                                                                                            {0, 1},
                                                                                            {1, 0},
                                                                                            {16385, 1},
                                                                                            {1, 16385},
                                                                                            {0x7FFFFFFF, 1},
                                                                                            {0x80000000U, 0x80000000U},
                                                                                            {0xFFFFFFFFU, 0xFFFFFFFFU},
                                                                                            {16384, 16384},
                                                                                            {8000, 8000}}) {
        SCOPED_TRACE(std::to_string(width) + " x " + std::to_string(height));
        for (const auto& [depth, type] : {std::pair{8, RGBA}, std::pair{16, RGBA}, std::pair{1, Grey}}) {
            const auto png =
                s_signature + header(width, height, depth, type) + chunk("IDAT", stored(Bytes(100))) + end();
            EXPECT_TRUE(succeedsInLittleMemory([&png] { return givesNoImage(png); }));
        }
    }
}

TEST(PNGDecode, DamagedFilesAreRefusedInSilence) {
    const auto png = encodedElsewhere("-size 9x11 plasma:fractal -set comment text", "PNG32:a.png");
    EXPECT_EQ(printedBy([&png] { forEverySingleByteChange(png, [](const Bytes& damaged) { givesNoImage(damaged); }); }),
              "");
    EXPECT_EQ(printedBy([] { givesNoImage(oneRow(1, 8, Grey, {100}, chunk("iCCP", {1, 2, 3}))); }), "");
}

} // namespace

} // namespace ZULMetaData::Test
