// Metadata for movies that were cut, from the command line.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <filesystem>
#include <limits>
#include <map>
#include <sys/stat.h>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::string points(const std::vector<std::pair<double, std::int32_t>>& entries) {
    std::string stream = streamHeader(s_cursorLocations, 1, 16);
    for (const auto& [time, x] : entries)
        stream += pointEntry(time, x, 7);
    return stream;
}

std::string actions(const std::vector<std::pair<double, std::int32_t>>& entries) {
    std::string stream = streamHeader("2b7b6af0", 1, 12);
    for (const auto& [time, action] : entries)
        stream += f64(time) + raw(action);
    return stream;
}

class RetimeCommand : public testing::Test {
protected:
    void SetUp() override {
        writeFile(recording, tinyMovie() + recordingInfo("Mac", "1.0", "14.2") +
                                 zulmAtom({points({{1, 1}, {5, 5}, {12, 12}}), actions({{1, 1}, {5, 2}}), region}));
        writeFile(edited, tinyMovie(6000));
    }

    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    /// Runs the command with a recording, the edited movie and the output added.
    ToolResult retime(std::vector<std::string> arguments, const std::string& from = {}) const {
        arguments.insert(arguments.begin(), {"retime", from.empty() ? recording : from, "--movie", edited, "-o", out});
        return runTool(arguments);
    }

    TemporaryFolder folder;
    const std::string recording = folder / "Recording.mp4";
    const std::string edited = folder / "Edited.mp4";
    const std::string out = folder / "Out.mp4";
    const std::string region = streamHeader("2b7b6af6", 1, 24) + f64(0) + std::string(16, 'r');
};

TEST_F(RetimeCommand, WritesACopyWithTheMetaDataAtItsNewTimes) {
    const ToolResult result = retime({"--keep", "0-2", "--keep", "4-20@2"});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.errors, "");
    EXPECT_THAT(result.output, HasSubstr(out + ": a copy of " + edited + " with 3 streams of " + recording + "\n"));
    EXPECT_THAT(result.output, HasSubstr("cursorLocation                   3          0          0          0"));
    EXPECT_THAT(result.output, HasSubstr("cursorAction                     2          0          2          0"));
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({actions({{1, 1}, {2, 2}, {2, 1}, {2.5, 2}}),
                                                           points({{1, 1}, {2.5, 5}, {6, 12}}), region}));
    EXPECT_EQ(contentsOf(edited), tinyMovie(6000));
    EXPECT_THAT(namesIn(folder.path()), ElementsAre("Edited.mp4", "Out.mp4", "Recording.mp4"));
}

TEST_F(RetimeCommand, KeepsThePiecesInTheOrderGiven) {
    ASSERT_EQ(retime({"--keep", "4-6", "--keep", "0:00-0:02.5", "-q"}).exitCode, 0);
    EXPECT_THAT(contentsOf(out), HasSubstr(points({{0, 1}, {1, 5}, {3, 1}})));
}

TEST_F(RetimeCommand, ReadsAnEditList) {
    const std::string list = written("edits.json", R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [
        {"start": "4", "end": 6}, {"at": 12.5, "duration": "8"}]})");
    EXPECT_EQ(retime({"--edits", list}).exitCode, 0);
    EXPECT_THAT(contentsOf(out), HasSubstr(points({{0, 1}, {1, 5}, {2, 12}})));
    ToolOptions options;
    options.input = contentsOf(list);
    EXPECT_EQ(
        runTool({"retime", recording, "--movie", edited, "--edits", "-", "-o", folder / "2.mp4"}, options).exitCode, 0);
    EXPECT_EQ(contentsOf(folder / "2.mp4"), contentsOf(out));
}

