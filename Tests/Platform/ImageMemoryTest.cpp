// A PNG file that there is no memory for is not taken for a damaged one.

#include "Platform/Image.h"

#include "Tests/Support/MemoryWatch.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <new>

namespace ZULMetaData::Test {

namespace {

TEST(ImageWithoutMemory, ThrowsWhateverItIsNeededFor) {
    const Image image(2, 1, {255, 0, 0, 255, 0, 255, 0, 128});
    const auto bitmap = BitmapImageRep::fromTIFF(image.tiffRepresentation());
    const auto png = bitmap->pngRepresentation();
    for (const std::size_t largest : {64U, 512U, 2048U}) { // too little for libpng's structures or for zlib's
        MemoryWatch memory;
        memory.refuseAbove(largest);
        EXPECT_THROW(Image::fromEncodedBytes(png), std::bad_alloc);
        EXPECT_THROW(Image::checkEncodedBytes(png), std::bad_alloc);
        EXPECT_THROW(bitmap->pngRepresentation(), std::bad_alloc);
    }
    MemoryWatch memory;
    memory.refuseAbove(64);
    EXPECT_THROW(Image::infoOfEncodedBytes(png), std::bad_alloc);
    EXPECT_THROW(image.tiffRepresentation(), std::bad_alloc);
}

} // namespace

} // namespace ZULMetaData::Test
