#include "ZULMetaDataBridge/Source/EntryTexts.h"
#include "Tests/Support/Bytes.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <stdexcept>
#include <string>

namespace ZULMetaData::Test {

namespace {

/// Put together from its bits, without a look at what is allowed.
std::string encoded(std::uint32_t character, int length) {
    if (length == 1)
        return std::string(1, static_cast<char>(character));
    constexpr std::uint32_t marks[] = {0, 0, 0xc0, 0xe0, 0xf0};
    std::string bytes;
    for (int rest = length - 1; rest > 0; --rest, character >>= 6)
        bytes.insert(bytes.begin(), static_cast<char>(0x80 | (character & 0x3f)));
    bytes.insert(bytes.begin(), static_cast<char>(marks[length] | character));
    return bytes;
}

int shortestLength(std::uint32_t character) {
    return character < 0x80 ? 1 : character < 0x800 ? 2 : character < 0x10000 ? 3 : 4;
}

bool isSurrogate(std::uint32_t character) {
    return character >= 0xd800 && character <= 0xdfff;
}

TEST(UTF8, HasAFirstAndALastCharacterOfEveryLength) {
    for (const char* bytes :
         {"00", "7f", "c280", "dfbf", "e0a080", "ed9fbf", "ee8080", "efbfbf", "f0908080", "f48fbfbf"})
        EXPECT_TRUE(isUTF8(hex(bytes))) << bytes;
}

TEST(UTF8, HasEveryCharacterInItsShortestFormUnlessItIsASurrogate) {
    for (std::uint32_t character = 0; character <= 0x10ffff; ++character)
        ASSERT_EQ(isUTF8(encoded(character, shortestLength(character))), !isSurrogate(character)) << character;
}

TEST(UTF8, IsCountedUpToTheFirstByteThatIsNoWholeCharacter) {
    EXPECT_EQ(validUTF8Length(""), 0U);
    EXPECT_EQ(validUTF8Length("ab\xc3\xa9"), 4U);
    EXPECT_EQ(validUTF8Length("ab\xc3"), 2U);
    EXPECT_EQ(validUTF8Length("a\xff"
                              "b"),
              1U);
    EXPECT_EQ(validUTF8Length("\x80"), 0U);
}

TEST(UTF8, HasNoOverlongForms) {
    for (const char* bytes : {"c080", "c1bf", "e08080", "e09fbf", "f0808080", "f08fbfbf", "f880808080", "fc8080808080"})
        EXPECT_FALSE(isUTF8(hex(bytes))) << bytes;
    for (std::uint32_t character = 0; character <= 0xffff; ++character)
        for (int length = shortestLength(character) + 1; length <= 4; ++length)
            ASSERT_FALSE(isUTF8(encoded(character, length))) << character << " in " << length << " bytes";
}

TEST(UTF8, HasNoSurrogates) {
    for (const char* bytes : {"eda080", "edafbf", "edb080", "edbfbf", "eda080edb080"})
        EXPECT_FALSE(isUTF8(hex(bytes))) << bytes;
}

TEST(UTF8, HasNothingAboveTheLastCharacter) {
    for (const char* bytes : {"f4908080", "f4bfbfbf", "f5808080", "f7bfbfbf", "f888808080", "fe", "ff"})
        EXPECT_FALSE(isUTF8(hex(bytes))) << bytes;
    for (std::uint32_t character = 0x110000; character <= 0x1fffff; ++character)
        ASSERT_FALSE(isUTF8(encoded(character, 4))) << character;
}

TEST(UTF8, HasNoCharacterThatIsCutShort) {
    for (const char* bytes :
         {"c2", "df", "e0a0", "e0", "ed9f", "efbf", "ef", "f09080", "f090", "f0", "f48fbf", "f48f"}) {
        EXPECT_FALSE(isUTF8(hex(bytes))) << bytes << " at the end";
        EXPECT_FALSE(isUTF8(hex(bytes) + 'x')) << bytes << " in front of another";
        EXPECT_FALSE(isUTF8('x' + hex(bytes))) << bytes << " behind another";
    }
}

TEST(UTF8, HasNoByteThatContinuesNothing) {
    for (const char* bytes : {"80", "bf", "7880", "c28080", "e0a08080", "f090808080"})
        EXPECT_FALSE(isUTF8(hex(bytes))) << bytes;
}

TEST(UTF8, AllowsOnlyContinuationsBehindAFirstByte) {
    for (unsigned byte = 0; byte <= 0xff; ++byte) {
        const bool continues = byte >= 0x80 && byte <= 0xbf;
        const std::string tail(1, static_cast<char>(byte));
        EXPECT_EQ(isUTF8(hex("c3") + tail), continues) << byte;
        EXPECT_EQ(isUTF8(hex("e1") + tail + hex("80")), continues) << byte;
        EXPECT_EQ(isUTF8(hex("e180") + tail), continues) << byte;
        EXPECT_EQ(isUTF8(hex("f1") + tail + hex("8080")), continues) << byte;
        EXPECT_EQ(isUTF8(hex("f180") + tail + hex("80")), continues) << byte;
        EXPECT_EQ(isUTF8(hex("f18080") + tail), continues) << byte;
    }
}

TEST(UTF8, MayBeEmptyAndMayHoldManyCharacters) {
    EXPECT_TRUE(isUTF8(""));
    EXPECT_TRUE(isUTF8("Intro \xc3\xa9\xe6\x98\xa0\xf0\x9f\x8e\xac."));
    EXPECT_FALSE(isUTF8("Intro \xc3\xa9\xe6\x98\xa0\xf0\x9f\x8e\xac\xff."));
}

TEST(TextFromUTF8, IsTheBytesThemselves) {
    EXPECT_EQ(textFromUTF8("Intro"), "Intro");
    EXPECT_EQ(textFromUTF8("\xc3\xa9\xf0\x9f\x8e\xac"), "\xc3\xa9\xf0\x9f\x8e\xac");
    EXPECT_EQ(textFromUTF8(""), "");
}

TEST(TextFromUTF8, EndsAtTheFirstZeroByte) {
    EXPECT_EQ(textFromUTF8(std::string("ab\0cd", 5)), "ab");
    EXPECT_EQ(textFromUTF8(std::string("\0ab", 3)), "");
    EXPECT_EQ(textFromUTF8(std::string("ab\0", 3)), "ab");
}

TEST(TextFromUTF8, DoesNotMindWhatStandsBehindTheFirstZeroByte) {
    EXPECT_EQ(textFromUTF8(std::string("ab\0\xff", 4)), "ab");
}

TEST(TextFromUTF8, RefusesWhatIsNoUTF8) {
    EXPECT_THROW(textFromUTF8("ab\xff"), std::invalid_argument);
    EXPECT_THROW(textFromUTF8("\xc3"), std::invalid_argument);
    EXPECT_THROW(textFromUTF8(std::string("\xc3\0\xa9", 3)), std::invalid_argument) << "a zero byte cuts a character";
}

TEST(TextFromLatin1, HasTheCharacterOfEveryByte) {
    EXPECT_EQ(textFromLatin1("RAM:16384MB"), "RAM:16384MB");
    for (std::uint32_t character = 1; character <= 0xff; ++character)
        EXPECT_EQ(textFromLatin1(encoded(character, 1)), encoded(character, shortestLength(character))) << character;
}

TEST(TextFromLatin1, TakesEveryByteOfAUTF8CharacterForACharacter) {
    EXPECT_EQ(textFromLatin1("\xc3\xa9"), "\xc3\x83\xc2\xa9");
}

TEST(TextFromLatin1, EndsAtTheFirstZeroByte) {
    EXPECT_EQ(textFromLatin1(std::string("a\xe9\0b", 4)), "a\xc3\xa9");
    EXPECT_EQ(textFromLatin1(""), "");
}

} // namespace

} // namespace ZULMetaData::Test
