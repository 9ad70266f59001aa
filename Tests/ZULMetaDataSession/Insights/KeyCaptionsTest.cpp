#include "ZULMetaDataSession/Insights/KeyCaptions.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint32_t s_lock = 0x10000;
constexpr std::uint32_t s_shift = 0x20000;
constexpr std::uint32_t s_control = 0x40000;
constexpr std::uint32_t s_alt = 0x80000;
constexpr std::uint32_t s_command = 0x100000;
constexpr std::uint32_t s_virtualKey = 0x40000000;
constexpr std::uint32_t s_windows = 0x80000000;
constexpr std::uint32_t s_return = 13;
constexpr std::uint32_t s_up = 38;

const std::string s_bullet = "\xe2\x80\xa2";

KeyCaptionOptions shown(double pause = 1) {
    KeyCaptionOptions options;
    options.showsKeys = true;
    options.pause = pause;
    return options;
}

std::string label(std::uint32_t code, std::uint32_t flags = 0) {
    return keyCaptions(keys({{1, {code, flags}}}), shown()).at(0).text;
}

std::string maskedLabel(std::uint32_t code, std::uint32_t flags = 0) {
    return keyCaptions(keys({{1, {code, flags}}})).at(0).text;
}

Track<KeyboardActionKind> typed(double time, const std::string& text) {
    std::vector<std::pair<double, KeyStroke>> entries;
    for (const char c : text)
        entries.emplace_back(time, KeyStroke{static_cast<unsigned char>(c), 0});
    return keys(entries);
}

std::vector<std::string> textsOf(const std::vector<KeyCaption>& captions) {
    std::vector<std::string> texts;
    for (const KeyCaption& caption : captions)
        texts.push_back(caption.text);
    return texts;
}

TEST(KeyCaptions, ShowCharactersAsTheyAre) {
    EXPECT_EQ(label('A'), "A");
    EXPECT_EQ(label(' '), " ");
    EXPECT_EQ(label('5'), "5");
    EXPECT_EQ(label(0x20ac), "\xe2\x82\xac");
    EXPECT_EQ(label(0xd800), "[key 55296]");
    EXPECT_EQ(label(1), "[key 1]");
}

TEST(KeyCaptions, ShowWhatVirtualKeysType) {
    EXPECT_EQ(label('A', s_virtualKey), "a");
    EXPECT_EQ(label('A', s_virtualKey | s_shift), "A");
    EXPECT_EQ(label('A', s_virtualKey | s_lock), "A");
    EXPECT_EQ(label('A', s_virtualKey | s_lock | s_shift), "a");
    EXPECT_EQ(label(' ', s_virtualKey), " ");
    EXPECT_EQ(label('1', s_virtualKey), "1");
    EXPECT_EQ(label('5', s_virtualKey | s_shift), "%");
    EXPECT_EQ(label(188, s_virtualKey), ",");
    EXPECT_EQ(label(190, s_virtualKey), ".");
}

TEST(KeyCaptions, NameKeysThatTypeNothing) {
    EXPECT_EQ(label(s_return), "[returnKey]");
    EXPECT_EQ(label(115, s_virtualKey), "[f4]");
    EXPECT_EQ(label(39, s_virtualKey), "[right]");
    EXPECT_EQ(label(97, s_virtualKey), "[key 97]");
}

TEST(KeyCaptions, ShowModifiersAsSignsBeforeTheKey) {
    EXPECT_EQ(label('S', s_virtualKey | s_shift | s_command), "\xe2\x87\xa7\xe2\x8c\x98S");
    EXPECT_EQ(label(s_up, s_virtualKey | s_control | s_alt | s_windows), "\xe2\x8c\x83\xe2\x8c\xa5\xe2\x8a\x9e[up]");
    EXPECT_EQ(label(9, s_shift), "\xe2\x87\xa7[tab]");
}