TEST_F(RetimeCommand, RemovesRangesFromTheWholeLength) {
    const ToolResult result = retime({"--remove", "2-4", "--remove", "3-11", "--remove", "19-25"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
    EXPECT_THAT(contentsOf(out), HasSubstr(points({{1, 1}, {2, 5}, {3, 12}})));
    const std::string endless = written("endless.mp4", media() + zulmAtom({points({{1, 1}})}));
    const ToolResult unknown = retime({"--remove", "2-4", "--force"}, endless);
    EXPECT_EQ(unknown.exitCode, 1);
    EXPECT_THAT(unknown.errors, HasSubstr(endless + ": does not tell how long it is"));
}

TEST_F(RetimeCommand, LeavesHeadersIfNothingIsKept) {
    EXPECT_EQ(retime({"--remove", "0-20"}).exitCode, 0);
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({actions({}), points({}), region}));
}

TEST_F(RetimeCommand, WantsToKnowWhatIsKept) {
    EXPECT_EQ(retime({}).exitCode, 2);
    EXPECT_EQ(retime({"--keep", "1-2", "--remove", "1-2"}).exitCode, 2);
    for (const std::string wrong : {"1", "1:2", "a-b", "1-2@", "1-2@fast", "1-2-3", "1e1-20", ""})
        EXPECT_EQ(retime({"--keep=" + wrong}).exitCode, 2) << wrong;
    EXPECT_EQ(retime({"--remove", "1-2@2"}).exitCode, 2);
    EXPECT_EQ(retime({"--edits", "-"}, "-").exitCode, 2);
    EXPECT_EQ(runTool({"retime", recording, "--keep", "1-2", "-o", out}).exitCode, 2);
    EXPECT_EQ(runTool({"retime", recording, "--movie", edited, "--keep", "1-2"}).exitCode, 2);
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(RetimeCommand, RefusesEditListsThatAreImpossible) {
    EXPECT_EQ(retime({"--keep", "2-1"}).exitCode, 1);
    EXPECT_EQ(retime({"--keep", "1-1"}).exitCode, 1);
    EXPECT_EQ(retime({"--keep", "0-1", "--keep", "1-2@0"}).errors,
              "zulm: --keep 1-2@0: speed is 0; it must be above 0\n");
    EXPECT_EQ(retime({"--keep", "1-2@0"}).exitCode, 1);
    EXPECT_EQ(retime({"--remove", "2-1"}).errors, "zulm: --remove 2-1: end is 1, which is not after start, 2\n");
    EXPECT_EQ(retime({"--remove", "2-1"}).exitCode, 1);
    const std::string list =
        written("edits.json", R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [{"at": 1}]})");
    const ToolResult result = retime({"--edits", list});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr(list + ": "));
    EXPECT_EQ(retime({"--edits", folder / "none.json"}).exitCode, 1);
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(RetimeCommand, RefusesAnEditedMovieWithMetaDataUnlessItReplacesThat) {
    const std::string creator = recordingInfo("Mac", "9.9", "13");
    writeFile(edited, tinyMovie(6000) + zulmAtom({points({{7, 7}}), appNameStream()}) + creator);
    const ToolResult refused = retime({"--keep", "0-10"});
    EXPECT_EQ(refused.exitCode, 1);
    EXPECT_THAT(refused.errors,
                HasSubstr(edited + ": has metadata already: topmostAppName, cursorLocation; --replace"));
    EXPECT_THAT(namesIn(folder.path()), ElementsAre("Edited.mp4", "Recording.mp4"));
    EXPECT_EQ(retime({"--keep", "0-10", "--replace"}).exitCode, 0);
    EXPECT_EQ(contentsOf(out),
              tinyMovie(6000) + creator + zulmAtom({actions({{1, 1}, {5, 2}}), points({{1, 1}, {5, 5}}), region}));
}

TEST_F(RetimeCommand, EndsWith4WithoutMetaData) {
    const ToolResult result = retime({"--keep", "0-10"}, written("Plain.mp4", tinyMovie()));
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_THAT(result.errors, HasSubstr("has no recording metadata; nothing was written"));
    EXPECT_FALSE(std::filesystem::exists(out));
}

TEST_F(RetimeCommand, EndsWith3IfSomethingIsLost) {
    const std::string torn = written("Torn.mp4", tinyMovie() + zulmAtom({points({{1, 1}}) + "torn"}));
    const ToolResult result = retime({"--keep", "0-10"}, torn);
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr(torn + ": cursorLocation is damaged at offset 40 of the stream; the 4 bytes "
                                                "from there on were left out"));
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({points({{1, 1}})}));
    const std::string timeless =
        written("Timeless.mp4", tinyMovie() + zulmAtom({points({{std::numeric_limits<double>::quiet_NaN(), 1}})}));
    EXPECT_EQ(retime({"--keep", "0-10", "--force"}, timeless).exitCode, 3);
}

TEST_F(RetimeCommand, CopiesUnknownStreamsByteForByte) {
    const std::string unknown = streamHeader("2b7b6a00", 1, 12) + "odd bytes";
    const ToolResult result = retime({"--keep", "0-10"}, written("Unknown.mp4", tinyMovie() + zulmAtom({unknown})));
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.errors, HasSubstr("warning: "));
    EXPECT_THAT(result.errors, HasSubstr("miscellany was copied with its old times"));
    EXPECT_THAT(result.output, HasSubstr("copied"));
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({unknown}));
}

