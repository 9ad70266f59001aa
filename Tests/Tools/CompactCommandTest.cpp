// Writing a recording anew with less metadata: zulm compact and zulm detach.

#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <filesystem>

namespace ZULMetaData::Test {

namespace {

using testing::HasSubstr;

/// A movie whose media is not the last of its atoms before the metadata.
std::string plainMovie() {
    return tinyMovie() + atom("free", "from another program");
}

const std::string s_newer = streamHeader(s_appNames, 1, 0) + textEntry(1, "Newer");

class CompactCommand : public RecordedSession {
protected:
    std::string file(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    const std::string out = folder / "Out.mp4";
};

TEST_F(CompactCommand, LeavesOutWhatIsSuperseded) {
    const std::string stamp = recordingInfo("Mac", "1", "12");
    const std::string movie =
        file("Recording.mp4", plainMovie() + zulmAtom({locationStream(), appNameStream()}) + stamp +
                                  zulmAtom({s_newer}) + atom("free", "an entry that was cut short") + stamp);
    const ToolResult result = runTool({"compact", movie, "-o", out});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(contentsOf(out), plainMovie() + zulmAtom({s_newer, locationStream()}) + stamp);
    EXPECT_EQ(result.output, out + ": 1 stream left out, 2 kept; " + std::to_string(contentsOf(movie).size()) +
                                 " bytes became " + std::to_string(contentsOf(out).size()) + "\n");
    EXPECT_EQ(runTool({"verify", "--strict", "--ignore", "beyond-duration", out}).exitCode, 0);
}

TEST_F(CompactCommand, KeepsEveryStreamOfARecording) {
    ASSERT_EQ(runTool({"compact", movie(), "-o", out}).exitCode, 0);
    EXPECT_EQ(runTool({"diff", movie(), out}).exitCode, 0);
    EXPECT_EQ(contentsOf(out).size(), contentsOf(movie()).size());
}

TEST_F(CompactCommand, ChangesAFileInPlace) {
    const std::string movie = file("Recording.mp4", plainMovie() + zulmAtom({appNameStream()}) + zulmAtom({s_newer}));
    std::filesystem::permissions(movie, std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
    std::filesystem::create_symlink("Recording.mp4", folder / "Link.mp4");
    EXPECT_EQ(runTool({"compact", folder / "Link.mp4", "--in-place"}).exitCode, 0);
    EXPECT_EQ(contentsOf(movie), plainMovie() + zulmAtom({s_newer}));
    EXPECT_TRUE(std::filesystem::is_symlink(folder / "Link.mp4"));
    EXPECT_EQ(std::filesystem::status(movie).permissions(),
              std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
    EXPECT_EQ(runTool({"compact", "-", "--in-place"}).exitCode, 2);
    EXPECT_EQ(runTool({"compact", movie}).exitCode, 2);
}

TEST_F(CompactCommand, WorksOnRIFF) {
    const std::string movie =
        file("Recording.avi", riffMedia() + zulmChunk({appNameStream(), locationStream()}) + zulmChunk({s_newer}));
    const std::string avi = folder / "Out.avi";
    ASSERT_EQ(runTool({"compact", movie, "-o", avi}).exitCode, 0);
    EXPECT_EQ(contentsOf(avi), riffMedia() + zulmChunk({s_newer, locationStream()}));
    ASSERT_EQ(runTool({"detach", movie, "-o", avi, "--force"}).exitCode, 0);
    EXPECT_EQ(contentsOf(avi), riffMedia());
}

TEST_F(CompactCommand, DoesNotMoveMediaBehindTheMetadata) {
    const std::string metadata = zulmAtom({appNameStream()});
    const std::string movie = file("Recording.mp4", metadata + plainMovie() + zulmAtom({s_newer}));
    ASSERT_EQ(runTool({"compact", movie, "-o", out}).exitCode, 0);
    const std::string blank = be32(1) + "free" + be64(metadata.size()) + std::string(metadata.size() - 16, '\0');
    EXPECT_EQ(contentsOf(out), blank + plainMovie() + zulmAtom({s_newer}));
}

TEST_F(CompactCommand, RefusesToLoseStreamsThatNoReaderFinds) {
    const std::string torn = be32(1) + "DATA" + be64(72 + 5) + locationStream() + extendedAtom("DATA", appNameStream());
    const std::string movie = file("Recording.mp4", plainMovie() + extendedAtom("ZULM", torn));
    const ToolResult result = runTool({"compact", movie, "-o", out});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("'zulm salvage " + movie + " -o DIR' writes them out"));
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(CompactCommand, RefusesWhatIsNoContainerOrDamaged) {
    EXPECT_EQ(runTool({"compact", streamFile("cpuUsage"), "-o", folder / "a.dat"}).exitCode, 1);
    const ToolResult open = runTool({"detach", file("Open.mp4", be32(0) + "mdat0123"), "-o", out});
    EXPECT_EQ(open.exitCode, 1);
    EXPECT_THAT(open.errors, HasSubstr("'zulm repair "));
    EXPECT_EQ(runTool({"detach", file("Plain.mp4", plainMovie()), "-o", out}).exitCode, 4);
    EXPECT_EQ(runTool({"detach", movie(), "-o", folder / "Out.wav"}).exitCode, 1);
}

TEST_F(CompactCommand, DetachMakesTheMovieWhatItWas) {
    for (const std::string& plain : {tinyMovie(), plainMovie(), tinyMovie() + atom("mfra", "index")}) {
        const std::string movie = file("Recording.mp4", plain);
        ASSERT_EQ(runTool({"attach", movie, streamFile("cpuUsage"), "--move-mfra", "--in-place"}).exitCode, 0);
        ASSERT_EQ(runTool({"stamp", movie, "--creator", "a", "--creator-version", "1", "--in-place"}).exitCode, 0);
        ASSERT_EQ(runTool({"attach", movie, streamFile("slideTitles"), "--move-mfra", "--in-place"}).exitCode, 0);
        ASSERT_EQ(runTool({"detach", movie, "--in-place"}).exitCode, 0);
        EXPECT_EQ(contentsOf(movie), plain);
    }
}

TEST_F(CompactCommand, ReportsAsJSON) {
    const auto report = nlohmann::json::parse(runTool({"detach", movie(), "-o", out, "--json"}).output);
    EXPECT_EQ(report.at("schema"), "zulm.detach");
    const auto file = report.at("files").at(0);
    EXPECT_EQ(file.at("streams_left_out"), 17);
    EXPECT_EQ(file.at("creators_left_out"), 1);
    EXPECT_EQ(file.at("bytes_after"), tinyMovie().size());
    EXPECT_TRUE(file.at("streams").empty());
    EXPECT_EQ(contentsOf(out), tinyMovie());
}

} // namespace

} // namespace ZULMetaData::Test
