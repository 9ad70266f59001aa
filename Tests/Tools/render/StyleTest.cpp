#include "Tools/render/Style.h"

#include "Tests/Tools/render/RenderSamples.h"

#include <gtest/gtest.h>

namespace Render::Test {
namespace {

/// A document of these members, which begin in its second line.
std::string documentOf(const std::string& members) {
    return "{\"schema\": \"zulm.style\", \"schema_version\": 1" + (members.empty() ? "" : ",\n" + members) + "}";
}

Style read(const std::string& members) {
    return readStyle(documentOf(members), "my.json");
}

std::string refusal(const std::string& members) {
    return failureOf([&] { read(members); });
}

TEST(Style, TakesWhatIsLeftOutFromProduct) {
    const Style style = read("");
    EXPECT_NEAR(style.background.from.red, 0x2b / 255.0, 1e-12);
    ASSERT_TRUE(style.background.to);
    EXPECT_NEAR(style.background.to->blue, 0x8f / 255.0, 1e-12);
    EXPECT_EQ(style.background.angle, 45);
    EXPECT_EQ(style.frame.padding, 56);
    EXPECT_EQ(style.frame.shadowOpacity, 0.45);
    EXPECT_EQ(style.cursor.size, 1.5);
    EXPECT_TRUE(style.cursor.isSmooth);
    EXPECT_FALSE(style.cursor.hideAfter);
    EXPECT_EQ(style.keys.display, KeyDisplay::Shortcuts);
    EXPECT_TRUE(style.zoom.isAutomatic);
    EXPECT_EQ(style.zoom.factor, 1.5);
}

TEST(Style, ReadsEveryMember) {
    const Style style = read(R"("name": "x", "background": {"color": "#ff0000", "to": "#0000FF", "angle": -90},
"frame": {"padding": 1, "corner_radius": 2, "shadow_blur": 3, "shadow_offset": -4, "shadow_opacity": 0.5},
"cursor": {"size": 10, "smooth": false, "hide_after": 2.5},
"clicks": {"show": false, "color": "#00ff0080", "radius": 6, "duration": 0.7},
"keys": {"display": "hidden", "size": 8, "font": "Serif", "color": "#010203", "background": "#04050600"},
"zoom": {"auto": false, "factor": 8, "settle_time": 1, "follow_cursor": false})");
    EXPECT_EQ(style.background.from.red, 1);
    EXPECT_EQ(style.background.to.value_or(Colour{}).blue, 1);
    EXPECT_EQ(style.background.angle, -90);
    EXPECT_EQ(style.frame.padding, 1);
    EXPECT_EQ(style.frame.cornerRadius, 2);
    EXPECT_EQ(style.frame.shadowBlur, 3);
    EXPECT_EQ(style.frame.shadowOffset, -4);
    EXPECT_EQ(style.frame.shadowOpacity, 0.5);
    EXPECT_EQ(style.cursor.size, 10);
    EXPECT_FALSE(style.cursor.isSmooth);
    EXPECT_EQ(style.cursor.hideAfter, 2.5);
    EXPECT_FALSE(style.clicks.isShown);
    EXPECT_NEAR(style.clicks.colour.alpha, 128 / 255.0, 1e-12);
    EXPECT_EQ(style.clicks.radius, 6);
    EXPECT_EQ(style.clicks.duration, 0.7);
    EXPECT_EQ(style.keys.display, KeyDisplay::Hidden);
    EXPECT_EQ(style.keys.size, 8);
    EXPECT_EQ(style.keys.font, "Serif");
    EXPECT_NEAR(style.keys.colour.green, 2 / 255.0, 1e-12);
    EXPECT_EQ(style.keys.background.alpha, 0);
    EXPECT_FALSE(style.zoom.isAutomatic);
    EXPECT_EQ(style.zoom.factor, 8);
    EXPECT_EQ(style.zoom.settleTime, 1);
    EXPECT_FALSE(style.zoom.followsCursor);
}

TEST(Style, HasOneColourIfNoOtherEndIsSaid) {
    EXPECT_FALSE(read(R"("background": {"color": "#000000"})").background.to);
}

TEST(Style, TellsTheLineAndTheMember) {
    EXPECT_EQ(refusal("\"cursor\": {\n  \"smooth\": true,\n  \"size\": 11\n}"),
              "my.json: line 4: \"cursor.size\" must be a number from 0.25 to 10");
    EXPECT_EQ(refusal("\"cursor\": {\n\"breadth\": 2}"), "my.json: line 3: \"cursor.breadth\" is not known");
    EXPECT_EQ(refusal("\"clicks\": []"), "my.json: line 2: \"clicks\" must be an object");
    EXPECT_EQ(refusal("\"clicks\": {\"show\": 1}"), "my.json: line 2: \"clicks.show\" must be true or false");
    EXPECT_EQ(refusal("\"keys\": {\"display\": \"some\"}"),
              "my.json: line 2: \"keys.display\" must be one of \"shown\", \"shortcuts\", \"hidden\"");
}

TEST(Style, RefusesColoursThatAreNone) {
    for (const char* colour : {"red", "#12345", "#1234567", "#12345g", "#+12345", "", "#", "123456"})
        EXPECT_EQ(refusal("\"clicks\": {\"color\": \"" + std::string(colour) + "\"}"),
                  "my.json: line 2: \"clicks.color\" must be a colour such as \"#3d7bff\", or \"#3d7bff80\" with its "
                  "opacity");
    EXPECT_EQ(refusal("\"background\": {\"color\": \"#11223344\"}"),
              "my.json: line 2: \"background.color\" must be a colour such as \"#3d7bff\"");
    EXPECT_EQ(refusal("\"background\": {\"to\": \"#112233\"}"),
              "my.json: line 2: \"background.to\" needs \"background.color\", the other end of the gradient");
}

TEST(Style, IsOneThatShipsOrAFile) {
    EXPECT_EQ(styleOf("plain").frame.padding, 0);
    EXPECT_EQ(styleOf("product").frame.padding, 56);
    EXPECT_EQ(failureOf([] { styleOf("fancy"); }),
              "fancy: no style has this name; there are plain, product, and files whose names end in .json or have a "
              "slash");
    EXPECT_EQ(failureOf([] { styleOf("/no/such.json"); }),
              "/no/such.json: cannot be opened: No such file or directory");
}

} // namespace
} // namespace Render::Test
