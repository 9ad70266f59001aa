// `zulm demo`: a session recorded, put into a movie and read back.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using testing::HasSubstr;

class DemoCommand : public RecordedSession {};

TEST_F(DemoCommand, MakesARecordingThatReadsBackAsItWasRecorded) {
    const ToolResult result = runTool({"demo", folder / "new/place"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output,
                HasSubstr("cursorLocation           1200     0.000    19.983     19224   as recorded\n"));
    EXPECT_THAT(result.output, HasSubstr("Everything that was recorded has been read back.\n"));
    EXPECT_EQ(runTool({"verify", folder / "new/place/Recording.mp4"}).exitCode, 0);
    EXPECT_THAT(runTool({"info", folder / "new/place/Recording.mp4"}).output, HasSubstr("movie, 20.000 s, "));
    EXPECT_TRUE(std::filesystem::exists(folder / "new/place/streams/keyboardAction.dat"));
}

TEST_F(DemoCommand, MakesAMovieThatPlayersRead) {
    ASSERT_EQ(runTool({"demo", folder.path().string()}).exitCode, 0);
    EXPECT_EQ(outputOf("ffprobe -v error -show_entries stream=codec_name,width,height,duration -of csv=p=0 '" +
                       (folder / "Recording.mp4") + "' 2>&1"),
              "png,320,180,20.000000\n");
    EXPECT_EQ(outputOf("ffmpeg -v error -i '" + (folder / "Recording.mp4") + "' -f null - 2>&1"), "");
}

TEST_F(DemoCommand, RecordsIntoACopyOfAMovie) {
    writeFile(folder / "Mine.mov", tinyMovie());
    EXPECT_EQ(runTool({"demo", folder / "out", "--movie", folder / "Mine.mov"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "Mine.mov"), tinyMovie());
    EXPECT_EQ(runTool({"info", folder / "out/Recording.mov"}).exitCode, 0);
}

TEST_F(DemoCommand, ReplacesARecordingOnlyWhenForced) {
    ASSERT_EQ(runTool({"demo", folder.path().string()}).exitCode, 0);
    const std::string first = contentsOf(folder / "Recording.mp4");
    const ToolResult again = runTool({"demo", folder.path().string()});
    EXPECT_EQ(again.exitCode, 1);
    EXPECT_THAT(again.errors, HasSubstr("Recording.mp4: exists already; --force replaces it"));
    EXPECT_EQ(contentsOf(folder / "Recording.mp4"), first);
    EXPECT_EQ(runTool({"demo", folder.path().string(), "--force"}).exitCode, 0);
}

TEST_F(DemoCommand, RefusesAMovieThatIsNone) {
    EXPECT_EQ(runTool({"demo", folder.path().string(), "--movie", folder / "missing.mp4"}).exitCode, 1);
    writeFile(folder / "a.dat", locations());
    EXPECT_THAT(runTool({"demo", folder.path().string(), "--movie", folder / "a.dat"}).errors,
                HasSubstr("not a movie"));
    EXPECT_THAT(runTool({"demo", folder / "a.dat"}).errors, HasSubstr("a.dat"));
}

} // namespace
} // namespace ZULMetaData::Test
