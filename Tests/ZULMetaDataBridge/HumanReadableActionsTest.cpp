#include "ZULMetaDataBridge/Source/HumanReadableActions.h"

#include <gtest/gtest.h>

#include <limits>
#include <map>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

namespace {

constexpr int s_lowest = std::numeric_limits<int>::min();
constexpr int s_highest = std::numeric_limits<int>::max();

std::string cursorText(int action) {
    return HumanReadableActions::CursorActionToString(action);
}

std::string keyText(int code) {
    return HumanReadableActions::KeyboardActionCodeToString(code);
}

std::string modifiersText(unsigned flags) {
    return HumanReadableActions::KeyboardModifiersToString(static_cast<int>(flags));
}

// ---- Flags ----------------------------------------------------------------------------------------------------

TEST(Flags, AreSetWhereAllOfTheirBitsAre) {
    EXPECT_TRUE(HumanReadableActions::HasFlag(5, 1));
    EXPECT_TRUE(HumanReadableActions::HasFlag(5, 4));
    EXPECT_TRUE(HumanReadableActions::HasFlag(5, 5));
    EXPECT_TRUE(HumanReadableActions::HasFlag(-1, s_highest));
    EXPECT_TRUE(HumanReadableActions::HasFlag(s_lowest, s_lowest));
}

TEST(Flags, AreNotSetWhereOneOfTheirBitsIsMissing) {
    EXPECT_FALSE(HumanReadableActions::HasFlag(5, 2));
    EXPECT_FALSE(HumanReadableActions::HasFlag(5, 3));
    EXPECT_FALSE(HumanReadableActions::HasFlag(5, 7));
    EXPECT_FALSE(HumanReadableActions::HasFlag(0, 1));
    EXPECT_FALSE(HumanReadableActions::HasFlag(s_highest, -1));
}

TEST(Flags, AreNotEmpty) {
    for (const int value : {0, 1, -1}) {
        try {
            HumanReadableActions::HasFlag(value, 0);
            ADD_FAILURE() << "no exception for " << value;
        } catch (const std::invalid_argument& error) {
            EXPECT_STREQ(error.what(), "Flag should not be empty.");
        }
    }
}

// ---- Cursor actions -------------------------------------------------------------------------------------------

TEST(CursorActions, AreNamedAfterTheirButton) {
    EXPECT_EQ(cursorText(1), "left down");
    EXPECT_EQ(cursorText(2), "left up");
    EXPECT_EQ(cursorText(4), "right down");
    EXPECT_EQ(cursorText(8), "right up");
    EXPECT_EQ(cursorText(16), "middle down");
    EXPECT_EQ(cursorText(32), "middle up");
}

TEST(CursorActions, ShowTheModifiersOfALeftOrRightButton) {
    for (const auto& [bit, button] : {std::pair(1, "left down"), {2, "left up"}, {4, "right down"}, {8, "right up"}}) {
        EXPECT_EQ(cursorText(bit + 16), button + std::string(" + shift"));
        EXPECT_EQ(cursorText(bit + 32), button + std::string(" + ctrl"));
        EXPECT_EQ(cursorText(bit + 64), button + std::string(" + option"));
        EXPECT_EQ(cursorText(bit + 128), button + std::string(" + cmd"));
    }
}

TEST(CursorActions, ShowShiftControlCommandAndOptionInThisOrder) {
    EXPECT_EQ(cursorText(1 + 16 + 128), "left down + shift + cmd");
    EXPECT_EQ(cursorText(1 + 64 + 128), "left down + cmd + option");
    EXPECT_EQ(cursorText(8 + 64), "right up + option");
    EXPECT_EQ(cursorText(4 + 16 + 32 + 64 + 128), "right down + shift + ctrl + cmd + option");
}

TEST(CursorActions, ShowTheFirstOfSeveralButtons) {
    EXPECT_EQ(cursorText(15), "left down");
    EXPECT_EQ(cursorText(14), "left up");
    EXPECT_EQ(cursorText(12), "right down");
    EXPECT_EQ(cursorText(16 + 32), "middle down");
}

TEST(CursorActions, ShowNoModifiersOfTheMiddleButton) {
    EXPECT_EQ(cursorText(16 + 64), "middle down");
    EXPECT_EQ(cursorText(32 + 64 + 128), "middle up");
}

TEST(CursorActions, TellTheMouseComingUpFromEverythingElse) {
    EXPECT_EQ(cursorText(256), "mouse init");
    EXPECT_EQ(cursorText(257), "left down");
    EXPECT_EQ(cursorText(256 + 16), "middle down");
    EXPECT_EQ(cursorText(256 + 64), "320");
    EXPECT_EQ(cursorText(512), "512");
}

TEST(CursorActions, WithoutAButtonAreTheirNumber) {
    EXPECT_EQ(cursorText(0), "0");
    EXPECT_EQ(cursorText(64), "64");
    EXPECT_EQ(cursorText(64 + 128), "192");
    EXPECT_EQ(cursorText(-64), "-64");
    EXPECT_EQ(cursorText(s_lowest), "-2147483648");
}

TEST(CursorActions, ShowTheButtonsOfNegativeNumbersToo) {
    EXPECT_EQ(cursorText(-1), "left down + shift + ctrl + cmd + option");
    EXPECT_EQ(cursorText(-2), "left up + shift + ctrl + cmd + option");
    EXPECT_EQ(cursorText(s_lowest + 1), "left down");
    EXPECT_EQ(cursorText(s_highest), "left down + shift + ctrl + cmd + option");
}

/// Every combination of the nine bits, put together step by step as a person would.
TEST(CursorActions, FollowTheSameRuleForAllCombinations) {
    for (int action = 0; action < 512; ++action) {
        const auto has = [action](int bit) { return action / bit % 2 == 1; };
        std::string expected;
        if (has(1) || has(2) || has(4) || has(8)) {
            expected = has(1) ? "left down" : has(2) ? "left up" : has(4) ? "right down" : "right up";
            expected += has(16) ? " + shift" : "";
            expected += has(32) ? " + ctrl" : "";
            expected += has(128) ? " + cmd" : "";
            expected += has(64) ? " + option" : "";
        } else if (has(16) || has(32)) {
            expected = has(16) ? "middle down" : "middle up";
        } else {
            expected = action == 256 ? "mouse init" : std::to_string(action);
        }
        EXPECT_EQ(cursorText(action), expected) << action;
    }
}

// ---- Keys -----------------------------------------------------------------------------------------------------

const std::map<int, std::string> s_namesOfKeys{
    {0, "unknown"},
    {3, "cancel"},
    {7, "function"},
    {8, "back"},
    {9, "tab"},
    {12, "clear"},
    {13, "returnKey"},
    {19, "pause"},
    {20, "capital"},
    {27, "escape"},
    {32, "space"},
    {33, "prior"},
    {34, "next"},
    {35, "end"},
    {36, "home"},
    {37, "left"},
    {38, "up"},
    {39, "right"},
    {40, "down"},
    {41, "select"},
    {42, "print"},
    {43, "execute"},
    {44, "snapshot"},
    {45, "insert"},
    {46, "delete"},
    {47, "help"},
    {48, "closeParenthesis"},
    {49, "exclamation"},
    {50, "atSymbol"},
    {51, "pound"},
    {53, "percent"},
    {54, "carat"},
    {55, "ampersand"},
    {56, "star"},
    {57, "openParenthesis"},
    {112, "f1"},
    {113, "f2"},
    {114, "f3"},
    {115, "f4"},
    {116, "f5"},
    {117, "f6"},
    {118, "f7"},
    {119, "f8"},
    {120, "f9"},
    {121, "f10"},
    {122, "f11"},
    {123, "f12"},
    {124, "f13"},
    {125, "f14"},
    {126, "f15"},
    {127, "f16"},
    {128, "f17"},
    {129, "f18"},
    {130, "f19"},
    {131, "f20"},
    {144, "numlock"},
    {145, "scroll"},
    {187, "plus"},
    {188, "comma"},
    {189, "minus"},
    {190, "period"},
};

/// Tab, line feed, vertical tab, form feed, carriage return and space.
const std::set<int> s_whiteSpace{9, 10, 11, 12, 13, 32};

std::string characterOfLowByte(int code) {
    const int byte = (code % 256 + 256) % 256;
    return s_whiteSpace.contains(byte) ? "" : std::string(1, static_cast<char>(byte));
}

TEST(Keys, HaveTheirNames) {
    for (const auto& [code, name] : s_namesOfKeys)
        EXPECT_EQ(keyText(code), name) << code;
}

TEST(Keys, WithoutANameAreTheCharacterOfTheirLowByte) {
    for (int code = 0; code <= 300; ++code)
        if (!s_namesOfKeys.contains(code)) {
            EXPECT_EQ(keyText(code), characterOfLowByte(code)) << code;
        }
}

TEST(Keys, WithANegativeOrALargeCodeAreTheCharacterOfTheirLowByte) {
    for (int code = -600; code < 0; ++code)
        EXPECT_EQ(keyText(code), characterOfLowByte(code)) << code;
    for (int code = 191; code <= 70000; ++code)
        ASSERT_EQ(keyText(code), characterOfLowByte(code)) << code;
    EXPECT_EQ(keyText(s_highest), "\xff");
    EXPECT_EQ(keyText(s_lowest), std::string(1, '\0'));
    EXPECT_EQ(keyText(s_lowest + 65), "A");
}

TEST(Keys, OfLettersAreTheLetters) {
    EXPECT_EQ(keyText(65), "A");
    EXPECT_EQ(keyText(90), "Z");
    EXPECT_EQ(keyText(97), "a");
}

TEST(Keys, OfTheDigitFourIsTheOnlyDigitWithoutAName) {
    EXPECT_EQ(keyText(52), "4");
}

TEST(Keys, OfWhiteSpaceAreEmpty) {
    EXPECT_EQ(keyText(10), "");
    EXPECT_EQ(keyText(11), "");
    EXPECT_EQ(keyText(256 + 32), "");
    EXPECT_EQ(keyText(256 + 9), "");
    EXPECT_EQ(keyText(-256 + 13), "");
}

TEST(Keys, BehindTheLastNameAreSingleBytes) {
    EXPECT_EQ(keyText(190), "period");
    EXPECT_EQ(keyText(191), "\xbf");
    EXPECT_EQ(keyText(256), std::string(1, '\0'));
    EXPECT_EQ(keyText(256 + 65), "A");
    EXPECT_EQ(keyText(-1), "\xff");
}

// ---- Modifiers ------------------------------------------------------------------------------------------------

const std::vector<std::pair<unsigned, std::string>> s_modifiers{
    {0x20000000, "(MAC)"}, {0x00010000, "<Alpha>"}, {0x00020000, "<Shift>"}, {0x00040000, "<Ctrl>"},
    {0x00080000, "<Alt>"}, {0x00100000, "<Cmd>"},   {0x80000000, "<Win>"},   {0x40000000, "(IsVK)"},
};

TEST(Modifiers, HaveTheirNames) {
    for (const auto& [bit, name] : s_modifiers)
        EXPECT_EQ(modifiersText(bit), name);
}

TEST(Modifiers, AreShownInTheOrderOfTheTable) {
    EXPECT_EQ(modifiersText(0x00120000), "<Shift><Cmd>");
    EXPECT_EQ(modifiersText(0x60000000), "(MAC)(IsVK)");
    EXPECT_EQ(modifiersText(0xe01f0000), "(MAC)<Alpha><Shift><Ctrl><Alt><Cmd><Win>(IsVK)");
    EXPECT_EQ(modifiersText(0xffffffff), "(MAC)<Alpha><Shift><Ctrl><Alt><Cmd><Win>(IsVK)");
}

TEST(Modifiers, AreNoneWhereNoKnownBitIsSet) {
    EXPECT_EQ(modifiersText(0), "NONE");
    EXPECT_EQ(modifiersText(0x1fe0ffff), "NONE");
}

TEST(Modifiers, IgnoreUnknownBits) {
    EXPECT_EQ(modifiersText(0x1ff0ffff), "<Cmd>");
    for (int bit = 0; bit < 16; ++bit)
        EXPECT_EQ(modifiersText(0x00020000U | 1U << bit), "<Shift>") << bit;
}

TEST(Modifiers, AreTheSumOfTheirNamesForAllCombinations) {
    for (unsigned chosen = 1; chosen < 256; ++chosen) {
        unsigned flags = 0;
        std::string expected;
        for (std::size_t row = 0; row < s_modifiers.size(); ++row)
            if (chosen >> row & 1U) {
                flags |= s_modifiers[row].first;
                expected += s_modifiers[row].second;
            }
        EXPECT_EQ(modifiersText(flags), expected) << flags;
    }
}

} // namespace

} // namespace ZULMetaData::Test
