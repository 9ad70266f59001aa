#include "ZULMetaData/ZULMMetaDataCommon.h"

#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <iomanip>
#include <sstream>
#include <utility>

namespace ZULMetaData {

namespace {

using namespace Test;

template <class T>
std::string textOf(const T& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

uuid parsed(const std::string& text) {
    std::istringstream stream(text);
    uuid id{};
    stream >> id;
    return id;
}

unsigned char* newBytes(const std::string& bytes) {
    auto* copy = static_cast<unsigned char*>(std::malloc(bytes.size()));
    std::memcpy(copy, bytes.data(), bytes.size());
    return copy;
}

CursorImage imageOf(const std::string& bytes) {
    return CursorImage(7, -3, 4, newBytes(bytes), static_cast<std::uint32_t>(bytes.size()),
                       static_cast<CursorTypeID>(5), static_cast<CursorImage::CursorImageFlags>(9));
}

std::string bytesOf(const CursorImage& image) {
    return {reinterpret_cast<const char*>(image.imageData), image.imageDataSize};
}

const std::string s_text = "2b7b6af1-7a1f-11e2-83d0-0017f200be7f";
const std::string s_bytes = hex("2b7b6af1 7a1f 11e2 83d0 0017f200be7f");

TEST(ValueTypes, AreZeroByDefault) {
    EXPECT_EQ(Point(), Point(0, 0));
    EXPECT_EQ(Rect(), Rect(0, 0, 0, 0));
    EXPECT_EQ(KeyStroke(), KeyStroke(0, 0));
}

TEST(ValueTypes, AreEqualWhenEveryFieldIs) {
    EXPECT_EQ(Rect(1, 2, 3, 4), Rect(1, 2, 3, 4));
    for (const Rect& other : {Rect(9, 2, 3, 4), Rect(1, 9, 3, 4), Rect(1, 2, 9, 4), Rect(1, 2, 3, 9)})
        EXPECT_NE(Rect(1, 2, 3, 4), other);
    EXPECT_NE(Point(1, 2), Point(1, 3));
    EXPECT_NE(Point(1, 2), Point(3, 2));
    EXPECT_NE(KeyStroke(1, 2), KeyStroke(1, 3));
    EXPECT_NE(KeyStroke(1, 2), KeyStroke(3, 2));
}

TEST(ValueTypes, LieInMemoryAsTheyLieOnDisk) {
    EXPECT_EQ(raw(Point(1, -1)), hex("01000000 ffffffff"));
    EXPECT_EQ(raw(Rect(1, 2, 3, 4)), hex("01000000 02000000 03000000 04000000"));
    EXPECT_EQ(raw(KeyStroke(0x41, 0x20000)), hex("41000000 00000200"));
}

TEST(ValueTypes, PrintTheirFields) {
    EXPECT_EQ(textOf(Point(10, -4)), "(10,-4)");
    EXPECT_EQ(textOf(Rect(1, -2, 3, -4)), "(1,-2,3,-4)");
    EXPECT_EQ(textOf(KeyStroke(65, 0xffffffff)), "(65,4294967295)");
}

TEST(CursorImage, PrintsItsDefaults) {
    EXPECT_EQ(textOf(CursorImage()), "(0,0,0,0,0,-1,3)");
}

TEST(CursorImage, PrintsTheAddressOfItsBytesAsANumber) {
    const CursorImage image = imageOf("ab");
    const auto address = std::to_string(reinterpret_cast<std::intptr_t>(image.imageData));
    EXPECT_EQ(textOf(image), "(7,-3,4,2," + address + ",5,9)");
}

TEST(CursorImage, CopiesItsBytes) {
    const CursorImage original = imageOf("bytes");
    const CursorImage copy(original);
    EXPECT_EQ(copy, original);
    EXPECT_NE(copy.imageData, original.imageData);
    EXPECT_EQ(bytesOf(copy), "bytes");
}

TEST(CursorImage, AssignmentReleasesWhatWasThereBefore) {
    CursorImage target = imageOf("long bytes from before");
    target = imageOf("new");
    EXPECT_EQ(bytesOf(target), "new");
    const CursorImage without;
    target = without;
    EXPECT_EQ(target.imageData, nullptr);
    EXPECT_EQ(target, CursorImage());
}

TEST(CursorImage, AssignmentToItselfDoesNothing) {
    CursorImage image = imageOf("bytes");
    const auto* before = image.imageData;
    auto& same = image;
    image = same;
    EXPECT_EQ(image.imageData, before);
    EXPECT_EQ(bytesOf(image), "bytes");
}

TEST(CursorImage, ACopyOfASizeWithoutABufferHasNeither) {
    CursorImage original;
    original.imageDataSize = 10;
    const CursorImage copy(original);
    EXPECT_EQ(copy.imageDataSize, 0U);
    EXPECT_EQ(copy.imageData, nullptr);
}

TEST(CursorImage, ACopyOfABufferWithoutASizeHasNeither) {
    CursorImage original = imageOf("bytes");
    original.imageDataSize = 0;
    const CursorImage copy(original);
    EXPECT_EQ(copy.imageData, nullptr);
}

TEST(CursorImage, MovingTakesTheBytesAlong) {
    CursorImage original = imageOf("bytes");
    const auto* bytes = original.imageData;
    const CursorImage moved(std::move(original));
    EXPECT_EQ(moved.imageData, bytes);
    EXPECT_EQ(original.imageData, nullptr); // NOLINT(bugprone-use-after-move)
    EXPECT_EQ(original.imageDataSize, 0U);
}

TEST(CursorImage, LettingGoWithoutFreeingLeavesTheBytesUntouched) {
    unsigned char bytes[] = {1, 2, 3};
    CursorImage image(1, 0, 0, bytes, 3, CursorTypeUnknown, CursorImage::DefaultFlags);
    image.freeImageData(false);
    EXPECT_EQ(image.imageData, nullptr);
    EXPECT_EQ(image.imageDataSize, 0U);
    EXPECT_EQ(bytes[2], 3);
}

TEST(CursorImage, LettingGoForgetsASizeWithoutABuffer) {
    CursorImage image;
    image.imageDataSize = 5;
    image.freeImageData(true);
    EXPECT_EQ(image.imageDataSize, 0U);
}

TEST(CursorImage, DiffersInAnyField) {
    const CursorImage image = imageOf("ab");
    std::vector<CursorImage> others(6, image);
    others[0].uniqueId = 1;
    others[1].hotspotOffsetX = 1;
    others[2].hotspotOffsetY = 1;
    others[3].cursorTypeId = CursorTypeUnknown;
    others[4].flags = CursorImage::DefaultFlags;
    others[5].imageData[1] = 'x';
    for (const CursorImage& other : others)
        EXPECT_TRUE(other != image && !(other == image));
    EXPECT_NE(imageOf("ab"), imageOf("abc"));
}

TEST(CursorImage, EqualSizesWithoutABufferOnOneSideCompareByTheRest) {
    const CursorImage with = imageOf("ab");
    CursorImage without = imageOf("ab");
    std::free(std::exchange(without.imageData, nullptr));
    EXPECT_EQ(with, without);
    EXPECT_EQ(without, with);
    without.uniqueId = 8;
    EXPECT_NE(with, without);
}

TEST(UUID, PrintsInGroupsOfLowerCaseDigits) {
    uuid id{};
    std::memcpy(id.data, s_bytes.data(), 16);
    EXPECT_EQ(textOf(id), s_text);
    EXPECT_EQ(textOf(uuid{}), "00000000-0000-0000-0000-000000000000");
}

TEST(UUID, PrintingLeavesTheStreamInHexadecimalFilledWithZeros) {
    std::ostringstream stream;
    stream << uuid{} << ' ' << 255 << ' ' << std::setw(4) << 10;
    EXPECT_EQ(stream.str().substr(36), " ff 000a");
}

TEST(UUID, PrintsTheSameWhateverTheStreamWasSetTo) {
    std::ostringstream stream;
    stream << std::uppercase << std::showbase << std::left << std::setw(50) << std::setfill('*') << parsed(s_text);
    EXPECT_EQ(stream.str(), s_text);
}

TEST(UUID, ParsesWhatItPrints) {
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(parsed(s_text).data), 16), s_bytes);
    EXPECT_EQ(textOf(parsed("2B7B6AF1-7A1F-11E2-83D0-0017F200BE7F")), s_text);
}

TEST(UUID, ParsesWithAnySeparator) {
    EXPECT_EQ(parsed("2b7b6af1x7a1f 11e2\n83d000017f200be7f"), parsed(s_text));
}

TEST(UUID, ParsingTakesExactly36Characters) {
    std::istringstream stream(s_text + "rest");
    uuid id{};
    stream >> id;
    std::string rest;
    stream >> rest;
    EXPECT_EQ(rest, "rest");
}

TEST(UUID, ParsingAShortTextFailsAndKeepsWhatWasThere) {
    std::istringstream stream("2b7b6");
    uuid id{};
    std::memset(id.data, 0xee, 16);
    stream >> id;
    EXPECT_TRUE(stream.fail());
    EXPECT_EQ(textOf(id), "2b7b0600-0000-0000-0000-000000000000");
}

TEST(UUID, HexPairsCountAsFarAsTheyAreValid) {
    EXPECT_EQ(uuid::hexCharsToUint8("ff"), 0xff);
    EXPECT_EQ(uuid::hexCharsToUint8("A0"), 0xa0);
    EXPECT_EQ(uuid::hexCharsToUint8("1g"), 1);
    EXPECT_EQ(uuid::hexCharsToUint8("g1"), 0);
    EXPECT_EQ(uuid::hexCharsToUint8(" 1"), 1);
    EXPECT_EQ(uuid::hexCharsToUint8("-1"), 0xff);
    EXPECT_EQ(uuid::hexCharsToUint8("+a"), 0x0a);
    EXPECT_EQ(uuid::hexCharsToUint8("0x"), 0);
    EXPECT_EQ(uuid::hexCharsToUint8("12345"), 0x12);
    EXPECT_EQ(uuid::hexCharsToUint8("7"), 7);
    EXPECT_EQ(uuid::hexCharsToUint8(""), 0);
}

TEST(UUID, HexPairsAreReadFromAStreamWithTheirWhiteSpace) {
    std::istringstream stream(" 1-1+af");
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 1);
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0xff);
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0x0a);
    EXPECT_EQ(uuid::readUint8FromHexChars(stream), 0x0f);
    EXPECT_TRUE(stream.fail());
}

TEST(UUID, OrdersByItsBytesAsUnsignedNumbers) {
    uuid last{};
    last.data[15] = 1;
    uuid third{};
    third.data[3] = 1;
    uuid high{};
    high.data[0] = 0x80;
    EXPECT_TRUE(uuid{} < last && last < third && third < high);
    EXPECT_FALSE(last < last);
    EXPECT_TRUE(last == last && !(last == third));
}

} // namespace

} // namespace ZULMetaData
