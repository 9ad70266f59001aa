// What is told of an encoded picture without an image being made of it, and what that may cost at most.

#include "Platform/Image.h"

#include "Tests/Platform/ImageTestSupport.h"
#include "Tests/Platform/PNGFile.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

Bytes pngOfZeros(std::uint32_t width, std::uint32_t height, std::uint64_t unpacked) {
    return s_signature + header(width, height, 8, RGBA) + chunk("IDAT", zlibOfZeros(unpacked)) + end();
}

EncodedImageCheck checkInLittleMemory(const Bytes& encoded) {
    EXPECT_TRUE(succeedsInLittleMemory([&] {
        Image::checkEncodedBytes(encoded);
        return true;
    }));
    return Image::checkEncodedBytes(encoded);
}

TEST(EncodedImageCheck, AgreesWithTheDecoderOnEveryChangedByte) {
    const std::vector<std::pair<std::string, std::string>> files{
        {"", "PNG32:a.png"},
        {"", "PNG8:a.png"},
        {"-interlace PNG", "PNG32:a.png"},
        {"-compress LZW", "a.tif"},
        {"-compress Zip", "a.tif"},
        {"-depth 8 -compress LZW -define tiff:tile-geometry=32x16", "a.tif"},
        {"-compress JPEG", "a.tif"},
        {"-compress RLE", "a.tif"},
    };
    for (const auto& [options, name] : files) {
        SCOPED_TRACE(options + ' ' + name);
        const Bytes encoded = encodedElsewhere("-size 9x11 plasma:fractal " + options, name);
        EXPECT_TRUE(decoded(encoded));
        forEverySingleByteChange(encoded, [](const Bytes& changed) { decoded(changed); });
    }
}

TEST(EncodedImageCheck, TellsTheSizeAndWhatThePixelsTake) {
    const Bytes png = encodedElsewhere("-size 31x17 plasma:fractal", "PNG32:a.png");
    const EncodedImageCheck check = Image::checkEncodedBytes(png);
    EXPECT_EQ(check.state, EncodedImageCheck::Decodable);
    EXPECT_EQ(check.width, 31U);
    EXPECT_EQ(check.height, 17U);
    EXPECT_EQ(check.unpackedBytes, 31U * 17 * 4);
    EXPECT_EQ(check.surplusBytes, 0U);
    const EncodedImageCheck turned = Image::checkEncodedBytes(
        encodedElsewhere("-size 31x17 plasma:fractal -orient RightTop -compress None", "a.tif"));
    EXPECT_EQ(turned.state, EncodedImageCheck::Decodable);
    EXPECT_EQ(turned.width, 17U);
    EXPECT_EQ(turned.height, 31U);
}

TEST(EncodedImageCheck, DoesNotUnpackAGigabyteOfPixels) {
    const Bytes png = pngOfZeros(16384, 16384, std::uint64_t{1} << 30);
    const EncodedImageCheck check = checkInLittleMemory(png);
    EXPECT_EQ(check.state, EncodedImageCheck::NotUnpacked);
    EXPECT_EQ(check.width, 16384U);
    EXPECT_EQ(check.height, 16384U);
    EXPECT_EQ(check.unpackedBytes, std::uint64_t{1} << 30);
}

TEST(EncodedImageCheck, SeesWrongCheckSumsInAPictureThatIsTooLargeToUnpack) {
    Bytes png = pngOfZeros(16384, 16384, std::uint64_t{1} << 30);
    png[png.size() - 20] ^= 1;
    EXPECT_EQ(checkInLittleMemory(png).state, EncodedImageCheck::Undecodable);
}

TEST(EncodedImageCheck, DoesNotUnpackAGigabyteAfterTheLastPixel) {
    const Bytes png = pngOfZeros(16, 16, std::uint64_t{1} << 30);
    const EncodedImageCheck check = checkInLittleMemory(png);
    EXPECT_EQ(check.state, EncodedImageCheck::Undecodable);
    EXPECT_GT(check.surplusBytes, std::uint64_t{6} << 20);
    EXPECT_LT(check.surplusBytes, png.size());
    EXPECT_FALSE(Image::fromEncodedBytes(pngOfZeros(16, 16, 1 << 20))) << "less of it is no image either";
    EXPECT_EQ(Image::checkEncodedBytes(pngOfZeros(16, 16, 1 << 20)).state, EncodedImageCheck::Undecodable);
}

TEST(EncodedImageCheck, CountsBytesAfterTheEndOfAPNGFile) {
    const Bytes png = encodedElsewhere("-size 31x17 plasma:fractal", "PNG32:a.png");
    const EncodedImageCheck check = Image::checkEncodedBytes(png + Bytes(1000));
    EXPECT_EQ(check.state, EncodedImageCheck::Decodable);
    EXPECT_EQ(check.surplusBytes, 1000U);
}

TEST(EncodedImageCheck, DecodesATIFFFileOnlyInTheMemoryThatItMayTake) {
    const Bytes tiff = encodedElsewhere("-size 100x100 plasma:fractal -compress Zip", "a.tif");
    EXPECT_EQ(Image::checkEncodedBytes(tiff).state, EncodedImageCheck::Decodable);
    const EncodedImageCheck check = Image::checkEncodedBytes(tiff, 10000);
    EXPECT_EQ(check.state, EncodedImageCheck::NotUnpacked);
    EXPECT_EQ(check.width, 100U);
    EXPECT_EQ(check.height, 100U);
}

TEST(EncodedImageCheck, DoesNotUnpackALargeTIFFFile) {
    for (const std::string compression : {"Zip", "LZW", "JPEG", "RLE"}) {
        SCOPED_TRACE(compression);
        const Bytes tiff = encodedElsewhere("-size 4000x3000 xc:red -compress " + compression, "a.tif");
        const EncodedImageCheck check = checkInLittleMemory(tiff);
        EXPECT_EQ(check.state, EncodedImageCheck::NotUnpacked);
        EXPECT_EQ(check.width, 4000U);
        EXPECT_EQ(check.height, 3000U);
    }
}

TEST(EncodedImageCheck, TellsNothingOfWhatIsNoPicture) {
    for (const Bytes& bytes : {Bytes{}, Bytes{'I', 'I', 42, 0}, Bytes(100, 0), s_signature, s_signature + end()}) {
        const EncodedImageCheck check = Image::checkEncodedBytes(bytes);
        EXPECT_EQ(check.state, EncodedImageCheck::Undecodable);
        EXPECT_EQ(check.width, 0U);
        EXPECT_EQ(check.unpackedBytes, 0U);
    }
}

} // namespace

} // namespace ZULMetaData::Test
