#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include "ZULMetaDataBridge/Source/HumanReadableActions.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::Test {
namespace {

constexpr std::int32_t s_lowest = std::numeric_limits<std::int32_t>::min();

/// "left down", "middle up", or "-" if the number is about no button.
std::string buttonText(std::int32_t stored) {
    const ButtonAction action = buttonActionOf(stored);
    return action.button ? std::string(nameOf(*action.button)) + (action.isPress ? " down" : " up") : "-";
}

/// "shift cmd " and so on.
std::string textOf(Modifiers modifiers) {
    std::string text;
    for (const Modifier modifier : s_modifiers)
        if (modifiers.contains(modifier))
            text += std::string(nameOf(modifier)) + ' ';
    return text;
}

std::string modifiersOfAction(std::int32_t stored) {
    return textOf(buttonActionOf(stored).modifiers);
}

/// Every set of modifiers.
std::vector<Modifiers> everyModifiers() {
    std::vector<Modifiers> all;
    for (unsigned chosen = 0; chosen < 64; ++chosen) {
        Modifiers modifiers;
        for (unsigned i = 0; i < 6; ++i)
            if ((chosen >> i & 1U) != 0)
                modifiers.insert(static_cast<Modifier>(i));
        all.push_back(modifiers);
    }
    return all;
}

// ---- Sets -----------------------------------------------------------------------------------------------------

TEST(EnumSet, HoldsWhatWasInserted) {
    Modifiers modifiers{Modifier::Shift, Modifier::Windows};
    EXPECT_TRUE(modifiers.contains(Modifier::Shift));
    EXPECT_TRUE(modifiers.contains(Modifier::Windows));
    EXPECT_FALSE(modifiers.contains(Modifier::CapsLock));
    EXPECT_EQ(modifiers.bits(), 0b100010U);
    modifiers.erase(Modifier::Shift);
    modifiers.erase(Modifier::Alt);
    EXPECT_EQ(modifiers, Modifiers{Modifier::Windows});
    modifiers.erase(Modifier::Windows);
    EXPECT_TRUE(modifiers.empty());
    EXPECT_EQ(modifiers, Modifiers());
}

TEST(Names, OfButtonsAndModifiersAreThoseOfTheirComments) {
    std::string names;
    for (const MouseButton button : s_mouseButtons)
        names += std::string(nameOf(button)) + ' ';
    for (const Modifier modifier : s_modifiers)
        names += std::string(nameOf(modifier)) + ' ';
    EXPECT_EQ(names, "left right middle alpha shift ctrl alt cmd win ");
}

// ---- Buttons --------------------------------------------------------------------------------------------------

TEST(ButtonActions, AreAboutTheFirstOfTheFourLowestBits) {
    EXPECT_EQ(buttonText(1), "left down");
    EXPECT_EQ(buttonText(2), "left up");
    EXPECT_EQ(buttonText(4), "right down");
    EXPECT_EQ(buttonText(8), "right up");
    EXPECT_EQ(buttonText(3), "left down");
    EXPECT_EQ(buttonText(15), "left down");
    EXPECT_EQ(buttonText(14), "left up");
    EXPECT_EQ(buttonText(12), "right down");
    EXPECT_EQ(buttonText(8 + 16), "right up");
    EXPECT_EQ(buttonText(1 + 256), "left down");
    EXPECT_EQ(buttonText(-1), "left down");
    EXPECT_EQ(buttonText(s_lowest + 2), "left up");
}

TEST(ButtonActions, AreAboutTheMiddleButtonIfNoneOfTheFourLowestBitsIsSet) {
    EXPECT_EQ(buttonText(16), "middle down");
    EXPECT_EQ(buttonText(32), "middle up");
    EXPECT_EQ(buttonText(16 + 32), "middle down");
    EXPECT_EQ(buttonText(16 + 64 + 128), "middle down");
    EXPECT_EQ(buttonText(256 + 32), "middle up");
    EXPECT_EQ(buttonText(-16), "middle down");
    EXPECT_EQ(buttonText(-32), "middle up");
}

TEST(ButtonActions, AreOtherwiseAboutNoButton) {
    for (const std::int32_t stored : {0, 64, 128, 192, 256, 256 + 64, 512, -64, -256, s_lowest}) {
        const ButtonAction action = buttonActionOf(stored);
        EXPECT_EQ(action.button, std::nullopt) << stored;
        EXPECT_FALSE(action.isPress);
        EXPECT_TRUE(action.modifiers.empty());
        EXPECT_FALSE(action.tellsModifiers());
        EXPECT_EQ(action.stored, stored);
    }
}

TEST(ButtonActions, OfTheLeftAndTheRightButtonTellModifiers) {
    EXPECT_EQ(modifiersOfAction(1), "");
    EXPECT_EQ(modifiersOfAction(1 + 16), "shift ");
    EXPECT_EQ(modifiersOfAction(2 + 32), "ctrl ");
    EXPECT_EQ(modifiersOfAction(4 + 64), "alt ");
    EXPECT_EQ(modifiersOfAction(8 + 128), "cmd ");
    EXPECT_EQ(modifiersOfAction(8 + 16 + 32 + 64 + 128), "shift ctrl alt cmd ");
    EXPECT_EQ(modifiersOfAction(-1), "shift ctrl alt cmd ");
    EXPECT_TRUE(buttonActionOf(1).tellsModifiers());
    EXPECT_TRUE(buttonActionOf(8).tellsModifiers());
}

TEST(ButtonActions, OfTheMiddleButtonTellNoModifiers) {
    EXPECT_EQ(modifiersOfAction(16 + 64 + 128), "");
    EXPECT_FALSE(buttonActionOf(16).tellsModifiers());
    EXPECT_FALSE(buttonActionOf(32).tellsModifiers());
}

TEST(ButtonActions, HaveTheNumbersThatTheyAreReadFrom) {
    EXPECT_EQ(storedButtonAction(MouseButton::Left, true), 1);
    EXPECT_EQ(storedButtonAction(MouseButton::Left, false), 2);
    EXPECT_EQ(storedButtonAction(MouseButton::Right, true, {Modifier::Shift, Modifier::Command}), 4 + 16 + 128);
    EXPECT_EQ(storedButtonAction(MouseButton::Right, false, {Modifier::Control, Modifier::Alt}), 8 + 32 + 64);
    EXPECT_EQ(storedButtonAction(MouseButton::Middle, true), 16);
    EXPECT_EQ(storedButtonAction(MouseButton::Middle, false), 32);
}

TEST(ButtonActions, HaveNoNumbersForCapsLockAndWindows) {
    EXPECT_EQ(storedButtonAction(MouseButton::Left, true, {Modifier::CapsLock, Modifier::Windows}), 1);
    EXPECT_EQ(storedButtonAction(MouseButton::Middle, false, {Modifier::Shift, Modifier::Command}), 32);
}

TEST(ButtonActions, ComeBackFromTheirNumbers) {
    for (const MouseButton button : s_mouseButtons)
        for (const bool isPress : {true, false})
            for (const Modifiers modifiers : everyModifiers()) {
                Modifiers told = button == MouseButton::Middle ? Modifiers() : modifiers;
                told.erase(Modifier::CapsLock);
                told.erase(Modifier::Windows);
                const std::int32_t stored = storedButtonAction(button, isPress, modifiers);
                EXPECT_EQ(buttonActionOf(stored), (ButtonAction{button, isPress, told, stored}));
            }
}

// ---- Keys -----------------------------------------------------------------------------------------------------

TEST(KeyInputs, AreVirtualKeysOrCharacters) {
    const KeyInput key = keyInputOf({119, 0x40020000});
    EXPECT_TRUE(key.isVirtualKey);
    EXPECT_EQ(key.code, 119U);
    EXPECT_TRUE(key.is(VirtualKey::F8));
    EXPECT_FALSE(key.is(VirtualKey::F9));
    EXPECT_EQ(textOf(key.modifiers), "shift ");
    EXPECT_EQ(key.stored, KeyStroke(119, 0x40020000));

    const KeyInput character = keyInputOf({119, 0x20000000});
    EXPECT_FALSE(character.isVirtualKey);
    EXPECT_EQ(character.code, U'w');
    EXPECT_FALSE(character.is(VirtualKey::F8));
    EXPECT_TRUE(character.modifiers.empty());
}

TEST(KeyInputs, TellEveryModifier) {
    const auto modifiersOf = [](std::uint32_t flags) { return textOf(keyInputOf({65, flags}).modifiers); };
    EXPECT_EQ(modifiersOf(0x00010000), "alpha ");
    EXPECT_EQ(modifiersOf(0x00020000), "shift ");
    EXPECT_EQ(modifiersOf(0x00040000), "ctrl ");
    EXPECT_EQ(modifiersOf(0x00080000), "alt ");
    EXPECT_EQ(modifiersOf(0x00100000), "cmd ");
    EXPECT_EQ(modifiersOf(0x80000000), "win ");
    EXPECT_EQ(modifiersOf(0x60e0ffff), "");
    EXPECT_EQ(modifiersOf(0xffffffff), "alpha shift ctrl alt cmd win ");
}

TEST(KeyInputs, HaveTheNumbersThatTheyAreReadFrom) {
    EXPECT_EQ(storedKey(VirtualKey::F8, {Modifier::Shift}), KeyStroke(119, 0x40020000));
    EXPECT_EQ(storedKey(VirtualKey::Period), KeyStroke(190, 0x40000000));
    EXPECT_EQ(storedKey(static_cast<VirtualKey>('A'), {Modifier::Windows}), KeyStroke(65, 0xc0000000));
    EXPECT_EQ(storedCharacter(U'\u00e9'), KeyStroke(0xe9, 0));
    EXPECT_EQ(storedCharacter(U'S', {Modifier::CapsLock, Modifier::Command}), KeyStroke('S', 0x00110000));
}

TEST(KeyInputs, ComeBackFromTheirNumbers) {
    for (const Modifiers modifiers : everyModifiers()) {
        const KeyStroke key = storedKey(VirtualKey::Escape, modifiers);
        EXPECT_EQ(keyInputOf(key), (KeyInput{true, 27, modifiers, key}));
        const KeyStroke character = storedCharacter(U'\U0001f600', modifiers);
        EXPECT_EQ(keyInputOf(character), (KeyInput{false, 0x1f600, modifiers, character}));
    }
}

TEST(VirtualKeys, HaveTheNamesOfTheTexts) {
    EXPECT_EQ(nameOfVirtualKey(0), "unknown");
    EXPECT_EQ(nameOfVirtualKey(13), "returnKey");
    EXPECT_EQ(nameOfVirtualKey('1'), "exclamation");
    EXPECT_EQ(nameOfVirtualKey(131), "f20");
    EXPECT_EQ(nameOfVirtualKey(190), "period");
    for (std::uint32_t code = 0; code < 300; ++code)
        if (const std::string_view name = nameOfVirtualKey(code); !name.empty()) {
            EXPECT_EQ(HumanReadableActions::KeyboardActionCodeToString(static_cast<int>(code)), name);
        }
}

TEST(VirtualKeys, WithoutANameAreLettersFourAndUnknownCodes) {
    for (const std::uint32_t code : {1U, 10U, 52U, 65U, 90U, 111U, 132U, 191U, 0x80000000U, 0xffffffffU})
        EXPECT_EQ(nameOfVirtualKey(code), "") << code;
}

} // namespace
} // namespace ZULMetaData::Test
