#include "Platform/Image.h"

#include "Tests/Platform/ImageTestSupport.h"

#include <gtest/gtest.h>
#include <tiffio.h>

#include <algorithm>
#include <map>

namespace ZULMetaData::Test {

namespace {

// A classic big-endian file: header, directory, long values, pixels. Tags and numbers are those of the format.
class TIFFFile {
public:
    enum Tag : std::uint16_t {
        Width = 256,
        Height = 257,
        Bits = 258,
        Compression = 259,
        Photometric = 262,
        StripOffset = 273,
        Orientation = 274,
        Samples = 277,
        RowsPerStrip = 278,
        StripSize = 279,
        Planar = 284,
        ColourMap = 320,
        ExtraSamples = 338,
        SampleFormat = 339
    };
    enum Colours : std::uint16_t { WhiteIsZero = 0, BlackIsZero = 1, RGB = 2, Palette = 3, CMYK = 5 };

    TIFFFile(std::uint32_t width, std::uint32_t height, Colours colours, int samples, int bits, Bytes pixels)
        : pixels_(std::move(pixels)) {
        set(Width, {width}, 4);
        set(Height, {height}, 4);
        set(Bits, std::vector<std::uint32_t>(static_cast<std::size_t>(samples), static_cast<std::uint32_t>(bits)));
        set(Compression, {1});
        set(Photometric, {colours});
        set(Samples, {static_cast<std::uint32_t>(samples)});
        set(RowsPerStrip, {height}, 4);
        set(StripSize, {static_cast<std::uint32_t>(pixels_.size())}, 4);
        set(StripOffset, {0}, 4);
    }

    TIFFFile& set(std::uint16_t tag, std::vector<std::uint32_t> values, int size = 2) {
        entries_[tag] = {size, std::move(values)};
        return *this;
    }

    TIFFFile& remove(Tag tag) {
        entries_.erase(tag);
        return *this;
    }

    // All strips begin where the pixels do.
    Bytes bytes() {
        const auto directoryEnd = 8 + 2 + 12 * entries_.size() + 4;
        std::size_t longValues = 0;
        for (const auto& [tag, entry] : entries_) {
            longValues += entry.bytes().size() > 4 ? entry.bytes().size() : 0;
        }
        auto& offsets = entries_[StripOffset].values;
        std::fill(offsets.begin(), offsets.end(), static_cast<std::uint32_t>(directoryEnd + longValues));

        auto file = Bytes{'M', 'M', 0, 42, 0, 0, 0, 8} + bigEndian(entries_.size(), 2);
        Bytes behind;
        for (const auto& [tag, entry] : entries_) {
            const auto value = entry.bytes();
            file = file + bigEndian(tag, 2) + bigEndian(entry.size == 2 ? 3 : 4, 2) + bigEndian(entry.values.size(), 4);
            file = file + (value.size() > 4 ? bigEndian(directoryEnd + behind.size(), 4) : padded(value));
            behind = behind + (value.size() > 4 ? value : Bytes());
        }
        return file + Bytes(4) + behind + pixels_;
    }

private:
    struct Entry {
        int size = 2;
        std::vector<std::uint32_t> values;

        Bytes bytes() const {
            Bytes all;
            for (const auto value : values) {
                all = std::move(all) + bigEndian(value, size);
            }
            return all;
        }
    };

    static Bytes padded(Bytes value) {
        value.resize(4);
        return value;
    }

