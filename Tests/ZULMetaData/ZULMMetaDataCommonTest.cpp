// The values that streams carry, and the identifiers of their kinds.

#include "ZULMetaData/ZULMMetaDataCommon.h"

#include "Tests/Support/Bytes.h"
#include "Tests/Support/MemoryWatch.h"
#include "Tests/ZULMetaData/CursorImageSamples.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <iomanip>
#include <limits>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

template <class T>
std::string printed(const T& value) {
    std::ostringstream out;
    out << value;
    return out.str();
}

constexpr std::int32_t s_lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t s_highest = std::numeric_limits<std::int32_t>::max();

// ---- Points, rectangles, keys ---------------------------------------------------------------------------------

TEST(Point, BeginsAtTheOrigin) {
    EXPECT_EQ(Point().x, 0);
    EXPECT_EQ(Point().y, 0);
}

TEST(Point, LiesInMemoryAsXAndY) {
    EXPECT_EQ(raw(Point(10, -4)), hex("0a000000 fcffffff"));
}

TEST(Point, EqualsAPointWithTheSameFields) {
    const Point point(10, -4);
    EXPECT_TRUE(point == Point(10, -4));
    EXPECT_FALSE(point != Point(10, -4));
    EXPECT_TRUE(point != Point(11, -4));
    EXPECT_TRUE(point != Point(10, 4));
    EXPECT_FALSE(point == Point(-4, 10));
}

TEST(Point, PrintsItsFields) {
    EXPECT_EQ(printed(Point(10, -4)), "(10,-4)");
    EXPECT_EQ(printed(Point(s_lowest, s_highest)), "(-2147483648,2147483647)");
}

TEST(Rect, BeginsEmptyAtTheOrigin) {
    EXPECT_EQ(raw(Rect()), std::string(16, '\0'));
}

TEST(Rect, LiesInMemoryAsOriginAndSize) {
    EXPECT_EQ(raw(Rect(1, -2, 300, 70000)), hex("01000000 feffffff 2c010000 70110100"));
}

TEST(Rect, EqualsARectWithTheSameFields) {
    const Rect rect(1, 2, 3, 4);
    EXPECT_TRUE(rect == Rect(1, 2, 3, 4));
    EXPECT_FALSE(rect != Rect(1, 2, 3, 4));
    for (const Rect& other : {Rect(9, 2, 3, 4), Rect(1, 9, 3, 4), Rect(1, 2, 9, 4), Rect(1, 2, 3, 9)}) {
        EXPECT_TRUE(rect != other) << other;
        EXPECT_FALSE(rect == other) << other;
    }
}

TEST(Rect, PrintsItsFields) {
    EXPECT_EQ(printed(Rect(1, -2, 300, 70000)), "(1,-2,300,70000)");
}

TEST(KeyStroke, BeginsAsZeros) {
    EXPECT_EQ(raw(KeyStroke()), std::string(8, '\0'));
}

TEST(KeyStroke, LiesInMemoryAsCharacterAndFlags) {
    EXPECT_EQ(raw(KeyStroke(0x61, 0x00100108)), hex("61000000 08011000"));
}

TEST(KeyStroke, EqualsAKeyStrokeWithTheSameFields) {
    const KeyStroke key(1, 2);
    EXPECT_TRUE(key == KeyStroke(1, 2));
    EXPECT_FALSE(key != KeyStroke(1, 2));
    EXPECT_TRUE(key != KeyStroke(9, 2));
    EXPECT_TRUE(key != KeyStroke(1, 9));
}

TEST(KeyStroke, PrintsItsFieldsUnsigned) {
    EXPECT_EQ(printed(KeyStroke(0x61, 0xffffffff)), "(97,4294967295)");
}

// ---- Cursor images --------------------------------------------------------------------------------------------

std::string imageBytes(const CursorImage& image) {
    return image.imageData ? std::string(image.imageData, image.imageData + image.imageDataSize) : "no buffer";
}

void expectNoImage(const CursorImage& image) {
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(image.imageDataSize, 0U);
}

