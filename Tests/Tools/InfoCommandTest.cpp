// `zulm info`: what a file holds.

#include "Tests/Tools/Golden.h"
#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <csignal>
#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::Not;

class InfoCommand : public RecordedSession {
protected:
    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return name;
    }

    /// In this test's folder, so that names are as they are given.
    ToolResult run(const std::vector<std::string>& arguments, ToolOptions options = {}) const {
        options.folder = folder.path().string();
        return runTool(arguments, options);
    }

    json reportOn(const std::string& file, int expectedCode = 0) const {
        const ToolResult result = run({"info", "--json", file});
        EXPECT_EQ(result.exitCode, expectedCode) << result.errors;
        return json::parse(result.output).at("files").at(0);
    }
};

TEST_F(InfoCommand, ShowsEveryStreamOfARecording) {
    copyOf(movie());
    const ToolResult text = run({"info", "Recording.mp4"});
    EXPECT_EQ(text.exitCode, 0);
    EXPECT_EQ(text.errors, "");
    expectGolden(text.output, "info.txt");
    expectGolden(run({"info", "--json", "Recording.mp4"}).output, "info.json");
}

TEST_F(InfoCommand, ListsUnknownStreamsAndForeignAtoms) {
    const ToolResult text = run({"info", written("Odd.mp4", oddMovie())});
    expectGolden(text.output, "info-odd.txt");
    const ToolResult report = run({"info", "--json", "Odd.mp4"});
    EXPECT_EQ(report.exitCode, 3); // readers stumble over the foreign atom
    expectGolden(report.output, "info-odd.json");
}

TEST_F(InfoCommand, TellsTheDurationWhereTheMovieDoes) {
    EXPECT_EQ(reportOn(written("a.mp4", movieWith(extendedAtom("DATA", locations())))).at("duration"), 20.0);
    EXPECT_EQ(reportOn(written("a.wav", waveWithLocations())).at("duration"), nullptr);
    EXPECT_EQ(reportOn(written("a.dat", locations())).at("duration"), nullptr);
    EXPECT_THAT(run({"info", "a.wav"}).output, HasSubstr("a.wav: RIFF, duration not told, 112 bytes, 1 stream\n"));
}

TEST_F(InfoCommand, TakesARecordingForWhatItsContentsSay) {
    const std::string movie = movieWith(extendedAtom("DATA", locations()));
    for (const char* name : {"a.m4v", "a.m4a", "a.3gp", "a.ismv", "a.qt", "movie", "a.dat", "a.wav"})
        EXPECT_EQ(reportOn(written(name, movie)).at("container"), "movie") << name;
    EXPECT_EQ(reportOn(written("a.wave", waveWithLocations())).at("container"), "RIFF");
    EXPECT_EQ(reportOn(written("locations", locations())).at("container"), "stream");
    EXPECT_THAT(run({"info", "a.dat"}).errors, HasSubstr("a.dat: is a movie by its contents, whatever its name says"));
    EXPECT_EQ(run({"info", "a.m4v"}).errors, "");
}

TEST_F(InfoCommand, NamesContainersThatHoldNoMetadata) {
    const ToolResult result = run({"info", written("a.mkv", hex("1a45dfa3 9f 4286 81 01") + "B\x82\x88matroska")});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("a.mkv: is a Matroska file; recording metadata is in movies"));
    EXPECT_EQ(run({"info", written("Zeros.mp4", std::string(5000, '\0'))}).exitCode, 1);
}

TEST_F(InfoCommand, ReadsStandardInputByItsOtherNames) {
    ToolOptions options;
    options.input = movieWith(extendedAtom("DATA", locations()));
    const ToolResult piped = run({"info", "/dev/stdin"}, options);
    EXPECT_EQ(piped.exitCode, 0) << piped.errors;
    EXPECT_THAT(piped.output, HasSubstr("/dev/stdin: movie"));
    written("a.mp4", options.input);
    options.folder = folder.path().string();
    EXPECT_EQ(runProgram("sh", {"-c", "exec \"$0\" info /dev/stdin < a.mp4", ZULM_PATH}, options).exitCode, 0);
}

TEST_F(InfoCommand, FindsMetadataBehindRIFFFilesOf64BitsAndFromPipes) {
    const std::string streams = chunk("ZULM", chunk("DATA", locations()));
    const std::string ds64 = chunk("ds64", raw(std::uint64_t{4 + 36}) + std::string(20, '\0'));
    for (const std::string& media :
         {"RF64" + le32(0xffffffff) + "WAVE" + ds64, "BW64" + le32(0xffffffff) + "WAVE" + ds64,
          "RIFF" + le32(0) + "WAVE", "RIFF" + le32(0xffffffff) + "WAVEdata" + le32(0xffffffff)}) {
        const json report = reportOn(written("a.wav", media + streams));
        EXPECT_EQ(report.at("streams").at(0).at("kind"), "cursorLocation");
        EXPECT_EQ(report.at("streams").at(0).at("entries"), 3);
    }
}

TEST_F(InfoCommand, CountsEntriesPerSecondBetweenTheFirstAndTheLast) {
    std::string stream = streamHeader("2b7b6af2", 1, 16);
    for (int i = 0; i <= 10; ++i)
        stream += pointEntry(2 + i * 0.25, i, i);
    const json info = reportOn(written("a.dat", stream)).at("streams").at(0);
    EXPECT_EQ(info.at("entries"), 11);
    EXPECT_EQ(info.at("first_time"), 2.0);
    EXPECT_EQ(info.at("last_time"), 4.5);
    EXPECT_EQ(info.at("entries_per_second"), 4.0);
    const json single = reportOn(written("b.dat", streamHeader("2b7b6af2", 1, 16) + pointEntry(1, 2, 3)));
    EXPECT_EQ(single.at("streams").at(0).at("entries_per_second"), nullptr);
}