    std::map<std::uint16_t, Entry> entries_;
    Bytes pixels_;
};

TIFFFile rgba(std::uint32_t width, Bytes pixels, std::uint16_t alphaKind) {
    TIFFFile file(width, 1, TIFFFile::RGB, 4, 8, std::move(pixels));
    file.set(TIFFFile::ExtraSamples, {alphaKind});
    return file;
}

TIFFFile grey(std::uint32_t width, std::uint32_t height, int bits, Bytes pixels) {
    return {width, height, TIFFFile::BlackIsZero, 1, bits, std::move(pixels)};
}

Bytes opaqueGreys(const Bytes& levels) {
    Bytes pixels;
    for (const auto level : levels) {
        pixels = std::move(pixels) + Bytes{level, level, level, 255};
    }
    return pixels;
}

void expectRow(TIFFFile file, const Bytes& pixels) {
    expectPixels(decoded(file.bytes()), static_cast<std::uint32_t>(pixels.size() / 4), 1, pixels);
}

bool givesNoImage(const Bytes& tiff) {
    return !decoded(tiff).has_value();
}

constexpr std::uint16_t s_unspecified = 0;
constexpr std::uint16_t s_premultiplied = 1;
constexpr std::uint16_t s_straight = 2;

TEST(TIFFDecode, StraightAlphaIsKeptAsItIs) {
    const Bytes pixels{255, 128, 1, 0, 10, 20, 30, 1, 200, 100, 50, 127};
    expectRow(rgba(3, pixels, s_straight), pixels);
}

TEST(TIFFDecode, AnExtraSampleOfUnspecifiedMeaningIsStraightAlpha) {
    const Bytes pixels{255, 128, 1, 0, 10, 20, 30, 1};
    expectRow(rgba(2, pixels, s_unspecified), pixels);
}

TEST(TIFFDecode, PremultipliedAlphaBecomesStraight) {
    expectRow(rgba(4, {64, 32, 0, 128, 0, 0, 0, 0, 7, 8, 9, 255, 1, 3, 200, 3}, s_premultiplied),
              {128, 64, 0, 128, 0, 0, 0, 0, 7, 8, 9, 255, 85, 255, 255, 3});
}

TEST(TIFFDecode, GreyOfEveryDepth) {
    expectRow(grey(2, 1, 1, {0x40}), opaqueGreys({0, 255}));
    expectRow(grey(4, 1, 2, {0x1B}), opaqueGreys({0, 85, 170, 255}));
    expectRow(grey(2, 1, 4, {0x3F}), opaqueGreys({51, 255}));
    expectRow(grey(2, 1, 8, {0, 200}), opaqueGreys({0, 200}));
    expectRow(grey(2, 1, 16, {0x12, 0x12, 0xFF, 0xFF}), opaqueGreys({0x12, 255}));
}

TEST(TIFFDecode, GreyWithWhiteAsZero) {
    expectRow({2, 1, TIFFFile::WhiteIsZero, 1, 8, {0, 200}}, opaqueGreys({255, 55}));
}

TEST(TIFFDecode, GreyWithAlpha) {
    TIFFFile file(2, 1, TIFFFile::BlackIsZero, 2, 8, {100, 0, 50, 100});
    expectRow(file.set(TIFFFile::ExtraSamples, {s_straight}), {100, 100, 100, 0, 50, 50, 50, 100});
    expectRow(file.set(TIFFFile::ExtraSamples, {s_premultiplied}), {0, 0, 0, 0, 128, 128, 128, 100});
}

TEST(TIFFDecode, AlphaThatCouldNotBeReadIsNotDropped) {
    TIFFFile deep(1, 1, TIFFFile::BlackIsZero, 2, 16, {1, 2, 3, 4});
    EXPECT_TRUE(givesNoImage(deep.set(TIFFFile::ExtraSamples, {s_straight}).bytes()));
    TIFFFile planar(2, 1, TIFFFile::BlackIsZero, 2, 8, {1, 2, 3, 4});
    planar.set(TIFFFile::ExtraSamples, {s_straight}).set(TIFFFile::Planar, {2});
    planar.set(TIFFFile::StripOffset, {0, 0}, 4).set(TIFFFile::StripSize, {2, 2}, 4);
    EXPECT_TRUE(givesNoImage(planar.bytes()));
}

TEST(TIFFDecode, Palette) {
    TIFFFile file(2, 1, TIFFFile::Palette, 1, 1, {0x40});
    file.set(TIFFFile::ColourMap, {0x1010, 0x4040, 0x2020, 0x5050, 0x3030, 0x6060});
    expectRow(file, {0x10, 0x20, 0x30, 255, 0x40, 0x50, 0x60, 255});
}

TEST(TIFFDecode, SixteenBitsAreScaledToTheNearestOfEight) {
    TIFFFile file(1, 1, TIFFFile::RGB, 4, 16, {0x01, 0x80, 0x01, 0x82, 0xFE, 0x7F, 0x80, 0x80});
    expectRow(file.set(TIFFFile::ExtraSamples, {s_straight}), {1, 2, 254, 128});
}

TEST(TIFFDecode, EveryOrientationIsTurnedUpright) {
    // Stored are the rows 1 2 3 and 4 5 6; the names say where the first row and the first column belong.
    const std::vector<std::pair<std::uint32_t, Bytes>> upright{
        {2, {1, 2, 3, 4, 5, 6}}, {2, {3, 2, 1, 6, 5, 4}}, {2, {6, 5, 4, 3, 2, 1}}, {2, {4, 5, 6, 1, 2, 3}},
        {3, {1, 4, 2, 5, 3, 6}}, {3, {4, 1, 5, 2, 6, 3}}, {3, {6, 3, 5, 2, 4, 1}}, {3, {3, 6, 2, 5, 1, 4}}};
    std::uint32_t orientation = 1;
    for (const auto& [height, levels] : upright) {
        SCOPED_TRACE(orientation);
        auto file = grey(3, 2, 8, {1, 2, 3, 4, 5, 6});
        file.set(TIFFFile::Orientation, {orientation++});
        expectPixels(decoded(file.bytes()), 6 / height, height, opaqueGreys(levels));
        EXPECT_EQ(Image::infoOfEncodedBytes(file.bytes())->width, 6 / height);
        EXPECT_EQ(Image::infoOfEncodedBytes(file.bytes())->height, height);
    }
}

TEST(TIFFDecode, FilesOfAnotherEncoderShowTheSamePixels) {
    const std::string picture = "-size 37x23 plasma:red-blue -seed 3 ";
    const std::string straight = "-size 37x23 plasma:red-blue -seed 3 -alpha set -channel A -evaluate UniformNoise 1 "
                                 "+channel -define tiff:alpha=unassociated ";
    const std::vector<std::pair<std::string, std::string>> recipes{
        {picture + "-depth 8 -compress None", "a.tif"},
        {picture + "-depth 8 -compress RLE", "a.tif"},
        {picture + "-depth 8 -compress LZW", "a.tif"},
        {picture + "-depth 8 -compress Zip", "a.tif"},
        {picture + "-depth 16 -compress Zip", "a.tif"},
        {straight + "-depth 8 -compress None", "a.tif"},
        {straight + "-depth 8 -compress RLE -endian MSB", "a.tif"},
        {straight + "-depth 8 -compress LZW -define tiff:predictor=2", "a.tif"},
        {straight + "-depth 8 -compress Zip -define tiff:rows-per-strip=5", "a.tif"},
        {straight + "-depth 8 -compress None", "TIFF64:a.tif"},
        {straight + "-depth 16 -compress None -endian MSB", "a.tif"},
        {straight + "-depth 16 -compress Zip -define tiff:tile-geometry=16x16", "a.tif"},
        {straight + "-depth 8 -compress LZW -define tiff:tile-geometry=32x16", "a.tif"},
        {straight + "-depth 8 -compress None -interlace plane", "a.tif"},
        {straight + "-depth 16 -compress Zip -interlace plane", "a.tif"},
        {picture + "-depth 8 -colorspace gray", "a.tif"},
        {picture + "-threshold 50% -monochrome -compress None", "a.tif"},
        {picture + "-threshold 50% -monochrome -compress None -define quantum:polarity=min-is-white", "a.tif"},
        {straight + "-colorspace gray -depth 8 -compress Zip", "a.tif"},
    };
    for (const auto& [arguments, name] : recipes) {
        SCOPED_TRACE(testing::Message() << arguments << ' ' << name);
        expectSameAsElsewhere(encodedElsewhere(arguments, name), "a.tif");
    }
}

// Levels that are rounded or unpacked in other ways may differ a little.
void expectNearElsewhere(const std::string& arguments, int difference) {
    SCOPED_TRACE(arguments);
    const auto tiff = encodedElsewhere(arguments, "a.tif");
    const auto image = decoded(tiff);
    const auto expected = rgbaDecodedElsewhere(tiff, "a.tif");
    ASSERT_TRUE(image.has_value());
    ASSERT_EQ(image->rgba().size(), expected.size());
    for (std::size_t i = 0; i < expected.size(); ++i) {
        ASSERT_NEAR(image->rgba()[i], expected[i], difference) << i;
    }
}

TEST(TIFFDecode, DeepGreyAndPalettesAreReadToWithinOneLevel) {
    expectNearElsewhere("-size 37x23 plasma:red-blue -colorspace gray -depth 16", 1);
    expectNearElsewhere("-size 37x23 plasma:red-blue -depth 8 -type Palette -colors 50", 1);
    expectNearElsewhere("-size 37x23 plasma:red-blue -depth 4 -type Palette -colors 9", 1);
}

TEST(TIFFDecode, PhotographicCompressionIsReadLikeElsewhere) {
    expectNearElsewhere("-size 64x48 gradient:red-blue -depth 8 -compress JPEG -quality 90", 2);
}

TEST(TIFFDecode, LargePicturesOfOneColourAreNotTakenForHostileOnes) {
    for (const std::string options :
         {"-compress RLE", "-compress LZW", "-compress Zip", "-compress JPEG -quality 50"}) {
        for (const std::string picture : {"xc:red", "xc:gray50 -colorspace gray"}) {
            SCOPED_TRACE(testing::Message() << options << ' ' << picture);
            const auto inOneStrip = "-size 3000x3000 " + picture + " -depth 8 -define tiff:rows-per-strip=3000 ";
            EXPECT_FALSE(givesNoImage(encodedElsewhere(inOneStrip + options, "a.tif")));
        }
    }
}

TEST(TIFFDecode, AWholePictureOverTheLimitGivesNoImage) {
    EXPECT_FALSE(givesNoImage(grey(16384, 1, 8, Bytes(16384)).bytes()));
    EXPECT_TRUE(givesNoImage(grey(16385, 1, 8, Bytes(16385)).bytes()));
    EXPECT_TRUE(givesNoImage(grey(1, 16385, 8, Bytes(16385)).bytes()));
}

TEST(TIFFDecode, ColoursThatWouldNeedAGuessGiveNoImage) {
    EXPECT_TRUE(givesNoImage(TIFFFile(1, 1, TIFFFile::CMYK, 4, 8, {1, 2, 3, 4}).bytes()));
    auto signedLevels = grey(2, 1, 8, {1, 2});
    EXPECT_FALSE(givesNoImage(signedLevels.bytes()));
    EXPECT_TRUE(givesNoImage(signedLevels.set(TIFFFile::SampleFormat, {2}).bytes()));
}

TEST(TIFFDecode, CompressionsThatHideDamageGiveNoImage) {
    EXPECT_TRUE(givesNoImage(encodedElsewhere("-size 20x20 xc:white -monochrome -compress Group4", "a.tif")));
}

TEST(TIFFDecode, EveryTruncationGivesNoImage) {
    expectNoImageFromAnyPrefix(Image(5, 4, Bytes(80, 0x33)).tiffRepresentation());
    expectNoImageFromAnyPrefix(rgba(3, {255, 128, 1, 0, 10, 20, 30, 1, 200, 100, 50, 127}, s_straight).bytes());
    for (const std::string compression : {"None", "RLE", "LZW", "Zip"}) {
        SCOPED_TRACE(compression);
        expectNoImageFromAnyPrefix(
            encodedElsewhere("-size 17x19 plasma:fractal -alpha set -depth 8 -compress " + compression, "a.tif"));
    }
}

TEST(TIFFDecode, PixelsThatEndEarlyGiveNoImage) {
    auto whole = grey(3, 2, 8, {1, 2, 3, 4, 5, 6});
    EXPECT_FALSE(givesNoImage(whole.bytes()));
    auto cut = grey(3, 2, 8, {1, 2, 3, 4, 5});
    EXPECT_TRUE(givesNoImage(cut.bytes()));
    EXPECT_TRUE(givesNoImage(cut.set(TIFFFile::StripSize, {6}, 4).bytes()));
}

TEST(TIFFDecode, ACompressedStripThatIsTooShortGivesNoImage) {
    constexpr std::uint32_t packBits = 32773;
    for (const Bytes& strip : {Bytes{5, 1, 2, 3, 4, 5, 6}, Bytes{4, 1, 2, 3, 4, 5}, Bytes{251, 9}, Bytes{252, 9}}) {
        auto file = grey(3, 2, 8, strip);
        const bool whole = strip.front() == 5 || strip.front() == 251;
        EXPECT_EQ(givesNoImage(file.set(TIFFFile::Compression, {packBits}).bytes()), !whole);
    }
}

TEST(TIFFDecode, PhotographicPixelsThatEndEarlyGiveNoImage) {
    auto tiff = encodedElsewhere("-size 64x64 plasma:fractal -depth 8 -compress JPEG", "a.tif");
    ASSERT_FALSE(givesNoImage(tiff));
    // The pixels come first in these files: zeros over their second half end them early.
    const auto first = tiff.begin() + static_cast<std::ptrdiff_t>(tiff.size() / 2);
    const Bytes endOfPicture{0xFF, 0xD9};
    const auto end = std::search(first, tiff.end(), endOfPicture.begin(), endOfPicture.end());
    ASSERT_NE(end, tiff.end());
    std::fill(first, end + 2, std::uint8_t{0});
    EXPECT_TRUE(givesNoImage(tiff));
}

TEST(TIFFDecode, NoSingleByteChangeDoesHarm) {
    std::vector<Bytes> files{Image(4, 3, Bytes(48, 0x5A)).tiffRepresentation(),
                             rgba(2, {1, 2, 3, 4, 5, 6, 7, 8}, s_premultiplied).bytes()};
    for (const std::string options : {"-compress LZW -define tiff:predictor=2", "-compress RLE -type Palette",
                                      "-compress Zip -define tiff:tile-geometry=16x16", "-compress JPEG"}) {
        files.push_back(encodedElsewhere("-size 9x11 plasma:fractal -depth 8 " + options, "a.tif"));
    }
    for (const auto& file : files) {
        forEverySingleByteChange(file, [](const Bytes& damaged) {
            const auto image = decoded(damaged);
            if (image) {
                EXPECT_EQ(image->rgba().size(), std::size_t{4} * image->width() * image->height());
            }
        });
    }
}

TEST(TIFFDecode, HostileSizesGiveNoImageAndTakeNoMemory) {
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
        for (const std::uint32_t compression : {1U, 5U, 7U, 8U, 32773U, 32946U}) {
            SCOPED_TRACE(std::to_string(width) + " x " + std::to_string(height) + " by " + std::to_string(compression));
            TIFFFile file(width, height, TIFFFile::RGB, 4, 16, Bytes(100));
            file.set(TIFFFile::ExtraSamples, {s_straight}).set(TIFFFile::Compression, {compression});
            const auto tiff = file.bytes();
            EXPECT_TRUE(succeedsInLittleMemory([&tiff] { return givesNoImage(tiff); }));
        }
    }
}

TEST(TIFFDecode, StripsThatShareTheirBytesGiveNoImageAndTakeNoMemory) {
    constexpr std::uint32_t side = 8192;
    auto file = grey(side, side, 8, Bytes(side));
    file.set(TIFFFile::RowsPerStrip, {1}, 4);
    file.set(TIFFFile::StripOffset, std::vector<std::uint32_t>(side, 0), 4);
    file.set(TIFFFile::StripSize, std::vector<std::uint32_t>(side, side), 4);
    const auto tiff = file.bytes();
    EXPECT_TRUE(succeedsInLittleMemory([&tiff] { return givesNoImage(tiff); }));
}

TEST(TIFFDecode, AHugeTileOfASmallPictureGivesNoImageAndTakesNoMemory) {
    constexpr std::uint16_t tileWidth = 322;
    constexpr std::uint16_t tileHeight = 323;
    constexpr std::uint16_t tileOffset = 324;
    constexpr std::uint16_t tileSize = 325;
    for (const std::uint32_t compression : {1U, 5U, 8U, 32773U}) {
        auto file = grey(1, 1, 8, Bytes(16, 0));
        file.remove(TIFFFile::StripSize).remove(TIFFFile::RowsPerStrip).set(TIFFFile::Compression, {compression});
        file.set(tileWidth, {1U << 20}, 4)
            .set(tileHeight, {1U << 20}, 4)
            .set(tileOffset, {8}, 4)
            .set(tileSize, {16}, 4);
        const auto tiff = file.bytes();
        EXPECT_TRUE(succeedsInLittleMemory([&tiff] { return givesNoImage(tiff); })) << compression;
    }
}

TEST(TIFFDecode, DamagedFilesAreRefusedInSilence) {
    const auto lzw = encodedElsewhere("-size 9x11 plasma:fractal -depth 8 -compress LZW", "a.tif");
    const auto jpeg = encodedElsewhere("-size 9x11 plasma:fractal -depth 8 -compress JPEG", "a.tif");
    for (const auto& tiff : {lzw, jpeg}) {
        const auto printed =
            printedBy([&tiff] { forEverySingleByteChange(tiff, [](const Bytes& damaged) { decoded(damaged); }); });
        EXPECT_EQ(printed, "");
    }
}

int s_hostCalls = 0;
void hostHandler(const char*, const char*, va_list) {
    ++s_hostCalls;
}

TEST(TIFFDecode, TheHandlersOfAHostApplicationAreNeitherReplacedNorCalled) {
    const auto previousError = TIFFSetErrorHandler(hostHandler);
    const auto previousWarning = TIFFSetWarningHandler(hostHandler);
    const auto tiff = Image(4, 3, Bytes(48, 0x5A)).tiffRepresentation();
    expectNoImageFromAnyPrefix(tiff);
    forEverySingleByteChange(tiff, [](const Bytes& damaged) { decoded(damaged); });
    EXPECT_EQ(s_hostCalls, 0);
    EXPECT_EQ(TIFFSetErrorHandler(previousError), hostHandler);
    EXPECT_EQ(TIFFSetWarningHandler(previousWarning), hostHandler);
}

} // namespace

} // namespace ZULMetaData::Test