TEST(KeyCaptions, MaskWhatWasTypedAndNoOtherKeys) {
    EXPECT_EQ(maskedLabel('A', s_virtualKey), s_bullet);
    EXPECT_EQ(maskedLabel('\''), s_bullet);
    EXPECT_EQ(maskedLabel('A', s_virtualKey | s_command), "\xe2\x8c\x98" + s_bullet);
    EXPECT_EQ(maskedLabel(97, s_virtualKey), s_bullet) << "it may type a character";
    EXPECT_EQ(maskedLabel(s_return), "[returnKey]");
    EXPECT_EQ(maskedLabel(s_up, s_virtualKey), "[up]");
}

TEST(KeyCaptions, ShowCharactersOfShortcutsIfAsked) {
    const auto shortcut = [](std::uint32_t code, std::uint32_t flags) {
        KeyCaptionOptions options;
        options.showsShortcuts = true;
        return keyCaptions(keys({{1, {code, flags}}}), options).at(0).text;
    };
    EXPECT_EQ(shortcut('S', s_virtualKey | s_control), "\xe2\x8c\x83S");
    EXPECT_EQ(shortcut('S', s_virtualKey | s_shift | s_command), "\xe2\x87\xa7\xe2\x8c\x98S");
    EXPECT_EQ(shortcut('A', s_virtualKey), s_bullet);
    EXPECT_EQ(shortcut('A', s_virtualKey | s_shift), s_bullet);
    EXPECT_EQ(shortcut('@', s_alt), "\xe2\x8c\xa5" + s_bullet) << "it may be a letter of a password";
    EXPECT_EQ(shortcut('@', s_control | s_alt), "\xe2\x8c\x83\xe2\x8c\xa5" + s_bullet);
}

TEST(KeyCaptions, MaskEveryKeyThatTypesACharacter) {
    for (std::uint32_t code = 0; code < 0x180; ++code) {
        const bool isNamed = (code >= 3 && code <= 47 && code != 32) || (code >= 112 && code <= 145) || code == 0;
        for (const std::uint32_t flags : {0U, s_virtualKey, s_shift, s_command}) {
            const bool isSpecial = isNamed && (flags == s_virtualKey || code < 32 || code == 127);
            const std::string shown = maskedLabel(code, flags);
            EXPECT_TRUE(isSpecial || shown == s_bullet || shown == "\xe2\x8c\x98" + s_bullet) << shown;
        }
    }
}

TEST(KeyCaptions, EndAtAPauseOrTheReturnKey) {
    const Track<KeyboardActionKind> track =
        keys({{1, {'H', 0}}, {1.25, {'I', 0}}, {1.5, {s_return, 0}}, {1.75, {'O', 0}}, {3, {'K', 0}}});
    const std::vector<KeyCaption> captions = keyCaptions(track, shown());
    EXPECT_THAT(textsOf(captions), ElementsAre("HI [returnKey]", "O", "K"));
    EXPECT_EQ(captions[0].start, 1);
    EXPECT_EQ(captions[0].end, 3);
    EXPECT_EQ(captions[1].start, 1.75);
    EXPECT_EQ(captions[1].end, 3.25);
    EXPECT_THAT(textsOf(keyCaptions(track, shown(0.25))), ElementsAre("H", "I", "[returnKey]", "O", "K"));
    EXPECT_THAT(textsOf(keyCaptions(track, shown(5))), ElementsAre("HI [returnKey]", "OK"));
}

TEST(KeyCaptions, AreNoLongerThanALine) {
    EXPECT_THAT(textsOf(keyCaptions(typed(1, std::string(50, 'x')), shown())),
                ElementsAre(std::string(42, 'x'), std::string(8, 'x')));
    const std::vector<KeyCaption> masked = keyCaptions(typed(1, std::string(50, 'x')));
    EXPECT_EQ(masked.at(0).text.size(), 42 * s_bullet.size()) << "a line is counted in characters";
    KeyCaptionOptions options = shown();
    options.lineLength = 2;
    EXPECT_THAT(textsOf(keyCaptions(keys({{1, {'a', 0}}, {1, {'b', 0}}, {1, {s_return, 0}}, {1, {'c', 0}}}), options)),
                ElementsAre("ab", "[returnKey]", "c"));
}

