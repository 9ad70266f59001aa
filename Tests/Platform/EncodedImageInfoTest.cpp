// What an encoded picture says of itself before it is decoded.

#include "Platform/Image.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <span>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using Bytes = std::vector<std::uint8_t>;

Image plainImage(std::uint32_t width, std::uint32_t height) {
    return {width, height, Bytes(std::size_t{4} * width * height, 0x7f)};
}

Bytes pngOf(const Image& image) {
    return BitmapImageRep::fromTIFF(image.tiffRepresentation())->pngRepresentation();
}

TEST(EncodedImageInfo, TellsWidthAndHeightOfBothFormats) {
    const Image image = plainImage(300, 70);
    for (const Bytes& encoded : {pngOf(image), image.tiffRepresentation()}) {
        const auto info = Image::infoOfEncodedBytes(encoded);
        ASSERT_TRUE(info);
        EXPECT_EQ(info->width, 300U);
        EXPECT_EQ(info->height, 70U);
    }
}

TEST(EncodedImageInfo, CountsAtLeastThePixelsThatDecodingMakes) {
    const Image image = plainImage(1000, 500);
    const std::uint64_t pixels = image.rgba().size();
    for (const Bytes& encoded : {pngOf(image), image.tiffRepresentation()}) {
        const auto info = Image::infoOfEncodedBytes(encoded);
        EXPECT_GE(info->decodingMemory, pixels);
        EXPECT_LE(info->decodingMemory, pixels + encoded.size() + (1 << 20));
    }
}

TEST(EncodedImageInfo, CountsTurnedPixelsTwice) {
    Bytes tiff = plainImage(400, 300).tiffRepresentation();
    const std::uint64_t upright = Image::infoOfEncodedBytes(tiff)->decodingMemory;
    const Bytes orientation{0x12, 0x01, 3, 0, 1, 0, 0, 0, 1}; // tag 274, one 16-bit number: upright
    const auto found = std::search(tiff.begin(), tiff.end(), orientation.begin(), orientation.end());
    ASSERT_NE(found, tiff.end());
    found[8] = 6; // a quarter to the right
    EXPECT_EQ(Image::infoOfEncodedBytes(tiff)->decodingMemory, upright + 4 * 400 * 300);
}

TEST(EncodedImageInfo, TellsNothingOfWhatHeadersAlreadyRuleOut) {
    const Bytes png = pngOf(plainImage(3, 2));
    EXPECT_FALSE(Image::infoOfEncodedBytes({}));
    EXPECT_FALSE(Image::infoOfEncodedBytes(Bytes{'n', 'o', 'n', 'e'}));
    EXPECT_FALSE(Image::infoOfEncodedBytes(std::span(png).first(20)));
    EXPECT_FALSE(Image::infoOfEncodedBytes(Bytes{'I', 'I', 42, 0, 8, 0, 0, 0, 1, 0}));
}

TEST(EncodedImageInfo, DoesNotLookAtThePixels) {
    Bytes png = pngOf(plainImage(3, 2));
    png[png.size() - 16] ^= 0xff; // in the check sum of the pixels
    EXPECT_TRUE(Image::infoOfEncodedBytes(png));
    EXPECT_FALSE(Image::fromEncodedBytes(png));
}

} // namespace
} // namespace ZULMetaData::Test
