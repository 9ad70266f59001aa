// Images in a build without codecs: what is told of files that another program wrote, and of damaged ones. The source
// for such builds stands in this program in place of the library's.

#include "Platform/Image.h"

#include "Tests/Platform/ImageTestSupport.h"
#include "Tests/Platform/PNGFile.h"

#include <gtest/gtest.h>

namespace ZULMetaData::Test {

namespace {

void expectSize(const Bytes& encoded, std::uint32_t width, std::uint32_t height) {
    const auto info = Image::infoOfEncodedBytes(encoded);
    ASSERT_TRUE(info.has_value());
    EXPECT_EQ(info->width, width);
    EXPECT_EQ(info->height, height);
    EXPECT_GE(info->decodingMemory, std::uint64_t{4} * width * height);
    expectPixels(Image::fromEncodedBytes(encoded), width, height, {});
    const EncodedImageCheck check = Image::checkEncodedBytes(encoded);
    EXPECT_EQ(check.state, EncodedImageCheck::Decodable);
    EXPECT_EQ(check.width, width);
    EXPECT_EQ(check.height, height);
    EXPECT_EQ(check.unpackedBytes, std::uint64_t{4} * width * height);
}

void expectNoImage(const Bytes& bytes) {
    EXPECT_FALSE(Image::infoOfEncodedBytes(bytes).has_value());
    EXPECT_FALSE(Image::fromEncodedBytes(bytes).has_value());
    EXPECT_EQ(Image::checkEncodedBytes(bytes).state, EncodedImageCheck::Undecodable);
}

TEST(ImageWithoutCodecs, TellsTheSizeOfPNGFiles) {
    for (const std::string options : {"", "-interlace PNG", "-monochrome", "-colors 16", "-depth 16", "-alpha set"}) {
        SCOPED_TRACE(options);
        expectSize(encodedElsewhere("-size 31x17 plasma:fractal " + options, "a.png"), 31, 17);
    }
}

TEST(ImageWithoutCodecs, TellsTheSizeOfTIFFFiles) {
    for (const std::string options : {"-compress None", "-compress LZW", "-compress JPEG", "-endian MSB",
                                      "-define tiff:tile-geometry=16x16", "-orient BottomRight"}) {
        SCOPED_TRACE(options);
        expectSize(encodedElsewhere("-size 31x17 plasma:fractal " + options, "a.tif"), 31, 17);
    }
    expectSize(encodedElsewhere("-size 31x17 plasma:fractal", "TIFF64:a.tif"), 31, 17);
    expectSize(encodedElsewhere("-size 31x17 plasma:fractal -orient RightTop", "a.tif"), 17, 31);
}

TEST(ImageWithoutCodecs, NeedsNoMoreThanTheHeaders) {
    const Bytes png = encodedElsewhere("-size 31x17 plasma:fractal", "a.png");
    expectSize({png.begin(), png.begin() + 24}, 31, 17);
    for (std::size_t length = 0; length < 24; ++length)
        expectNoImage({png.begin(), png.begin() + static_cast<std::ptrdiff_t>(length)});
}

TEST(ImageWithoutCodecs, SurvivesEveryChangedByteAndEveryPrefixOfATIFFFile) {
    const Bytes tiff = encodedElsewhere("-size 9x11 plasma:fractal -compress None", "a.tif");
    forEverySingleByteChange(tiff, [](const Bytes& changed) { Image::infoOfEncodedBytes(changed); });
    for (std::size_t length = 0; length < tiff.size(); ++length)
        Image::infoOfEncodedBytes(Bytes(tiff.begin(), tiff.begin() + static_cast<std::ptrdiff_t>(length)));
}

TEST(ImageWithoutCodecs, RefusesWhatStatesNoSize) {
    for (const Bytes& bytes : {Bytes{}, Bytes{'I', 'I', 42, 0}, Bytes(100, 0), Bytes(100, 0xff), Bytes(100, 'M')})
        expectNoImage(bytes);
    expectNoImage(s_signature + header(16385, 1, 8, RGBA));
    expectNoImage(s_signature + header(1, 0, 8, RGBA));
}

TEST(ImageWithoutCodecs, EncodesNothing) {
    const Image image(1, 1, {1, 2, 3, 4});
    EXPECT_TRUE(image.tiffRepresentation().empty());
    EXPECT_FALSE(BitmapImageRep::fromTIFF(image.tiffRepresentation()).has_value());
}

} // namespace

} // namespace ZULMetaData::Test
