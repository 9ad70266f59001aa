#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;

class ExtractCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }
};

TEST_F(ExtractCommand, WritesEveryStreamByteForByte) {
    const ToolResult result = runTool({"extract", movie(), "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    for (const std::string& file : streamFiles()) {
        const std::string name = std::filesystem::path(file).filename().string();
        EXPECT_TRUE(contentsOf(folder / ("out/" + name)) == contentsOf(file)) << name;
    }
}

TEST_F(ExtractCommand, GivesWhatAttachPutsBackIdentically) {
    ASSERT_EQ(runTool({"extract", movie(), "-o", folder / "out"}).exitCode, 0);
    std::vector<std::string> arguments{"attach", write("plain.mp4", tinyMovie())};
    for (const std::string& file : streamFiles())
        arguments.push_back(folder / ("out/" + std::filesystem::path(file).filename().string()));
    arguments.insert(arguments.end(), {"-o", folder / "again.mp4"});
    ASSERT_EQ(runTool(arguments).exitCode, 0);
    ASSERT_EQ(runTool({"extract", folder / "again.mp4", "-o", folder / "again"}).exitCode, 0);
    for (const std::string& file : streamFiles()) {
        const std::string name = std::filesystem::path(file).filename().string();
        EXPECT_TRUE(contentsOf(folder / ("again/" + name)) == contentsOf(file)) << name;
    }
    EXPECT_EQ(runTool({"diff", movie(), folder / "again.mp4"}).exitCode, 0);
}

TEST_F(ExtractCommand, WritesOnlyTheChosenKinds) {
    const auto result = runTool({"extract", movie(), "-o", folder / "out", "--stream", "cpuUsage", "--stream",
                                 "2b7b6af2-7a1f-11e2-83d0-0017f200be7f"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_TRUE(std::filesystem::exists(folder / "out/cpuUsage.dat"));
    EXPECT_TRUE(std::filesystem::exists(folder / "out/cursorLocation.dat"));
    EXPECT_FALSE(std::filesystem::exists(folder / "out/hoverRect.dat"));
}

TEST_F(ExtractCommand, NamesAnUnknownKindByItsIdentifier) {
    const std::string stream = streamHeader("deadbeef", 1, 12) + f64(1) + raw(2);
    const std::string file = write("movie.mov", media() + zulmAtom({stream}));
    EXPECT_EQ(runTool({"extract", file, "-o", folder / "out"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "out/deadbeef-7a1f-11e2-83d0-0017f200be7f.dat"), stream);
}

TEST_F(ExtractCommand, ReadsRIFFFilesAndStandardInput) {
    const std::string file = write("sound.wav", riffMedia() + zulmChunk({locationStream(), appNameStream()}));
    EXPECT_EQ(runTool({"extract", file, "-o", folder / "out"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "out/topmostAppName.dat"), appNameStream());
    ToolOptions options;
    options.input = contentsOf(file);
    EXPECT_EQ(runTool({"extract", "-", "-o", folder / "in"}, options).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "in/cursorLocation.dat"), locationStream());
}

TEST_F(ExtractCommand, SaysWhereTheFileEndsInsideAStream) {
    const std::string whole = media() + zulmAtom({locationStream()});
    const std::string file = write("cut.mp4", whole.substr(0, whole.size() - 6));
    const ToolResult result = runTool({"extract", file, "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("declares 56 bytes, of which 50 are there; 'zulm salvage"));
    EXPECT_EQ(contentsOf(folder / "out/cursorLocation.dat"), locationStream().substr(0, 50));
}

TEST_F(ExtractCommand, LeavesExistingFilesAloneWithoutForce) {
    std::filesystem::create_directory(folder / "out");
    write("out/hoverRect.dat", "mine");
    const ToolResult result = runTool({"extract", movie(), "-o", folder / "out"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("hoverRect.dat: exists already; --force replaces it"));
    EXPECT_EQ(contentsOf(folder / "out/hoverRect.dat"), "mine");
    EXPECT_FALSE(std::filesystem::exists(folder / "out/cpuUsage.dat")) << "nothing by halves";
    EXPECT_EQ(runTool({"extract", movie(), "-o", folder / "out", "--force"}).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "out/hoverRect.dat"), contentsOf(streamFile("hoverRect")));
}

TEST_F(ExtractCommand, RefusesToReplaceItsInput) {
    const std::string file = copyOf(streamFile("cpuUsage"));
    EXPECT_EQ(runTool({"extract", file, "-o", folder.path().string(), "--force"}).exitCode, 1);
    EXPECT_EQ(contentsOf(file), contentsOf(streamFile("cpuUsage")));
}

TEST_F(ExtractCommand, TellsAFileWithoutMetadataFromOneThatIsNone) {
    const ToolResult none = runTool({"extract", write("none.mp4", media()), "-o", folder / "out"});
    EXPECT_EQ(none.exitCode, 4);
    EXPECT_THAT(none.errors, HasSubstr("has no recording metadata; 'zulm salvage "));
    EXPECT_EQ(runTool({"extract", folder / "missing.mp4", "-o", folder / "out"}).exitCode, 1);
    EXPECT_EQ(runTool({"extract", movie()}).exitCode, 2);
    const ToolResult typo = runTool({"extract", movie(), "-o", folder / "out", "--stream", "cursorLocatoin"});
    EXPECT_EQ(typo.exitCode, 2);
    EXPECT_THAT(typo.errors, HasSubstr("did you mean cursorLocation?"));
}

TEST_F(ExtractCommand, ReportsAsJSON) {
    const ToolResult result = runTool({"extract", movie(), "-o", folder / "out", "--json", "--stream", "cpuUsage"});
    const Json report = Json::parse(result.output);
    EXPECT_EQ(report["schema"], "zulm.extract");
    const Json& stream = report["files"][0]["streams"][0];
    EXPECT_EQ(stream["kind"], "cpuUsage");
    EXPECT_EQ(stream["bytes"], contentsOf(streamFile("cpuUsage")).size());
    EXPECT_EQ(stream["file"], folder / "out/cpuUsage.dat");
}

} // namespace
} // namespace ZULMetaData::Test
