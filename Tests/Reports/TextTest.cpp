#include "Reports/Text.h"

#include "Tests/Tools/ToolRun.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <set>
#include <sstream>
#include <string>
#include <vector>

namespace Zulm {
namespace {

using namespace std::string_literals;

/// Every character that cannot be seen, as the Unicode tables of another program have them.
std::vector<std::uint32_t> invisibleCharacters() {
    std::vector<std::uint32_t> numbers{0x034f, 0x115f, 0x17b4, 0x180f, 0x2065, 0x3164, 0xfe0f, 0xffa0, 0xe0fff};
    const auto found = ZULMetaData::Test::runProgram(
        "python3", {"-c", "import unicodedata as u\n"
                          "for n in range(0x110000):\n"
                          "    if u.category(chr(n)) in ('Cc', 'Cf', 'Zl', 'Zp'): print(n)\n"});
    std::istringstream lines(found.output);
    for (std::uint32_t number = 0; lines >> number;)
        numbers.push_back(number);
    return numbers;
}

bool isPrintableASCII(const std::string& text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return c >= ' ' && c <= '~'; });
}

TEST(Text, ShowsEverythingThatCannotBeSeen) {
    const auto numbers = invisibleCharacters();
    ASSERT_GT(numbers.size(), 200U);
    std::set<std::string> shapes;
    for (const std::uint32_t number : numbers) {
        const std::string text = shown("a" + ZULMetaData::utf8Character(number) + "b");
        EXPECT_TRUE(isPrintableASCII(text)) << number;
        EXPECT_GE(text.size(), 6U) << number;
        EXPECT_TRUE(shapes.insert(text).second) << text;
    }
}

TEST(Text, ShowsWhatCanBeSeenAsItIs) {
    for (const std::string text : {"Aa 9~", "\xc3\xa9", "\xd1\x84", "\xe5\xb1\x95", "\xf0\x9f\x98\x80", "\xef\xbf\xbd"})
        EXPECT_EQ(shown(text), text);
}

TEST(Text, NeverShowsTwoTextsAlike) {
    EXPECT_EQ(shown("\x1b"), "\\x1b");
    EXPECT_EQ(shown("\\x1b"), "\\\\x1b");
    EXPECT_EQ(shown("a\0b"s), "a\\x00b");
    EXPECT_EQ(shown("\xff"), "\\xff");
    EXPECT_EQ(shown("\xc2\x9b"), "\\u{9b}");
    EXPECT_EQ(shown("\x9b"), "\\x9b");
    EXPECT_EQ(shown("\xe2\x80\xae"), "\\u{202e}");
    EXPECT_EQ(shown("\xf3\xa0\x81\x81"), "\\u{e0041}");
    EXPECT_EQ(shown("\xe2\x80"), "\\xe2\\x80");
}

TEST(Text, DoublesBackslashesOfMessagesThatLookLikeEscapes) {
    EXPECT_EQ(shownMessage("C:\\Users\\me \"a\\\"b\""), "C:\\Users\\me \"a\\\"b\"");
    EXPECT_EQ(shownMessage("\\x1b \\u{9b}"), "\\\\x1b \\\\u{9b}");
    EXPECT_EQ(shownMessage("\\\\"), "\\\\\\");
    EXPECT_EQ(shownMessage("\\\x1b"), "\\\\\\x1b");
}

TEST(Text, QuotesWordsThatCanBePastedEvenOutOfAMessage) {
    for (const std::string word :
         {"a b", "it's", "a\"b", "$HOME", "`id`", "a\\b", "a\\x1b", "\\\\", "\\", "a\x1b[2J", "\xff",
          "a\xe2\x80\xae"
          "b\n",
          "!x"}) {
        const std::string command = shownMessage("printf %s " + shellWord(word));
        EXPECT_EQ(command, "printf %s " + shellWord(word)) << "escaped once more";
        EXPECT_EQ(ZULMetaData::Test::runProgram("bash", {"-c", command}).output, word) << command;
    }
    EXPECT_EQ(shellWord("a b"), "\"a b\"");
}

TEST(Text, EscapesDocumentsAsJSONDoes) {
    EXPECT_EQ(shownJSON("{\n\"\\u0000\": \"\xe2\x80\xae\x7f\xc3\xa9\"}"),
              "{\n\"\\u0000\": \"\\u202e\\u007f\xc3\xa9\"}");
    EXPECT_EQ(shownJSON("\"\xf3\xa0\x81\x81\""), "\"\\udb40\\udc41\"");
}

TEST(Text, ReadsInOneLine) {
    EXPECT_EQ(readableLine("a\r\nb\tc\0d\xe2\x80\xae"s), "a  b c[U+0000]d[U+202E]");
}

TEST(Text, TakesBytesBackOutOfBase64) {
    for (std::size_t size = 0; size < 300; ++size) {
        std::string bytes;
        for (std::size_t i = 0; i < size; ++i)
            bytes += static_cast<char>(i * 37);
        EXPECT_EQ(bytesOfBase64(base64(bytes)), bytes);
    }
}

} // namespace
} // namespace Zulm