TEST(KeyCaptions, HoldTheirKeysInTheOrderOfTheirTimes) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const double infinity = std::numeric_limits<double>::infinity();
    const std::vector<KeyCaption> captions = keyCaptions(keys({{2, {'S', s_command}},
                                                               {nan, {'x', 0}},
                                                               {1.5, {'b', 0}},
                                                               {1, {'a', 0}},
                                                               {1.5, {'c', 0}},
                                                               {infinity, {'y', 0}}}),
                                                         shown());
    ASSERT_THAT(textsOf(captions), ElementsAre("abc \xe2\x8c\x98S"));
    std::vector<std::string> labels;
    std::vector<double> times;
    std::vector<bool> areTyped;
    for (const CaptionKey& key : captions[0].keys) {
        labels.push_back(key.label);
        times.push_back(key.time);
        areTyped.push_back(key.isTyped);
    }
    EXPECT_THAT(labels, ElementsAre("a", "b", "c", "\xe2\x8c\x98S"));
    EXPECT_THAT(times, ElementsAre(1, 1.5, 1.5, 2));
    EXPECT_THAT(areTyped, ElementsAre(true, true, true, false));
}

TEST(KeyCaptions, CountTheSpaceBetweenTwoKeysInALine) {
    const Track<KeyboardActionKind> track = keys({{1, {'a', 0}}, {1, {s_up, s_virtualKey}}});
    KeyCaptionOptions options = shown();
    options.lineLength = 5;
    EXPECT_THAT(textsOf(keyCaptions(track, options)), ElementsAre("a", "[up]"));
    options.lineLength = 6;
    EXPECT_THAT(textsOf(keyCaptions(track, options)), ElementsAre("a [up]"));
}

TEST(KeyCaptions, EndWithTheRecordingUnlessTheirLastKeyComesLater) {
    const auto endOf = [](double time, double duration) {
        return keyCaptions(typed(time, "a"), {}, duration).at(0).end;
    };
    EXPECT_EQ(endOf(1, 2), 2);
    EXPECT_EQ(endOf(1, 60), 2.5);
    EXPECT_EQ(endOf(2, 2), 3.5);
    EXPECT_EQ(endOf(3, 2), 4.5);
}

TEST(KeyCaptions, StayAfterTheirLastKey) {
    KeyCaptionOptions options;
    options.hold = 4;
    EXPECT_EQ(keyCaptions(typed(1, "a"), options).at(0).end, 5);
}

TEST(KeyCaptions, AreMadeOfWhatTheKeySaysWhateverIsStored) {
    KeyInput key;
    key.isVirtualKey = true;
    key.code = static_cast<std::uint32_t>(VirtualKey::Tab);
    key.modifiers = {Modifier::Shift};
    EXPECT_EQ(keyCaptions(trackOf<KeyboardActionKind>({{1, key}})).at(0).text, "\xe2\x87\xa7[tab]");
}

TEST(KeyCaptions, AreMadeOfAMillionKeysAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    const Track<KeyboardActionKind> track(std::vector<double>(count, 1e300),
                                          std::vector<KeyInput>(count, keyInputOf({0xffffffff, 0})));
    EXPECT_EQ(keyCaptions(track).size(), 23'810U) << "lines of 42";
}

TEST(KeyCaptions, SayWhichKeysTypeACharacter) {
    for (const KeyStroke& key : {KeyStroke('a', 0), KeyStroke(' ', s_shift), KeyStroke('A', s_virtualKey | s_lock)})
        EXPECT_TRUE(typesCharacter(keyInputOf(key))) << key;
    for (const KeyStroke& key : {KeyStroke(s_return, 0), KeyStroke('s', s_command), KeyStroke(s_up, s_virtualKey),
                                 KeyStroke('A', s_virtualKey | s_control)})
        EXPECT_FALSE(typesCharacter(keyInputOf(key))) << key;
}

TEST(KeyCaptions, AreNoneIfNoKeyWasPressed) {
    EXPECT_THAT(keyCaptions({}), IsEmpty());
}

} // namespace
} // namespace ZULMetaData::Test