TEST_F(InfoCommand, EndsWith4WhereThereIsNoMetaData) {
    const json info = reportOn(written("plain.mp4", tinyMovie()), 4);
    EXPECT_TRUE(info.at("streams").empty());
    EXPECT_TRUE(info.at("warnings").empty());
}

TEST_F(InfoCommand, EndsWith3AndTheOffsetWhereSomethingIsDamaged) {
    const ToolResult result = run({"info", written("torn.dat", locations() + "1234")});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.errors, HasSubstr("torn.dat: cursorLocation at offset 72: "));
    EXPECT_THAT(result.errors, HasSubstr("'zulm verify torn.dat'"));
    const json info = json::parse(run({"info", "--json", "torn.dat"}).output).at("files").at(0);
    EXPECT_EQ(info.at("streams").at(0).at("entries"), 3);
    EXPECT_THAT(info.at("streams").at(0).at("damage").get<std::string>(), HasSubstr("at offset 72"));
}

TEST_F(InfoCommand, IsQuietAboutDamageWhenAskedToBe) {
    const ToolResult result = run({"--quiet", "info", written("torn.dat", locations() + "1234")});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.errors, "");
}

TEST_F(InfoCommand, GoesOnBehindAFileThatCannotBeRead) {
    written("a.dat", locations());
    const ToolResult result = run({"info", "--json", "missing.mp4", "a.dat", "."});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(json::parse(result.output).at("files").size(), 1U);
    EXPECT_THAT(result.errors, HasSubstr("zulm: missing.mp4: no such file\n"));
    EXPECT_THAT(result.errors, HasSubstr("zulm: .: is a folder; name the files in it\n"));
}

TEST_F(InfoCommand, RefusesWhatIsNoRecordingByItsName) {
    const ToolResult result = run({"info", written("notes.txt", "text")});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("notes.txt: begins neither like a movie, nor a RIFF file, nor a stream"));
}

TEST_F(InfoCommand, DoesNotWaitForAPipe) {
    ASSERT_EQ(runProgram("mkfifo", {folder / "pipe.mp4"}).exitCode, 0);
    const ToolResult result = run({"info", "pipe.mp4"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("pipe.mp4: not a regular file; '-' reads a pipe that is standard input"));
}

TEST_F(InfoCommand, TakesNamesThatAreNotUTF8) {
    const std::string name = "na\xffme.dat";
    const json info = reportOn(written(name, locations()));
    EXPECT_EQ(info.at("path"), "na\xef\xbf\xbdme.dat");
    EXPECT_EQ(info.at("path_base64"), "bmH/bWUuZGF0");
    EXPECT_THAT(run({"info", name}).output, HasSubstr("na\\xffme.dat"));
}

TEST_F(InfoCommand, ReadsStandardInputByItsContents) {
    ToolOptions options;
    options.environment = {{"TMPDIR", folder.path().string()}};
    for (const auto& [bytes, container] :
         {std::pair(contentsOf(movie()), "movie"), {waveWithLocations(), "RIFF"}, {locations(), "stream"}}) {
        options.input = bytes;
        const ToolResult result = run({"info", "--json", "-"}, options);
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        const json info = json::parse(result.output).at("files").at(0);
        EXPECT_EQ(info.at("path"), "-");
        EXPECT_EQ(info.at("container"), container);
        EXPECT_TRUE(std::filesystem::is_empty(folder.path())); // nothing is left of it
    }
}

TEST_F(InfoCommand, RefusesStandardInputThatIsNothing) {
    ToolOptions options;
    options.input = "just words, no recording";
    options.input[4] = '\x01';
    EXPECT_EQ(run({"info", "-"}, options).exitCode, 1);
    const ToolResult result = run({"info", "-"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("neither like a movie, nor a RIFF file, nor a stream"));
}

TEST_F(InfoCommand, RemovesItsCopyOfStandardInputWhenASignalEndsIt) {
    ToolOptions options;
    options.environment = {{"TMPDIR", folder.path().string()}};
    options.input = contentsOf(movie()) + std::string(1 << 20, '\0');
    options.keepsInputOpen = true;
    options.killAfterMilliseconds = 1;
    options.killWhen = [this] {
        const std::filesystem::directory_iterator files(folder.path());
        return std::any_of(begin(files), end(files), [](const auto& entry) { return entry.file_size() > 0; });
    };
    EXPECT_EQ(runTool({"info", "-"}, options).exitCode, 128 + SIGTERM);
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(InfoCommand, KeepsControlCharactersFromTheTerminal) {
    const ToolResult result =
        run({"info", written("a.mp4", movieWith(atom("\x1b[2J", "x") + extendedAtom("DATA", locations())) +
                                          recordingInfo("\x1b]0;title\x07", "1", "2"))});
    EXPECT_THAT(result.output, Not(HasSubstr("\x1b")));
    EXPECT_THAT(result.output, HasSubstr("creator: \\x1b]0;title\\x07 1 on version 2"));
    EXPECT_THAT(result.output, HasSubstr("foreign atom: '\\x1b[2J'"));
    EXPECT_THAT(result.errors, Not(HasSubstr("\x1b")));
}

} // namespace
} // namespace ZULMetaData::Test
