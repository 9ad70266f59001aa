#include "Tools/render/KeyCaps.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace Render::Test {
namespace {

TEST(KeyCaps, AreWhatIsWrittenOnTheKeys) {
    EXPECT_EQ(keyCap("⌘[returnKey]"), "⌘Return");
    EXPECT_EQ(keyCap("[left]"), "←");
    EXPECT_EQ(keyCap("⌃⇧[tab]"), "⌃⇧Tab");
    EXPECT_EQ(keyCap("[f12]"), "F12");
    EXPECT_EQ(keyCap("⌃[plus]"), "⌃+");
}

TEST(KeyCaps, LeaveOtherLabelsAsTheyAre) {
    for (const char* label : {"", "a", "⌃S", "[", "]", "[]", "[x", "⌃[", "x]"})
        EXPECT_EQ(keyCap(label), label);
}

/// "a" at 1 s, "b" at 2 s, Return at 3 s, and "c" at 4 s.
ZULMetaData::KeyCaption caption() {
    ZULMetaData::KeyCaption caption;
    caption.keys = {{1, "a", true}, {2, "b", true}, {3, "[returnKey]", false}, {4, "c", true}};
    return caption;
}

TEST(KeyCaps, AppearAsTheKeysArePressed) {
    using Parts = std::vector<CaptionPart>;
    EXPECT_EQ(partsAt(caption(), 0.5, true), Parts());
    EXPECT_EQ(partsAt(caption(), 1, true), (Parts{{"a", true}}));
    EXPECT_EQ(partsAt(caption(), 2.5, true), (Parts{{"ab", true}}));
    EXPECT_EQ(partsAt(caption(), 9, true), (Parts{{"ab", true}, {"Return", false}, {"c", true}}));
}

TEST(KeyCaps, LeaveOutWhatIsTypedUnlessItIsShown) {
    EXPECT_EQ(partsAt(caption(), 9, false), (std::vector<CaptionPart>{{"Return", false}}));
    EXPECT_TRUE(partsAt(caption(), 2.5, false).empty());
}

} // namespace
} // namespace Render::Test
