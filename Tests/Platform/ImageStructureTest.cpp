// Images in a build without codecs: what is told of files that another program wrote, and of damaged ones. The sources
// for such builds stand in this program in place of the library's.

#include "Platform/Image.h"

#include "Tests/Platform/ImageTestSupport.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {

namespace {

void expectSize(const Bytes& encoded, std::uint32_t width, std::uint32_t height) {
    const auto info = Image::infoOfEncodedBytes(encoded);
    ASSERT_TRUE(info.has_value());
    EXPECT_EQ(info->width, width);
    EXPECT_EQ(info->height, height);
    EXPECT_GE(info->decodingMemory, std::uint64_t{4} * width * height);
    const auto image = Image::fromEncodedBytes(encoded);
    ASSERT_TRUE(image.has_value());
    EXPECT_EQ(image->width(), width);
    EXPECT_EQ(image->height(), height);
    EXPECT_TRUE(image->rgba().empty());
    const EncodedImageCheck check = Image::checkEncodedBytes(encoded);
    EXPECT_EQ(check.state, EncodedImageCheck::Decodable);
    EXPECT_EQ(check.width, width);
    EXPECT_EQ(check.height, height);
    EXPECT_GE(check.unpackedBytes, std::uint64_t{width} * height / 8);
    EXPECT_EQ(check.surplusBytes, 0U);
}

TEST(ImageStructure, TellsTheSizeOfPNGFiles) {
    for (const std::string options : {"", "-interlace PNG", "-monochrome", "-colors 16", "-depth 16", "-alpha set"}) {
        SCOPED_TRACE(options);
        expectSize(encodedElsewhere("-size 31x17 plasma:fractal " + options, "a.png"), 31, 17);
    }
    expectSize(encodedElsewhere("-size 9x11 plasma:fractal -colors 4", "PNG8:a.png"), 9, 11);
}

TEST(ImageStructure, TellsTheSizeOfTIFFFiles) {
    for (const std::string options : {"-compress None", "-compress LZW", "-compress Zip", "-compress RLE",
                                      "-compress JPEG", "-monochrome -compress None", "-depth 16 -compress None",
                                      "-endian MSB -compress None", "-define tiff:tile-geometry=16x16 -compress None",
                                      "-interlace plane -compress None", "-define tiff:rows-per-strip=1"}) {
        SCOPED_TRACE(options);
        expectSize(encodedElsewhere("-size 31x17 plasma:fractal " + options, "a.tif"), 31, 17);
    }
    expectSize(encodedElsewhere("-size 31x17 plasma:fractal -compress None", "TIFF64:a.tif"), 31, 17);
    expectSize(encodedElsewhere("-size 31x17 plasma:fractal -orient RightTop -compress None", "a.tif"), 17, 31);
    expectSize(encodedElsewhere("-size 31x17 plasma:fractal -orient BottomRight -compress None", "a.tif"), 31, 17);
}

TEST(ImageStructure, SeesThatAFileIsCutShort) {
    expectNoImageFromAnyPrefix(encodedElsewhere("-size 17x19 plasma:fractal -interlace PNG", "PNG32:a.png"));
    const Bytes tiff = encodedElsewhere("-size 17x19 plasma:fractal -compress None", "a.tif");
    const Bytes half(tiff.begin(), tiff.begin() + static_cast<std::ptrdiff_t>(tiff.size() / 2));
    EXPECT_FALSE(Image::fromEncodedBytes(half).has_value());
}

TEST(ImageStructure, SeesEveryChangedByteOfAPNGFile) {
    forEverySingleByteChange(encodedElsewhere("-size 9x11 plasma:fractal", "PNG32:a.png"),
                             [](const Bytes& png) { EXPECT_FALSE(Image::fromEncodedBytes(png).has_value()); });
}

TEST(ImageStructure, SurvivesEveryChangedByteOfATIFFFile) {
    forEverySingleByteChange(encodedElsewhere("-size 9x11 plasma:fractal -compress None", "a.tif"),
                             [](const Bytes& tiff) {
                                 Image::infoOfEncodedBytes(tiff);
                                 Image::fromEncodedBytes(tiff);
                             });
}

TEST(ImageStructure, RefusesWhatIsNoImage) {
    for (const Bytes& bytes : {Bytes{}, Bytes{'I', 'I', 42, 0}, Bytes(100, 0), Bytes(100, 0xff), Bytes(100, 'M')}) {
        EXPECT_FALSE(Image::infoOfEncodedBytes(bytes).has_value());
        EXPECT_FALSE(Image::fromEncodedBytes(bytes).has_value());
        EXPECT_EQ(Image::checkEncodedBytes(bytes).state, EncodedImageCheck::Undecodable);
    }
    EXPECT_FALSE(Image::fromEncodedBytes(encodedElsewhere("-size 20x20 xc:white -monochrome -compress Group4", "a.tif"))
                     .has_value());
}

TEST(ImageStructure, CountsBytesAfterTheEndOfAPNGFile) {
    const Bytes png = encodedElsewhere("-size 9x11 plasma:fractal", "PNG32:a.png");
    EXPECT_EQ(Image::checkEncodedBytes(png + Bytes(7)).surplusBytes, 7U);
}

TEST(ImageStructure, EncodesNothing) {
    const Image image(1, 1, {1, 2, 3, 4});
    EXPECT_TRUE(image.tiffRepresentation().empty());
    EXPECT_FALSE(BitmapImageRep::fromTIFF(image.tiffRepresentation()).has_value());
}

} // namespace

} // namespace ZULMetaData::Test