void expectArrow(const CursorImage& image) {
    EXPECT_EQ(image.uniqueId, 7U);
    EXPECT_EQ(image.hotspotOffsetX, 3);
    EXPECT_EQ(image.hotspotOffsetY, -2);
    EXPECT_EQ(image.cursorTypeId, 5);
    EXPECT_EQ(image.flags, 1U);
}

TEST(CursorImage, BeginsUnknownWithoutAnImage) {
    const CursorImage image;
    EXPECT_EQ(image.uniqueId, 0U);
    EXPECT_EQ(image.hotspotOffsetX, 0);
    EXPECT_EQ(image.hotspotOffsetY, 0);
    expectNoImage(image);
    EXPECT_EQ(image.cursorTypeId, -1);
    EXPECT_EQ(image.flags, 3U);
}

TEST(CursorImage, AdoptsTheBytesItIsGivenAndFreesThem) {
    MemoryWatch memory;
    auto* const bytes = static_cast<unsigned char*>(std::malloc(3));
    {
        const CursorImage image(7, 3, -2, bytes, 3, CursorTypeID{5}, CursorImage::CursorImageFlags{1});
        expectArrow(image);
        EXPECT_EQ(image.imageData, bytes);
        EXPECT_EQ(image.imageDataSize, 3U);
        EXPECT_EQ(memory.blocks(), 1);
    }
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(CursorImage, IsFreedThroughItsVirtualDestructor) {
    EXPECT_TRUE(std::has_virtual_destructor_v<CursorImage>);
}

TEST(CursorImageCopy, HasBytesOfItsOwn) {
    const CursorImage original = arrow("PNG");
    const CursorImage copy(original);
    expectArrow(copy);
    EXPECT_EQ(imageBytes(copy), "PNG");
    EXPECT_NE(copy.imageData, original.imageData);
    EXPECT_EQ(imageBytes(original), "PNG");
}

TEST(CursorImageCopy, OutlivesItsOriginal) {
    CursorImage copy;
    {
        const CursorImage original = arrow("PNG");
        copy = original;
    }
    expectArrow(copy);
    EXPECT_EQ(imageBytes(copy), "PNG");
}

TEST(CursorImageCopy, LosesTheSizeThatNoBytesStandBehind) {
    const CursorImage original = arrowWithoutItsBytes(8);
    const CursorImage copy(original);
    expectArrow(copy);
    expectNoImage(copy);
    EXPECT_EQ(original.imageDataSize, 8U);
}

TEST(CursorImageCopy, LosesBytesWithoutASize) {
    CursorImage original = arrow("PNG");
    original.imageDataSize = 0;
    const CursorImage copy(original);
    expectNoImage(copy);
}

TEST(CursorImageCopy, HasASizeButNoBytesWhereMemoryRanOut) {
    const CursorImage original = arrow("PNG");
    MemoryWatch memory;
    memory.refuseAbove(2);
    const CursorImage copy(original);
    expectArrow(copy);
    EXPECT_EQ(copy.imageData, nullptr);
    EXPECT_EQ(copy.imageDataSize, 3U);
}

TEST(CursorImageAssignment, FreesTheImageItReplaces) {
    MemoryWatch memory;
    {
        CursorImage image = arrow("old image");
        image = arrow("PNG");
        const CursorImage original = arrow("PNG2");
        image = original;
        EXPECT_EQ(imageBytes(image), "PNG2");
        EXPECT_EQ(memory.blocks(), 2);
    }
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(CursorImageAssignment, FreesTheImageEvenWhereItBringsNone) {
    MemoryWatch memory;
    CursorImage image = arrow("old image");
    const CursorImage original = arrowWithoutItsBytes(8);
    image = original;
    expectNoImage(image);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(CursorImageAssignment, ReplacesEveryField) {
    const CursorImage original = arrow("PNG");
    CursorImage image(1, 1, 1, nullptr, 0, CursorTypeID{1}, CursorImage::CursorImageFlags{9});
    image = original;
    expectArrow(image);
    image = CursorImage();
    EXPECT_EQ(printed(image), "(0,0,0,0,0,-1,3)");
}

TEST(CursorImageAssignment, ToItselfDoesNothing) {
    CursorImage image = arrow("PNG");
    const unsigned char* const bytes = image.imageData;
    const CursorImage& same = image;
    image = same;
    expectArrow(image);
    EXPECT_EQ(image.imageData, bytes);
    EXPECT_EQ(imageBytes(image), "PNG");
}

TEST(CursorImageMove, TakesTheBytesAlong) {
    CursorImage original = arrow("PNG");
    const unsigned char* const bytes = original.imageData;
    const CursorImage moved(std::move(original));
    expectArrow(moved);
    EXPECT_EQ(moved.imageData, bytes);
    EXPECT_EQ(moved.imageDataSize, 3U);
    expectNoImage(original);
}

TEST(CursorImageMove, FreesTheImageItReplaces) {
    MemoryWatch memory;
    {
        CursorImage image = arrow("old image");
        CursorImage original = arrow("PNG");
        image = std::move(original);
        expectArrow(image);
        EXPECT_EQ(imageBytes(image), "PNG");
        expectNoImage(original);
        EXPECT_EQ(memory.blocks(), 1);
    }
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(CursorImageMove, ToItselfDoesNothing) {
    CursorImage image = arrow("PNG");
    CursorImage& same = image;
    image = std::move(same);
    expectArrow(image);
    EXPECT_EQ(imageBytes(image), "PNG");
}

TEST(FreeImageData, FreesTheBytesOnRequest) {
    MemoryWatch memory;
    CursorImage image = arrow("PNG");
    image.freeImageData(true);
    expectNoImage(image);
    expectArrow(image);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(FreeImageData, LeavesTheBytesToTheCallerOtherwise) {
    MemoryWatch memory;
    CursorImage image = arrow("PNG");
    unsigned char* const bytes = image.imageData;
    image.freeImageData(false);
    expectNoImage(image);
    EXPECT_EQ(memory.blocks(), 1);
    EXPECT_EQ(std::memcmp(bytes, "PNG", 3), 0);
    std::free(bytes);
}

TEST(FreeImageData, DropsASizeThatNoBytesStandBehind) {
    for (const bool freeBytes : {true, false}) {
        CursorImage image = arrowWithoutItsBytes(8);
        image.freeImageData(freeBytes);
        expectNoImage(image);
    }
}

TEST(FreeImageData, MayBeCalledAgain) {
    MemoryWatch memory;
    CursorImage image = arrow("PNG");
    image.freeImageData(true);
    image.freeImageData(true);
    image.freeImageData(false);
    expectNoImage(image);
    EXPECT_EQ(memory.blocks(), 0);
}

TEST(CursorImageEquality, ComparesTheBytes) {
    const CursorImage image = arrow("PNG");
    EXPECT_TRUE(image == arrow("PNG"));
    EXPECT_FALSE(image != arrow("PNG"));
    EXPECT_FALSE(image == arrow("PNK"));
    EXPECT_TRUE(image != arrow("PNK"));
    EXPECT_FALSE(image == arrow("PNG2"));
}

TEST(CursorImageEquality, ComparesEveryField) {
    const CursorImage image = arrowWithoutItsBytes(0);
    EXPECT_TRUE(image == arrowWithoutItsBytes(0));
    const CursorImage others[] = {
        cursorImage(8, 3, -2, 5, 1),  cursorImage(7, 4, -2, 5, 1), cursorImage(7, 3, 2, 5, 1),
        cursorImage(7, 3, -2, -1, 1), cursorImage(7, 3, -2, 5, 3), arrowWithoutItsBytes(1),
    };
    for (const CursorImage& other : others) {
        EXPECT_FALSE(image == other) << other;
        EXPECT_TRUE(image != other) << other;
    }
}

TEST(CursorImageEquality, TellsIdentifiersApartInTheirUpperHalf) {
    CursorImage image;
    image.uniqueId = 0x100000000;
    EXPECT_FALSE(image == CursorImage());
}

TEST(CursorImageEquality, LeavesBytesOutThatOneOfTheImagesLacks) {
    const CursorImage image = arrow("PNG");
    EXPECT_TRUE(image == arrowWithoutItsBytes(3));
    EXPECT_TRUE(arrowWithoutItsBytes(3) == image);
    EXPECT_TRUE(arrowWithoutItsBytes(3) == arrowWithoutItsBytes(3));
    EXPECT_FALSE(arrowWithoutItsBytes(4) == image);
}

TEST(CursorImageEquality, LeavesTheBytesOfASizeOfZeroOut) {
    CursorImage image = arrow("PNG");
    CursorImage other = arrow("ICO");
    image.imageDataSize = other.imageDataSize = 0;
    EXPECT_TRUE(image == other);
}

TEST(CursorImageEquality, HoldsForTheObjectItself) {
    const CursorImage image = arrow("PNG");
    const CursorImage& same = image;
    EXPECT_TRUE(image == same);
    EXPECT_FALSE(image != same);
}

TEST(CursorImage, PrintsItsFields) {
    EXPECT_EQ(printed(CursorImage()), "(0,0,0,0,0,-1,3)");
    EXPECT_EQ(printed(CursorImage(0xffffffffffffffff, s_lowest, s_highest, nullptr, 0xffffffff, CursorTypeID{5},
                                  CursorImage::CursorImageFlags{0xfffffffe})),
              "(18446744073709551615,-2147483648,2147483647,4294967295,0,5,4294967294)");
}

TEST(CursorImage, PrintsTheAddressOfItsBytesAsANumber) {
    const CursorImage image = arrow("PNG");
    const auto address = reinterpret_cast<std::int64_t>(image.imageData);
    EXPECT_EQ(printed(image), "(7,3,-2,3," + std::to_string(address) + ",5,1)");
}

// ---- Identifiers ----------------------------------------------------------------------------------------------

constexpr uuid s_id = {
    {0x2b, 0x7b, 0x6a, 0xf1, 0x7a, 0x1f, 0x11, 0xe2, 0x83, 0xd0, 0x00, 0x17, 0xf2, 0x00, 0xbe, 0x7f}};
constexpr const char* s_idText = "2b7b6af1-7a1f-11e2-83d0-0017f200be7f";

/// All zero but for one byte.
constexpr uuid withByte(std::size_t index, std::uint8_t value) {
    uuid id{};
    id.data[index] = value;
    return id;
}

uuid parsed(const std::string& text) {
    std::istringstream stream(text);
    uuid id{};
    stream >> id;
    return id;
}

/// The identifier's text with this pair of digits in front.
std::uint8_t firstByteOf(const std::string& pair) {
    return parsed(pair + "7b6af1-7a1f-11e2-83d0-0017f200be7f").data[0];
}

TEST(UUID, IsSixteenBytesInTheOrderOfItsText) {
    EXPECT_EQ(raw(s_id), hex("2b7b6af1 7a1f 11e2 83d0 0017f200be7f"));
    EXPECT_EQ(raw(uuid{}), std::string(16, '\0'));
}

TEST(UUID, EqualsWhereAllBytesDo) {
    EXPECT_TRUE(s_id == parsed(s_idText));
    EXPECT_FALSE(s_id != parsed(s_idText));
    for (std::size_t index = 0; index < 16; ++index) {
        uuid other = s_id;
        other.data[index] ^= 0x80;
        EXPECT_FALSE(s_id == other) << index;
        EXPECT_TRUE(s_id != other) << index;
    }
}

TEST(UUID, IsOrderedByItsBytesFromTheFirstOn) {
    const uuid zero{};
    EXPECT_TRUE(zero < withByte(15, 1));
    EXPECT_TRUE(withByte(15, 1) < withByte(3, 1));
    EXPECT_FALSE(withByte(3, 1) < withByte(15, 1));
    EXPECT_TRUE(withByte(15, 0xff) < withByte(14, 1));
    EXPECT_TRUE(withByte(1, 0xff) < withByte(0, 1));
    EXPECT_FALSE(s_id < s_id);
}

TEST(UUID, IsOrderedByUnsignedBytes) {
    EXPECT_TRUE(withByte(0, 0x7f) < withByte(0, 0x80));
    EXPECT_FALSE(withByte(0, 0x80) < withByte(0, 0x7f));
    EXPECT_TRUE(withByte(15, 1) < withByte(15, 0xff));
}

TEST(UUID, IsOrderedAsItsText) {
    const std::vector<std::string> texts = {
        "00000000-0000-0000-0000-000000000000", "00000000-0000-0000-0000-000000000001",
        "00000001-0000-0000-0000-000000000000", "2b7b6a00-7a1f-11e2-83d0-0017f200be7f",
        "2b7b6aef-7a1f-11e2-83d0-0017f200be7f", "2b7b6af0-7a1f-11e2-83d0-0017f200be7f",
        "2b7b6af0-7a1f-11e2-83d0-0017f200be80", "80000000-0000-0000-0000-000000000000",
        "a0000000-0000-0000-0000-000000000000", "ffffffff-ffff-ffff-ffff-ffffffffffff",
    };
    for (const std::string& left : texts)
        for (const std::string& right : texts)
            EXPECT_EQ(parsed(left) < parsed(right), left < right) << left << ' ' << right;
}

TEST(UUIDText, HasFiveGroupsOfLowerCaseDigits) {
    EXPECT_EQ(printed(s_id), "2b7b6af1-7a1f-11e2-83d0-0017f200be7f");
    EXPECT_EQ(printed(uuid{}), "00000000-0000-0000-0000-000000000000");
    EXPECT_EQ(printed(withByte(15, 0x0a)), "00000000-0000-0000-0000-00000000000a");
    EXPECT_EQ(
        printed(uuid{{0xff, 0xee, 0xdd, 0xcc, 0xbb, 0xaa, 0x99, 0x88, 0x77, 0x66, 0x55, 0x44, 0x33, 0x22, 0x11, 0x0f}}),
        "ffeeddcc-bbaa-9988-7766-55443322110f");
}

TEST(UUIDText, LeavesTheStreamPrintingHexadecimalNumbersFilledWithZeros) {
    std::ostringstream out;
    out << std::dec << std::setfill('*') << s_id << ' ' << 255 << ' ' << std::setw(4) << 10;
    EXPECT_EQ(out.str(), std::string(s_idText) + " ff 000a");
    EXPECT_EQ(out.fill(), '0');
}

TEST(UUIDText, IsTheSameWhateverTheStreamWasSetTo) {
    std::ostringstream out;
    out << std::uppercase << std::showbase << std::left << std::setfill('*') << std::setw(50) << s_id;
    EXPECT_EQ(out.str(), s_idText);
}

TEST(UUIDText, IsReadBack) {
    EXPECT_EQ(parsed(s_idText), s_id);
    EXPECT_EQ(parsed("00000000-0000-0000-0000-000000000001"), withByte(15, 1));
    EXPECT_EQ(parsed("ffeeddcc-bbaa-9988-7766-55443322110f"),
              (uuid{{0xff, 0xee, 0xdd, 0xcc, 0xbb, 0xaa, 0x99, 0x88, 0x77, 0x66, 0x55, 0x44, 0x33, 0x22, 0x11, 0x0f}}));
}

TEST(UUIDText, MayBeInUpperCase) {
    EXPECT_EQ(parsed("2B7B6AF1-7A1F-11E2-83D0-0017F200BE7F"), s_id);
}

TEST(UUIDText, MayHaveAnySeparators) {
    for (const char separator : {'x', ' ', '\n', '0', '\0'}) {
        std::string text = s_idText;
        std::replace(text.begin(), text.end(), '-', separator);
        EXPECT_EQ(parsed(text), s_id) << text;
    }
}

TEST(UUIDText, IsThirtySixCharactersOfWhateverFollows) {
    std::istringstream stream(std::string(s_idText) + "-rest");
    uuid id{};
    stream >> id;
    EXPECT_EQ(id, s_id);
    EXPECT_EQ(stream.tellg(), 36);
    EXPECT_EQ(stream.get(), '-');
}

TEST(UUIDText, MayEndWithTheInput) {
    std::istringstream stream(s_idText);
    uuid id{};
    EXPECT_TRUE(stream >> id);
    EXPECT_TRUE(stream.good());
}

TEST(UUIDText, IsReadOneBehindTheOther) {
    std::istringstream stream(std::string(s_idText) + "00000000-0000-0000-0000-000000000001");
    uuid first{};
    uuid second{};
    EXPECT_TRUE(stream >> first >> second);
    EXPECT_EQ(first, s_id);
    EXPECT_EQ(second, withByte(15, 1));
}

TEST(UUIDText, CountsWhiteSpaceInsteadOfSkippingIt) {
    std::istringstream stream(" 1" + std::string(s_idText).substr(2) + "rest");
    uuid id{};
    stream >> id;
    EXPECT_EQ(id.data[0], 1);
    EXPECT_EQ(id.data[15], 0x7f);
    EXPECT_EQ(stream.get(), 'r');
}

TEST(UUIDText, TakesTheLeadingDigitsOfEveryPair) {
    EXPECT_EQ(firstByteOf("1g"), 1);
    EXPECT_EQ(firstByteOf("g1"), 0);
    EXPECT_EQ(firstByteOf("zz"), 0);
    EXPECT_EQ(firstByteOf(" 1"), 1);
    EXPECT_EQ(firstByteOf("1 "), 1);
    EXPECT_EQ(firstByteOf("-1"), 0xff);
    EXPECT_EQ(firstByteOf("-f"), 0xf1);
    EXPECT_EQ(firstByteOf("+a"), 0x0a);
    EXPECT_EQ(firstByteOf("0x"), 0);
}

TEST(UUIDText, ThatIsTooShortFailsTheStreamAndKeepsWhatWasRead) {
    std::istringstream stream("2b7b6");
    uuid id;
    std::memset(id.data, 0xee, sizeof id.data);
    stream >> id;
    EXPECT_TRUE(stream.fail());
    EXPECT_EQ(raw(id), hex("2b7b0600 0000 0000 0000 000000000000"));
}

TEST(UUIDText, ThatLacksAnyOfItsCharactersFailsTheStream) {
    for (std::size_t length = 0; length < 36; ++length) {
        std::istringstream stream(std::string(s_idText).substr(0, length));
        uuid id{};
        EXPECT_FALSE(stream >> id) << length;
    }
}

TEST(HexChars, AreConvertedAsANumberOfBase16) {
    EXPECT_EQ(uuid::hexCharsToUint8("00"), 0);
    EXPECT_EQ(uuid::hexCharsToUint8("0f"), 15);
    EXPECT_EQ(uuid::hexCharsToUint8("f0"), 240);
    EXPECT_EQ(uuid::hexCharsToUint8("9a"), 0x9a);
    EXPECT_EQ(uuid::hexCharsToUint8("FF"), 255);
}

TEST(HexChars, CountAsFarAsTheyAreValid) {
    EXPECT_EQ(uuid::hexCharsToUint8("1g"), 1);
    EXPECT_EQ(uuid::hexCharsToUint8("g1"), 0);
    EXPECT_EQ(uuid::hexCharsToUint8(" 1"), 1);
    EXPECT_EQ(uuid::hexCharsToUint8("-1"), 255);
    EXPECT_EQ(uuid::hexCharsToUint8("+a"), 10);
    EXPECT_EQ(uuid::hexCharsToUint8("--"), 0);
    EXPECT_EQ(uuid::hexCharsToUint8("  "), 0);
}

TEST(HexChars, AreTheFirstTwoOfALongerText) {
    EXPECT_EQ(uuid::hexCharsToUint8("2b7b6af1"), 0x2b);
    EXPECT_EQ(uuid::hexCharsToUint8("012"), 1);
}

TEST(HexChars, MayBeLessThanTwo) {
    EXPECT_EQ(uuid::hexCharsToUint8("7"), 7);
    EXPECT_EQ(uuid::hexCharsToUint8(""), 0);
}

TEST(HexChars, AreTakenFromAStreamInPairs) {
    std::istringstream stream("2b7x z");
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0x2b);
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 7);
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0);
    EXPECT_EQ(stream.tellg(), 6);
    EXPECT_TRUE(stream.good());
}

TEST(HexChars, ThatAreMissingFailTheStream) {
    std::istringstream stream("7");
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 7);
    EXPECT_TRUE(stream.fail());
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0);
}

TEST(SwapInt, IsToBeHadWithTheValues) {
    EXPECT_EQ(ZULMetaData::swapInt(std::uint32_t{0x5a554c4d}), 0x4d4c555aU);
    EXPECT_EQ(ZULMetaData::swapInt(std::uint64_t{24}), 0x1800000000000000U);
}

} // namespace

} // namespace ZULMetaData::Test
