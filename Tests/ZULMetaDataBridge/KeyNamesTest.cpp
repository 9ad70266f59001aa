#include "ZULMetaDataBridge/Source/KeyNames.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace ZULMetaData::Test {
namespace {

constexpr std::uint32_t s_virtualKey = 0x40000000;

std::string nameOf(std::uint32_t code, std::uint32_t flags = 0) {
    return keyNameOf({code, flags}).text;
}

TEST(KeyNames, OfCodesWithoutTheFlagAreCharacters) {
    std::string text;
    for (const char c : std::string("hello world"))
        text += nameOf(static_cast<unsigned char>(c));
    EXPECT_EQ(text, "hello world");
    EXPECT_EQ(nameOf(0x444), "\xd1\x84");
    EXPECT_EQ(nameOf(0xe9), "\xc3\xa9");
    EXPECT_EQ(nameOf(0x1f600), "\xf0\x9f\x98\x80");
    EXPECT_EQ(nameOf(39), "'");
    EXPECT_EQ(keyNameOf({'w', 0x20000}).meaning, KeyMeaning::Character);
}

TEST(KeyNames, OfControlCharactersAreThoseOfTheirKeys) {
    EXPECT_EQ(nameOf(13), "returnKey");
    EXPECT_EQ(nameOf(8), "back");
    EXPECT_EQ(nameOf(9), "tab");
    EXPECT_EQ(nameOf(27), "escape");
    EXPECT_EQ(nameOf(127), "delete");
    EXPECT_EQ(keyNameOf({13, 0}).meaning, KeyMeaning::Key);
    EXPECT_EQ(nameOf(1), "key 1");
    EXPECT_EQ(nameOf(10), "key 10");
    EXPECT_EQ(nameOf(0x9b), "key 155");
    EXPECT_EQ(nameOf(0xa0), "\xc2\xa0");
}

TEST(KeyNames, OfVirtualKeysAreThoseOfTheTable) {
    EXPECT_EQ(nameOf(119, s_virtualKey), "f8");
    EXPECT_EQ(nameOf(39, s_virtualKey), "right");
    EXPECT_EQ(nameOf(32, s_virtualKey | 0x20000), "space");
    EXPECT_EQ(nameOf('A', s_virtualKey), "A");
    EXPECT_EQ(nameOf('4', s_virtualKey), "4");
    EXPECT_EQ(nameOf(97, s_virtualKey), "key 97");
    EXPECT_EQ(nameOf(200, s_virtualKey), "key 200");
    EXPECT_EQ(nameOf(10, s_virtualKey), "key 10");
    EXPECT_EQ(keyNameOf({200, s_virtualKey}).meaning, KeyMeaning::Number);
}

TEST(KeyNames, OfNumbersThatAreNoCharactersAreTheNumbers) {
    EXPECT_EQ(nameOf(0xd800), "key 55296");
    EXPECT_EQ(nameOf(0x110000), "key 1114112");
    EXPECT_EQ(nameOf(0xffffffff), "key 4294967295");
    EXPECT_EQ(nameOf(0xffffffff, s_virtualKey), "key 4294967295");
    EXPECT_EQ(nameOf(0x80000041, s_virtualKey), "key 2147483713");
}

} // namespace
} // namespace ZULMetaData::Test