TEST_F(RetimeCommand, WarnsIfTheEditedMovieHasAnotherLength) {
    EXPECT_THAT(retime({"--keep", "0-9.8"}).errors,
                HasSubstr(edited + ": is 10.000 s long, but the pieces are 9.800 s long together"));
    EXPECT_THAT(retime({"--keep", "0-9.95", "--force"}).errors, IsEmpty());
}

TEST_F(RetimeCommand, ReportsAsJSON) {
    const ToolResult result = retime({"--keep", "0-2", "--keep", "4-12", "--json"});
    EXPECT_EQ(result.exitCode, 0);
    const auto document = nlohmann::json::parse(result.output);
    EXPECT_EQ(document.at("schema"), "zulm.retime");
    const auto file = document.at("files").at(0);
    EXPECT_EQ(file.at("path"), recording);
    EXPECT_EQ(file.at("movie"), edited);
    EXPECT_EQ(file.at("output"), out);
    EXPECT_EQ(file.at("pieces"), 2);
    EXPECT_EQ(file.at("duration"), 10);
    const auto action = file.at("streams").at(0);
    EXPECT_EQ(action.at("kind"), "cursorAction");
    EXPECT_EQ(action.at("copied"), false);
    EXPECT_EQ(action.at("entries"), 4);
    EXPECT_EQ(action.at("moved"), 2);
    EXPECT_EQ(action.at("carried"), 0);
    EXPECT_EQ(action.at("added"), 2);
    EXPECT_EQ(action.at("left_out"), 0);
    EXPECT_EQ(file.at("streams").at(2).at("copied"), true);
    EXPECT_EQ(file.at("streams").at(2).at("entries"), 1);
}

TEST_F(RetimeCommand, TakesRecordingsOfAnyContainer) {
    const std::string wave =
        written("a.wav", chunk("RIFF", "WAVE" + chunk("data", "odd")) + zulmChunk({points({{1, 1}})}));
    EXPECT_EQ(retime({"--keep", "0-10", "-q"}, wave).exitCode, 0);
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({points({{1, 1}})}));
    EXPECT_EQ(retime({"--keep", "0-10", "-q", "--force"}, written("a.dat", points({{2, 1}}))).exitCode, 0);
    EXPECT_EQ(contentsOf(out), tinyMovie(6000) + zulmAtom({points({{2, 1}})}));
    ToolOptions options;
    options.input = contentsOf(recording);
    EXPECT_EQ(
        runTool({"retime", "-", "--movie", edited, "--keep", "0-10", "-q", "--force", "-o", out}, options).exitCode, 0);
    EXPECT_THAT(contentsOf(out), HasSubstr(points({{1, 1}, {5, 5}})));
}

TEST_F(RetimeCommand, RefusesWhatIsNoMovie) {
    writeFile(edited, chunk("RIFF", "WAVE" + chunk("data", "odd")));
    EXPECT_EQ(retime({"--keep", "0-10"}).exitCode, 1);
    writeFile(edited, "no movie at all");
    EXPECT_EQ(retime({"--keep", "0-10"}).exitCode, 1);
    EXPECT_THAT(namesIn(folder.path()), ElementsAre("Edited.mp4", "Recording.mp4"));
}

TEST_F(RetimeCommand, ReplacesNoFileUnlessItIsForced) {
    writeFile(out, "precious");
    EXPECT_EQ(retime({"--keep", "0-10"}).exitCode, 1);
    EXPECT_EQ(contentsOf(out), "precious");
    EXPECT_EQ(runTool({"retime", recording, "--movie", edited, "--keep", "0-10", "-o", recording, "--force"}).exitCode,
              1);
    EXPECT_EQ(runTool({"retime", recording, "--movie", edited, "--keep", "0-10", "-o", edited, "--force"}).exitCode, 1);
    EXPECT_EQ(contentsOf(edited), tinyMovie(6000));
}

TEST_F(RetimeCommand, LetsNobodyReadWhoMayNotReadTheRecording) {
    chmod(recording.c_str(), 0600);
    EXPECT_EQ(retime({"--keep", "0-10"}).exitCode, 0);
    struct stat status {};
    ASSERT_EQ(stat(out.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
}

} // namespace
} // namespace ZULMetaData::Test
