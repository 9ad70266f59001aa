#include "Tools/render/Options.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>

namespace Render::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

RenderOptions parsed(std::vector<std::string> words) {
    RenderOptions options;
    CLI::App app;
    addRenderOptions(app, options)->callback([&options] { requireSense(options); });
    words.insert(words.begin(), "render");
    std::reverse(words.begin(), words.end()); // the parser takes them from the end
    app.parse(words);
    return options;
}

/// The options of a film, with these more.
RenderOptions film(std::vector<std::string> words) {
    words.insert(words.begin(), {"Talk.mp4", "-o", "Film.mp4"});
    return parsed(std::move(words));
}

/// What is wrong with the words.
std::string refusal(const std::vector<std::string>& words) {
    try {
        parsed(words);
    } catch (const CLI::ParseError& error) {
        return error.what();
    }
    return "nothing was thrown";
}

std::string refusalOfFilm(std::vector<std::string> words) {
    words.insert(words.begin(), {"Talk.mp4", "-o", "Film.mp4"});
    return refusal(words);
}

TEST(RenderOptions, LeaveTheStyleAsItIs) {
    const RenderOptions options = film({});
    EXPECT_EQ(options.recording, "Talk.mp4");
    EXPECT_EQ(options.output, "Film.mp4");
    EXPECT_EQ(options.style, "product");
    EXPECT_EQ(options.codec, "h264");
    EXPECT_EQ(options.keys, "");
    EXPECT_EQ(options.zoom, "");
    EXPECT_FALSE(options.cursorSize || options.hideAfter || options.size || options.fps || options.quality);
    EXPECT_FALSE(options.isRaw || options.removesIdle || options.isSilent || options.isGif || options.force);
}

TEST(RenderOptions, TakeTimesInSecondsAndAsTimeCodes) {
    const RenderOptions options =
        parsed({"Talk.mp4", "--frames", "stills", "--at", "1.5,1:30,0:01:02.5", "--hide-cursor", "0:02",
                "--remove-idle", "--idle-least", "1:00", "--idle-rest", "0"});
    EXPECT_THAT(options.at, ElementsAre(1.5, 90, 62.5));
    EXPECT_EQ(options.hideAfter, 2);
    EXPECT_EQ(options.idleLeast, 60);
    EXPECT_EQ(options.idleRest, 0);
}

TEST(RenderOptions, TakeTheRecordingAfterTheTimes) {
    const RenderOptions options = parsed({"--frames", "stills", "--at", "1,2", "--at", "3", "Talk.mp4"});
    EXPECT_THAT(options.at, ElementsAre(1, 2, 3));
    EXPECT_EQ(options.recording, "Talk.mp4");
}

TEST(RenderOptions, TakeSizesOfEvenNumbers) {
    const RenderOptions options = film({"--size", "1280x720"});
    ASSERT_TRUE(options.size);
    EXPECT_EQ(options.size->width, 1280);
    EXPECT_EQ(options.size->height, 720);
    for (const char* size : {"", "x", "1280", "1280x", "x720", "1281x720", "1280x721", "14x720", "8194x720",
                             "-1280x720", "1280x720x1", "1280X720", " 1280x720", "99999999999x720"})
        EXPECT_THAT(refusalOfFilm({"--size", size}), HasSubstr("--size")) << size;
}

TEST(RenderOptions, RefuseNumbersOutsideOfTheirBounds) {
    for (const char* option : {"--fps", "--cursor-size", "--quality", "--hide-cursor"})
        for (const char* value : {"nan", "inf", "1e300", "x", "", "5,5"})
            EXPECT_THAT(refusalOfFilm({option, value}), HasSubstr(option)) << value;
    EXPECT_THAT(refusalOfFilm({"--fps", "120.5"}), HasSubstr("120.5 is not a number from 1 to 120"));
    EXPECT_THAT(refusalOfFilm({"--hide-cursor", "0.05"}), HasSubstr("0.05 is not from 0.1 to 3600 seconds"));
    EXPECT_THAT(refusal({"Talk.mp4", "--frames", "stills", "--at", "1,nan"}), HasSubstr("'nan' is not a time"));
}

TEST(RenderOptions, RefuseWhatDoesNotGoTogether) {
    EXPECT_THAT(refusal({"Talk.mp4"}), HasSubstr("either -o OUT or --frames DIR"));
    EXPECT_THAT(refusalOfFilm({"--frames", "stills", "--at", "1"}), HasSubstr("excludes"));
    EXPECT_THAT(refusal({"Talk.mp4", "--frames", "stills"}), HasSubstr("requires"));
    EXPECT_THAT(refusalOfFilm({"--at", "1"}), HasSubstr("requires"));
    EXPECT_THAT(refusal({"Talk.mp4", "--gif", "--frames", "stills", "--at", "1"}), HasSubstr("excludes"));
    EXPECT_THAT(refusalOfFilm({"--remove-idle", "--keep", "1-2"}), HasSubstr("excludes"));
    EXPECT_THAT(refusalOfFilm({"--remove", "3-4", "--keep", "1-2"}), HasSubstr("cannot be given together"));
    EXPECT_THAT(refusalOfFilm({"--idle-rest", "1"}), HasSubstr("requires"));
    EXPECT_THAT(refusal({"-", "-o", "Film.mp4", "--edits", "-"}), HasSubstr("can be standard input"));
}

TEST(RenderOptions, GoByTheNameOfTheFilm) {
    EXPECT_THAT(refusal({"Talk.mp4", "-o", "Film.avi"}), HasSubstr("must end in .mp4"));
    EXPECT_THAT(refusal({"Talk.mp4", "-o", "Film.gif"}), HasSubstr("--gif makes an animated GIF"));
    EXPECT_THAT(refusal({"Talk.mp4", "-o", "Film.mp4", "--gif"}), HasSubstr("must end in .gif"));
    EXPECT_TRUE(parsed({"Talk.mp4", "-o", "Film.gif", "--gif", "--fps", "50"}).isGif);
    EXPECT_THAT(refusal({"Talk.mp4", "-o", "Film.gif", "--gif", "--fps", "51"}), HasSubstr("at most 50 frames"));
}

TEST(RenderOptions, NameTheFilesThatAreRead) {
    const RenderOptions options =
        film({"--style", "my.json", "--redact", "r.json", "--zoom", "z.json", "--edits", "e.json"});
    EXPECT_THAT(inputsOf(options), ElementsAre("Talk.mp4", "my.json", "r.json", "z.json", "e.json"));
    EXPECT_THAT(inputsOf(film({"--style", "plain", "--zoom", "off"})), ElementsAre("Talk.mp4"));
}

TEST(GuideOptions, NeedAFolder) {
    GuideOptions options;
    CLI::App app;
    addGuideOptions(app, options);
    app.parse("guide Talk.mp4 -o guide --keys shown");
    EXPECT_EQ(options.folder, "guide");
    EXPECT_EQ(options.keys, "shown");
    EXPECT_THROW(app.parse("guide Talk.mp4"), CLI::RequiredError);
    EXPECT_THROW(app.parse("guide Talk.mp4 -o guide --keys some"), CLI::ValidationError);
}

} // namespace
} // namespace Render::Test
