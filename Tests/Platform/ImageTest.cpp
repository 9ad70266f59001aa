#include "Platform/Image.h"

#include "Platform/ImageCodecs.h"
#include "Tests/Platform/ImageTestSupport.h"

#include <gtest/gtest.h>

#include <random>

namespace ZULMetaData::Test {

namespace {

Bytes pngOf(const Image& image) {
    const auto bitmap = BitmapImageRep::fromTIFF(image.tiffRepresentation());
    return bitmap ? bitmap->pngRepresentation() : Bytes();
}

Image plain(std::uint32_t width, std::uint32_t height) {
    return {width, height, Bytes(std::size_t{4} * width * height, 0x7F)};
}

TEST(Image, KeepsWhatItIsGiven) {
    const Image image(2, 1, {1, 2, 3, 4, 5, 6, 7, 8});
    expectPixels(image, 2, 1, {1, 2, 3, 4, 5, 6, 7, 8});
}

TEST(Image, KeepsAWrongAmountOfBytesAsItIs) {
    expectPixels(Image(2, 2, {1, 2, 3}), 2, 2, {1, 2, 3});
}

TEST(Image, WithoutPixelsCannotBeEncoded) {
    EXPECT_TRUE(plain(0, 0).tiffRepresentation().empty());
    EXPECT_TRUE(plain(0, 5).tiffRepresentation().empty());
    EXPECT_TRUE(plain(5, 0).tiffRepresentation().empty());
}

TEST(Image, WithTheWrongAmountOfBytesCannotBeEncoded) {
    EXPECT_TRUE(Image(2, 2, {}).tiffRepresentation().empty());
    EXPECT_TRUE(Image(2, 2, Bytes(15)).tiffRepresentation().empty());
    EXPECT_TRUE(Image(2, 2, Bytes(17)).tiffRepresentation().empty());
    EXPECT_FALSE(Image(2, 2, Bytes(16)).tiffRepresentation().empty());
}

TEST(Image, WithASideOverTheLimitCannotBeEncoded) {
    EXPECT_TRUE(plain(16385, 1).tiffRepresentation().empty());
    EXPECT_TRUE(plain(1, 16385).tiffRepresentation().empty());
    EXPECT_TRUE(Image(0x80000000U, 0x80000000U, {}).tiffRepresentation().empty());
}

TEST(Image, ThatCannotBeEncodedGivesNoPNGEither) {
    EXPECT_TRUE(encodePNG(Image(0, 0, {})).empty());
    EXPECT_TRUE(encodePNG(Image(2, 2, Bytes(15))).empty());
    EXPECT_TRUE(encodePNG(plain(16385, 1)).empty());
    EXPECT_FALSE(encodePNG(plain(2, 2)).empty());
}

TEST(Image, WithASideAtTheLimitComesBack) {
    for (const auto& image : {plain(16384, 1), plain(1, 16384)}) {
        expectPixels(Image::fromEncodedBytes(image.tiffRepresentation()), image.width(), image.height(),
                     toBytes(image.rgba()));
        expectPixels(Image::fromEncodedBytes(pngOf(image)), image.width(), image.height(), toBytes(image.rgba()));
    }
}

TEST(Image, KeepsTheColourOfTransparentPixels) {
    const Bytes rgba{255, 128, 1, 0, 10, 20, 30, 1, 200, 100, 50, 127, 9, 8, 7, 255};
    expectPixels(Image::fromEncodedBytes(pngOf(Image(2, 2, rgba))), 2, 2, rgba);
}

TEST(Image, RandomImagesComeBackByteForByteThroughTIFFAndPNG) {
    std::mt19937 random(20121);
    for (int i = 0; i < 300; ++i) {
        const auto image = randomImage(random, 70);
        SCOPED_TRACE(std::to_string(image.width()) + " x " + std::to_string(image.height()));
        const auto rgba = toBytes(image.rgba());
        expectPixels(Image::fromEncodedBytes(image.tiffRepresentation()), image.width(), image.height(), rgba);
        expectPixels(Image::fromEncodedBytes(pngOf(image)), image.width(), image.height(), rgba);
    }
}

TEST(Image, ItsTIFFAndPNGShowAnotherProgramTheSamePixels) {
    std::mt19937 random(77);
    for (int i = 0; i < 8; ++i) {
        const auto image = randomImage(random, 40);
        EXPECT_EQ(rgbaDecodedElsewhere(image.tiffRepresentation(), "own.tif"), toBytes(image.rgba()));
        EXPECT_EQ(rgbaDecodedElsewhere(pngOf(image), "own.png"), toBytes(image.rgba()));
    }
}

TEST(Image, ItsPNGIsAcceptedByAFormatChecker) {
    const ScratchFolder folder;
    std::mt19937 random(5);
    for (int i = 0; i < 8; ++i) {
        const auto path = folder / (std::to_string(i) + ".png");
        writeFile(path, pngOf(randomImage(random, 200)));
        const auto check = run("pngcheck -q '" + path.string() + "'");
        EXPECT_EQ(check.status, 0) << check.output;
    }
}

TEST(Image, EncodingIsRepeatable) {
    std::mt19937 random(6);
    const auto image = randomImage(random, 50);
    EXPECT_EQ(image.tiffRepresentation(), image.tiffRepresentation());
    EXPECT_EQ(pngOf(image), pngOf(image));
}

TEST(Image, IsNotMadeFromBytesOfNoKnownKind) {
    EXPECT_FALSE(Image::fromEncodedBytes({}).has_value());
    EXPECT_FALSE(Image::fromEncodedBytes(Bytes{0}).has_value());
    EXPECT_FALSE(Image::fromEncodedBytes(Bytes(1000, 'I')).has_value());
    EXPECT_FALSE(Image::fromEncodedBytes(encodedElsewhere("-size 3x3 xc:red", "red.gif")).has_value());
}

TEST(Image, IsNeverMadeFromRandomBytesBehindASignature) {
    std::mt19937 random(8);
    for (const Bytes& signature : {Bytes{0x89, 'P', 'N', 'G', '\r', '\n', 0x1A, '\n'}, Bytes{'I', 'I', 42, 0},
                                   Bytes{'M', 'M', 0, 42}, Bytes{'I', 'I', 43, 0}, Bytes{'M', 'M', 0, 43}}) {
        for (int i = 0; i < 500; ++i) {
            const auto noise = toBytes(randomImage(random, 12).rgba());
            EXPECT_FALSE(Image::fromEncodedBytes(signature + noise).has_value());
        }
    }
}

TEST(BitmapImageRep, TakesTIFFOnly) {
    const auto image = plain(3, 2);
    EXPECT_TRUE(BitmapImageRep::fromTIFF(image.tiffRepresentation()).has_value());
    EXPECT_FALSE(BitmapImageRep::fromTIFF(pngOf(image)).has_value());
    EXPECT_FALSE(BitmapImageRep::fromTIFF({}).has_value());
}

TEST(ScarceMemory, StopsWorkThatNeedsMuch) {
    // An address checker reports the refused memory at length; the result alone counts.
    printedBy([] { EXPECT_FALSE(succeedsInLittleMemory([] { return plain(8192, 8192).width() == 8192; })); });
    EXPECT_TRUE(succeedsInLittleMemory([] { return plain(512, 512).width() == 512; }));
}

} // namespace

} // namespace ZULMetaData::Test
