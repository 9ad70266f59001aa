// The entries of many recordings as tables, as a process: what is in the files, and what a second run adds.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <chrono>
#include <fcntl.h>
#include <filesystem>
#include <sstream>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::ElementsAre;
using testing::HasSubstr;

/// Returns the text of a value. Numbers of 32 bits have more digits in one output than in the other.
std::string asText(const Json& value, const std::string& type) {
    if (!value.is_number())
        return value.dump();
    return type == "FLOAT" ? Json(value.get<float>()).dump() : Json(value.get<double>()).dump();
}

class ExportCommand : public RecordedSession {
protected:
    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    std::string positions(const std::string& name, int count) const {
        std::string bytes = streamHeader("2b7b6af2", 1, 16);
        for (int i = 0; i < count; ++i)
            bytes += pointEntry(i, i, -i);
        return written(name, bytes);
    }

    ToolResult exported(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), {"export", "-o", out});
        return runTool(arguments);
    }

    /// The names of the files, from the folder on.
    std::vector<std::string> files() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::recursive_directory_iterator(out))
            if (!entry.is_directory())
                names.push_back(std::filesystem::relative(entry.path(), out));
        std::sort(names.begin(), names.end());
        return names;
    }

    /// The lines of all parts of a kind, but not the first one of each.
    std::vector<std::string> rows(const std::string& kind) const {
        std::vector<std::string> lines;
        for (const std::string& name : files())
            if (name.starts_with("kind=" + kind + "/")) {
                std::istringstream text(contentsOf(out + "/" + name));
                std::string line;
                for (bool isFirst = true; std::getline(text, line); isFirst = false)
                    if (!isFirst)
                        lines.push_back(line);
            }
        return lines;
    }

    const std::string out = folder / "Tables";
};

TEST_F(ExportCommand, WritesATableForEachKindAndAManifest) {
    const std::string file = written("a.dat", locations());
    const ToolResult result = exported({file});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.output, out + ": recordings exported: 1, already there: 0; new files: 1\n");
    EXPECT_THAT(files(), ElementsAre("kind=cursorLocation/part-00000.csv", "manifest.ndjson"));
    EXPECT_EQ(contentsOf(out + "/kind=cursorLocation/part-00000.csv"),
              "recording,x,y,timestamp\n" + file + ",10,-20,0.5\n" + file + ",0,7,0.1\n" + file + ",3,4,2.0\n");
}

TEST_F(ExportCommand, WritesTheEntriesThatDumpPrints) {
    EXPECT_EQ(exported({"--format", "ndjson", movie()}).exitCode, 0);
    std::size_t count = 0;
    std::istringstream dumped(runTool({"dump", "--format", "ndjson", movie()}).output);
    for (std::string line; std::getline(dumped, line);)
        ++count;
    std::size_t found = 0;
    for (const std::string& name : files())
        if (name.starts_with("kind=")) {
            std::istringstream text(contentsOf(out + "/" + name));
            for (std::string line; std::getline(text, line); ++found)
                EXPECT_EQ(Json::parse(line).at("recording"), movie());
        }
    EXPECT_GT(count, 0U);
    EXPECT_EQ(found, count);
}

TEST_F(ExportCommand, PassesOverWhatItHas) {
    const std::string first = positions("a.dat", 3);
    exported({first});
    const ToolResult again = exported({first, positions("b.dat", 2), first});
    EXPECT_EQ(again.exitCode, 0) << again.errors;
    EXPECT_EQ(again.output, out + ": recordings exported: 1, already there: 2; new files: 1\n");
    EXPECT_EQ(rows("cursorLocation").size(), 5U);
    EXPECT_THAT(files(), ElementsAre("kind=cursorLocation/part-00000.csv", "kind=cursorLocation/part-00001.csv",
                                     "manifest.ndjson"));
}

TEST_F(ExportCommand, TakesARecordingThatIsNamedTwiceOnce) {
    const std::string file = positions("a.dat", 3);
    EXPECT_EQ(exported({file, file, "--jobs", "2"}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 3U);
}

TEST_F(ExportCommand, KnowsATouchedRecordingByItsEntries) {
    const std::string file = positions("a.dat", 3);
    exported({file});
    std::filesystem::last_write_time(file, std::filesystem::last_write_time(file) + std::chrono::hours(1));
    EXPECT_EQ(exported({file}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 3U);
}

TEST_F(ExportCommand, RefusesARecordingThatHasChanged) {
    const std::string file = positions("a.dat", 3);
    exported({file});
    positions("a.dat", 4);
    const ToolResult result = exported({file});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("a.dat: has changed since it was exported to"));
    EXPECT_EQ(rows("cursorLocation").size(), 3U);
}

TEST_F(ExportCommand, BeginsANewFileWhenOneIsFull) {
    EXPECT_EQ(exported({"--part-size", "1", positions("a.dat", 60000), positions("b.dat", 10)}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 60010U);
    EXPECT_GT(files().size(), 2U);
}

TEST_F(ExportCommand, GoesOnAfterARecordingThatCannotBeRead) {
    const ToolResult result =
        exported({"--jobs", "2", folder / "missing.mp4", written("torn.dat", locations() + "1234"),
                  written("plain.mp4", tinyMovie()), positions("a.dat", 2)});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("missing.mp4: no such file"));
    EXPECT_THAT(result.errors, HasSubstr("torn.dat: cursorLocation cannot be exported from offset"));
    EXPECT_EQ(rows("cursorLocation").size(), 5U);
}

TEST_F(ExportCommand, RemovesWhatAnEarlierRunCouldNotEnd) {
    exported({positions("a.dat", 2)});
    writeFile(out + "/kind=cursorLocation/.part-00001.csv", "recording,x,y,timestamp\nhalf a li");
    EXPECT_EQ(exported({positions("b.dat", 2)}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 4U);
    EXPECT_EQ(files().size(), 3U);
}

TEST_F(ExportCommand, EndsACommitThatAnEarlierRunCouldNotEnd) {
    const std::string file = positions("a.dat", 2);
    exported({file});
    const std::string manifest = contentsOf(out + "/manifest.ndjson");
    const std::size_t begin = manifest.find('\n') + 1;
    const std::string part = out + "/kind=cursorLocation/part-00000.csv";
    std::filesystem::rename(part, out + "/kind=cursorLocation/.part-00000.csv");
    writeFile(out + "/manifest.ndjson", manifest.substr(0, begin + 7));
    writeFile(out + "/.commit.json", Json{{"manifest_bytes", begin},
                                          {"parts", {"kind=cursorLocation/part-00000.csv"}},
                                          {"recordings", {Json::parse(manifest.substr(begin))}}}
                                         .dump());
    EXPECT_EQ(exported({file}).output, out + ": recordings exported: 0, already there: 1; new files: 0\n");
    EXPECT_EQ(rows("cursorLocation").size(), 2U);
    EXPECT_THAT(files(), ElementsAre("kind=cursorLocation/part-00000.csv", "manifest.ndjson"));
}

TEST_F(ExportCommand, LeavesACommitThatFailedToTheNextRun) {
    ASSERT_EQ(exported({positions("first.dat", 1)}).exitCode, 0);
    const std::string manifest = contentsOf(out + "/manifest.ndjson");
    std::vector<std::string> arguments{"--part-size", "1"};
    for (int i = 0; i < 12; ++i)
        arguments.push_back(positions(std::to_string(i) + ".dat", 60000));
    const int file = open((out + "/manifest.ndjson").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(flock(file, LOCK_EX), 0); // keeps the tool from adding its lines
    std::vector<std::string> words{"export", "-o", out};
    words.insert(words.end(), arguments.begin(), arguments.end());
    const ToolResult result = runTool(words);
    close(file);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(std::count(result.errors.begin(), result.errors.end(), '\n'), 1) << result.errors;
    EXPECT_EQ(contentsOf(out + "/manifest.ndjson"), manifest);
    EXPECT_TRUE(std::filesystem::exists(out + "/.commit.json"));
    EXPECT_EQ(exported(arguments).exitCode, 0);
    std::vector<std::string> found = rows("cursorLocation");
    EXPECT_EQ(found.size(), 720001U);
    std::sort(found.begin(), found.end());
    EXPECT_EQ(std::adjacent_find(found.begin(), found.end()), found.end());
}

TEST_F(ExportCommand, MovesNothingForADamagedCommit) {
    const std::string file = positions("a.dat", 2);
    ASSERT_EQ(exported({file}).exitCode, 0);
    const auto manifest = contentsOf(out + "/manifest.ndjson");
    std::filesystem::create_directory(folder / "victim");
    writeFile(folder / "victim/.x", "mine");
    const Json parts = Json::array({"kind=cursorLocation/part-00000.csv"});
    const Json lines = Json::array({Json::parse(manifest.substr(manifest.find('\n')))});
    const auto commit = [](const Json& bytes, const Json& names, const Json& recordings) {
        return Json{{"manifest_bytes", bytes}, {"parts", names}, {"recordings", recordings}};
    };
    for (const Json& bad :
         {commit(9, {"../victim/x"}, Json::array()),
          commit(9, {"kind=cursorLocation/../../victim/part-0.csv"}, Json::array()),
          commit(9, {"kind=cursorLocation/part-00000.csv.csv"}, Json::array()),
          commit(9, {"kind=victim/part-00000.csv"}, Json::array()),
          commit(9, {"kind=cursorLocation/part-.csv"}, Json::array()), commit(9, {7}, Json::array()),
          commit(9, 7, Json::array()), commit(std::uint64_t{1} << 60, parts, lines), commit(-1, parts, lines),
          commit("9", parts, lines), commit(9, parts, {"text"}), commit(9, parts, {Json{{"recording", 7}}}),
          commit(9, parts, {Json::object()}), Json::array(), Json("text")}) {
        writeFile(out + "/.commit.json", bad.dump());
        const ToolResult result = exported({file});
        EXPECT_EQ(result.exitCode, 1) << bad;
        EXPECT_THAT(result.errors, HasSubstr(".commit.json: is damaged; export into a new folder")) << bad;
        EXPECT_EQ(contentsOf(folder / "victim/.x"), "mine") << bad;
        EXPECT_EQ(contentsOf(out + "/manifest.ndjson"), manifest) << bad;
        EXPECT_FALSE(std::filesystem::exists(out + "/.writing")) << bad;
    }
}

TEST_F(ExportCommand, RefusesAManifestWithALineThatIsTooLong) {
    const std::string file = positions("a.dat", 2);
    ASSERT_EQ(exported({file}).exitCode, 0);
    std::filesystem::resize_file(out + "/manifest.ndjson", std::uint64_t{1} << 36); // a hole
    const ToolResult result = exported({file});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("manifest.ndjson: line 3 is damaged; export into a new folder"));
    EXPECT_LT(result.peakMemoryKB, 100'000);
}

TEST_F(ExportCommand, WritesThroughNoLink) {
    const std::string file = positions("a.dat", 2);
    ASSERT_EQ(exported({written("text.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "a"))}).exitCode, 0);
    std::filesystem::create_directory(folder / "victim");
    writeFile(folder / "victim/.part-00000.csv", "mine");
    std::filesystem::create_symlink(folder / "victim", out + "/kind=cursorLocation");
    const ToolResult result = exported({file});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("kind=cursorLocation: is a symbolic link; export into a new folder"));
    EXPECT_EQ(contentsOf(folder / "victim/.part-00000.csv"), "mine");
}

TEST_F(ExportCommand, RefusesANameThatBelongsToAnotherRecording) {
    std::filesystem::create_directory(folder / "A");
    std::filesystem::create_directory(folder / "B");
    positions("A/a.dat", 2);
    positions("B/a.dat", 3);
    ToolOptions options;
    options.folder = folder / "A";
    ASSERT_EQ(runTool({"export", "-o", out, "a.dat"}, options).exitCode, 0);
    options.folder = folder / "B";
    const ToolResult result = runTool({"export", "-o", out, "a.dat"}, options);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("a.dat: is the name of " + (folder / "A/a.dat") + " in " + out +
                                         "; name the recording by its absolute path"));
    EXPECT_EQ(rows("cursorLocation").size(), 2U);
    EXPECT_EQ(exported({folder / "B/a.dat"}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 5U);
}

TEST_F(ExportCommand, TakesALinkForItsTarget) {
    const std::string file = positions("a.dat", 3);
    std::filesystem::create_symlink(file, folder / "link.dat");
    EXPECT_EQ(exported({file, folder / "link.dat"}).exitCode, 0);
    EXPECT_EQ(exported({folder / "link.dat"}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 3U);
}

TEST_F(ExportCommand, SaysEveryTimeThatARecordingIsThereInPart) {
    const std::string file = written("torn.dat", locations() + "1234");
    EXPECT_EQ(exported({file}).exitCode, 3);
    EXPECT_THAT(contentsOf(out + "/manifest.ndjson"), HasSubstr("\"is_whole\":false"));
    for (int run = 0; run < 2; ++run) {
        const ToolResult again = exported({file});
        EXPECT_EQ(again.exitCode, 3);
        EXPECT_THAT(again.errors, HasSubstr("torn.dat: is in the data set in part; repair the recording"));
        std::filesystem::last_write_time(file, std::filesystem::last_write_time(file) + std::chrono::hours(1));
    }
    EXPECT_EQ(rows("cursorLocation").size(), 3U);
}

TEST_F(ExportCommand, LeavesNothingUnfinishedWhenItIsInterrupted) {
    std::vector<std::string> arguments{"export", "-o", out};
    for (int i = 0; i < 40; ++i)
        arguments.push_back(positions(std::to_string(i) + ".dat", 20000));
    ToolOptions options;
    options.killAfterMilliseconds = 1;
    options.killWhen = [this] { return std::filesystem::exists(out + "/kind=cursorLocation/.part-00000.csv"); };
    const ToolResult result = runTool(arguments, options);
    EXPECT_EQ(result.exitCode, 128 + 15);
    EXPECT_THAT(result.errors, HasSubstr("Tables: interrupted; the same command goes on with what is not in it"));
    EXPECT_THAT(files(), ElementsAre("manifest.ndjson"));
}

TEST_F(ExportCommand, IsInterruptedWhileItWaitsForNames) {
    ToolOptions options;
    options.input = "\n"; // which is no name; without it the input ends at once
    options.keepsInputOpen = true;
    options.killAfterMilliseconds = 1;
    options.killWhen = [this] { return std::filesystem::exists(out + "/manifest.ndjson"); };
    const ToolResult result = runTool({"export", "-o", out, "--jobs", "2", "--files-from", "-"}, options);
    EXPECT_EQ(result.exitCode, 128 + 15);
    EXPECT_THAT(files(), ElementsAre("manifest.ndjson"));
}

TEST_F(ExportCommand, TakesAKindThatIsNamedTwiceOnce) {
    EXPECT_EQ(exported({"--stream", "cursorAction", movie()}).exitCode, 0);
    EXPECT_EQ(exported({"--stream", "cursorAction", "--stream", "cursorAction", movie()}).exitCode, 0);
}

TEST_F(ExportCommand, RefusesAFolderOfOtherFilesAndAnotherFormat) {
    const std::string file = positions("a.dat", 2);
    std::filesystem::create_directory(out);
    writeFile(out + "/letter.txt", "mine");
    EXPECT_THAT(exported({file}).errors, HasSubstr("is a folder with other files in it; name a new one"));
    EXPECT_THAT(files(), ElementsAre("letter.txt"));
    std::filesystem::remove(out + "/letter.txt");
    EXPECT_EQ(exported({file}).exitCode, 0);
    const ToolResult other = exported({"--format", "ndjson", file});
    EXPECT_EQ(other.exitCode, 1);
    EXPECT_THAT(other.errors, HasSubstr("has entries of another format or of other kinds; name a new folder"));
}

TEST_F(ExportCommand, PutsHostileNamesAndTextsIntoOneFieldOrLine) {
    const std::string text = std::string("a,\"b\"\r\nkind=x\0end", 17);
    const std::string file = written("kind=a,\"\n.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, text));
    EXPECT_EQ(exported({file}).exitCode, 0);
    EXPECT_THAT(files(), ElementsAre("kind=topmostAppName/part-00000.csv", "manifest.ndjson"));
    EXPECT_EQ(contentsOf(out + "/kind=topmostAppName/part-00000.csv"),
              "recording,name,timestamp\n\"" + (folder / "kind=a,\"\"\n.dat") +
                  "\",\"a,\"\"b\"\"\\x0d\nkind=x\\x00end\",1.0\n");
    const std::string lines = folder / "Lines";
    EXPECT_EQ(runTool({"export", "--format", "ndjson", "-o", lines, file}).exitCode, 0);
    const std::string written = contentsOf(lines + "/kind=topmostAppName/part-00000.ndjson");
    EXPECT_EQ(std::count(written.begin(), written.end(), '\n'), 1);
    EXPECT_EQ(Json::parse(written), (Json{{"recording", file}, {"name", text}, {"timestamp", 1.0}}));
}

TEST_F(ExportCommand, KeepsTheBytesOfANameThatIsNotUTF8) {
    const std::string file = positions("na\xff.dat", 1);
    EXPECT_EQ(exported({"--format", "ndjson", file}).exitCode, 0);
    const Json line = Json::parse(contentsOf(out + "/kind=cursorLocation/part-00000.ndjson"));
    EXPECT_EQ(line.at("recording"), folder / "na\xef\xbf\xbd.dat");
    EXPECT_TRUE(line.contains("recording_base64"));
    EXPECT_EQ(exported({"--format", "ndjson", file}).output,
              out + ": recordings exported: 0, already there: 1; new files: 0\n");
}

TEST_F(ExportCommand, TellsNamesApartThatAreNotUTF8) {
    const std::vector<std::string> names{positions("na\xff.dat", 1), positions("na\xfe.dat", 1),
                                         positions("na\\xff.dat", 1)};
    const ToolResult result = exported(names);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(rows("cursorLocation"), ElementsAre(folder / "na\\xff.dat,0,0,0.0", folder / "na\\xfe.dat,0,0,0.0",
                                                    folder / "na\\\\xff.dat,0,0,0.0"));
}

TEST_F(ExportCommand, RefusesANameThatLooksLikeAnother) {
    const std::string first = positions("na\xff.dat", 1);
    const std::string second = positions("na\xfe.dat", 2);
    for (int run = 0; run < 2; ++run) {
        const ToolResult result = exported({"--format", "ndjson", first, second});
        EXPECT_EQ(result.exitCode, 1);
        EXPECT_THAT(result.errors, HasSubstr("na\\xfe.dat: looks like " + (folder / "na\\xff.dat") +
                                             " in the tables, because a name is not UTF-8; rename one of them"));
        const std::string lines = contentsOf(out + "/kind=cursorLocation/part-00000.ndjson");
        EXPECT_EQ(std::count(lines.begin(), lines.end(), '\n'), 1);
    }
}

TEST_F(ExportCommand, LetsNobodyReadAPartWhoMayNotReadItsRecordings) {
    using std::filesystem::perms;
    const std::string open = positions("open.dat", 1);
    const std::string closed = positions("closed.dat", 1);
    std::filesystem::permissions(open, perms(0644));
    std::filesystem::permissions(closed, perms(0640));
    const auto permissionsOf = [&](const char* name) {
        return std::filesystem::status(out + "/" + name).permissions();
    };
    const mode_t mask = umask(0022);
    EXPECT_EQ(exported({open}).exitCode, 0);
    EXPECT_EQ(exported({closed, positions("another.dat", 1)}).exitCode, 0);
    umask(mask);
    EXPECT_EQ(permissionsOf("kind=cursorLocation/part-00000.csv"), perms(0644));
    EXPECT_EQ(permissionsOf("kind=cursorLocation/part-00001.csv"), perms(0640));
    EXPECT_EQ(permissionsOf("manifest.ndjson"), perms(0600));
}

TEST_F(ExportCommand, MakesTheSameDataSetAfterARunThatWasKilled) {
    std::vector<std::string> arguments{"--part-size", "1"};
    for (int i = 0; i < 40; ++i)
        arguments.push_back(positions("recording-" + std::to_string(i) + ".dat", 20000));
    std::vector<std::string> whole{"export", "-o", folder / "Whole"};
    whole.insert(whole.end(), arguments.begin(), arguments.end());
    ASSERT_EQ(runTool(whole).exitCode, 0);
    std::vector<std::string> killed{"export", "-o", out};
    killed.insert(killed.end(), arguments.begin(), arguments.end());
    const auto hasCommitted = [this] {
        std::error_code error;
        return std::filesystem::exists(out + "/kind=cursorLocation/part-00000.csv", error);
    };
    ToolOptions options;
    options.killAfterMilliseconds = 1;
    options.killWhen = hasCommitted;
    options.killSignal = 9;
    EXPECT_EQ(runTool(killed, options).exitCode, 128 + 9);
    EXPECT_LT(rows("cursorLocation").size(), 800000U);
    EXPECT_EQ(exported(arguments).exitCode, 0);
    std::vector<std::string> found = rows("cursorLocation");
    EXPECT_EQ(found.size(), 800000U);
    std::sort(found.begin(), found.end());
    EXPECT_EQ(std::adjacent_find(found.begin(), found.end()), found.end());
    for (const std::string& name : files())
        EXPECT_FALSE(name.starts_with('.') || name.find("/.") != std::string::npos) << name;
}

TEST_F(ExportCommand, AddsNothingIfTheDiskIsFull) {
    const std::string file = positions("a.dat", 100000);
    const ToolResult result = runProgram(
        "/bin/sh", {"-c", "ulimit -f 1024; trap '' XFSZ; exec \"$@\"", "sh", ZULM_PATH, "export", "-o", out, file});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("cannot be written at offset"));
    EXPECT_THAT(files(), ElementsAre("manifest.ndjson"));
    EXPECT_EQ(exported({file}).exitCode, 0);
    EXPECT_EQ(rows("cursorLocation").size(), 100000U);
}

TEST_F(ExportCommand, ReportsEachRecordingAsJSON) {
    const std::string file = positions("a.dat", 3);
    exported({file});
    const Json report = Json::parse(exported({"--json", file, positions("b.dat", 2), folder / "missing"}).output);
    EXPECT_EQ(report.at("files"),
              (Json{{{"path", file}, {"output", out}, {"state", "present"}, {"entries", 0}},
                    {{"path", folder / "b.dat"}, {"output", out}, {"state", "exported"}, {"entries", 2}}}));
    EXPECT_EQ(report.at("errors").size(), 1U);
}

TEST_F(ExportCommand, WritesOnlyTheKindsThatAreNamed) {
    EXPECT_EQ(exported({"--stream", "cursorAction", movie()}).exitCode, 0);
    EXPECT_THAT(files(), ElementsAre("kind=cursorAction/part-00000.csv", "manifest.ndjson"));
}

TEST_F(ExportCommand, RefusesWhatItCannotKnowAgain) {
    EXPECT_EQ(exported({"-"}).exitCode, 2);
    EXPECT_EQ(exported({"--part-size", "0", movie()}).exitCode, 2);
    EXPECT_EQ(exported({}).exitCode, 2);
}

/// Tables in Parquet, read by DuckDB itself. Skipped where a build has no DuckDB.
class ExportParquet : public ExportCommand {
protected:
    void SetUp() override {
        ExportCommand::SetUp();
        if (!*ZULM_DUCKDB)
            GTEST_SKIP() << "this build has no DuckDB";
    }

    /// Returns the rows of a query as lines of JSON. It is run in the folder of the tables.
    std::vector<std::string> answers(const std::string& query) const {
        constexpr auto program = R"(
            const { DuckDBInstance } = require('@duckdb/node-api');
            (async () => {
                const connection = await (await DuckDBInstance.create()).connect();
                const reader = await connection.runAndReadAll(process.argv[1]);
                for (const row of reader.getRowsJson())
                    console.log(JSON.stringify(row));
            })())";
        ToolOptions options;
        options.environment = {{"NODE_PATH", ZULM_DUCKDB}};
        options.folder = out;
        const ToolResult result = runProgram("node", {"-e", program, query}, options);
        EXPECT_EQ(result.exitCode, 0) << result.errors;
        std::vector<std::string> lines;
        std::istringstream text(result.output);
        for (std::string line; std::getline(text, line);)
            lines.push_back(line);
        return lines;
    }
};

TEST_F(ExportParquet, HasTheRowsThatDumpPrints) {
    ASSERT_EQ(exported({"--format", "parquet", movie()}).exitCode, 0);
    std::size_t tables = 0;
    for (const std::string& name : files()) {
        if (!name.starts_with("kind="))
            continue;
        const std::string kind = name.substr(5, name.find('/') - 5);
        std::vector<Json> expected;
        std::istringstream dumped(runTool({"dump", "--format", "ndjson", "--stream", kind, movie()}).output);
        for (std::string line; std::getline(dumped, line);)
            expected.push_back(Json::parse(line));
        const std::string table = "read_parquet('" + name + "', hive_partitioning = false)";
        std::vector<Json> columns;
        for (const std::string& column : answers("SELECT column_name, column_type FROM (DESCRIBE FROM " + table + ")"))
            columns.push_back(Json::parse(column));
        ASSERT_EQ(columns.front().at(0), "recording");
        const std::vector<std::string> found = answers("FROM " + table);
        ASSERT_EQ(found.size(), expected.size()) << kind;
        for (std::size_t row = 0; row < found.size(); ++row) {
            const Json values = Json::parse(found[row]);
            for (std::size_t i = 1; i < columns.size(); ++i) {
                const std::string column = columns[i].at(0);
                if (column == "image") // bytes here, and its size there
                    EXPECT_EQ(values[i].is_null(), expected[row]["image"].is_null());
                else
                    EXPECT_EQ(asText(values[i], columns[i].at(1)),
                              asText(expected[row].value(column, Json()), columns[i].at(1)))
                        << kind << ' ' << row << ' ' << column;
            }
        }
        ++tables;
    }
    EXPECT_GT(tables, 5U);
}

TEST_F(ExportParquet, HasTheTypesThatAreStored) {
    ASSERT_EQ(exported({"--format", "parquet", movie()}).exitCode, 0);
    const auto typesOf = [this](const std::string& kind) {
        return answers("SELECT column_name, column_type FROM (DESCRIBE FROM 'kind=" + kind + "/*.parquet')");
    };
    EXPECT_THAT(typesOf("cursorLocation"),
                ElementsAre(R"(["recording","VARCHAR"])", R"(["x","INTEGER"])", R"(["y","INTEGER"])",
                            R"(["timestamp","DOUBLE"])", R"(["kind","VARCHAR"])"));
    EXPECT_THAT(typesOf("cpuUsage"), testing::Contains(HasSubstr("\"FLOAT\"")));
    EXPECT_THAT(typesOf("cursorImage"), testing::Contains(R"(["image","BLOB"])"));
}

TEST_F(ExportParquet, HasTheBytesOfImages) {
    ASSERT_EQ(exported({"--format", "parquet", "--stream", "cursorImage", movie()}).exitCode, 0);
    const std::vector<std::string> found = answers(
        "SELECT hex(image) FROM 'kind=cursorImage/*.parquet' WHERE image IS NOT NULL ORDER BY timestamp LIMIT 1");
    ASSERT_EQ(found.size(), 1U);
    runTool({"dump", "--stream", "cursorImage", "--images", folder / "images", movie()});
    std::vector<std::string> images;
    for (const auto& image : std::filesystem::directory_iterator(folder / "images")) {
        std::string digits;
        for (const char c : contentsOf(image.path())) {
            const auto byte = static_cast<unsigned char>(c);
            digits += {"0123456789ABCDEF"[byte / 16], "0123456789ABCDEF"[byte % 16]};
        }
        images.push_back(Json::array({digits}).dump());
    }
    EXPECT_THAT(images, testing::Contains(found.front()));
}

TEST_F(ExportParquet, KeepsEveryCharacterAndNumber) {
    const std::string text = std::string("a,\"b\"\r\n\0'\xf0\x9f\x98\x80", 13);
    const std::string file = written("kind=a'[*]\n.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(5e-324, text));
    ASSERT_EQ(exported({"--format", "parquet", file}).exitCode, 0);
    const std::vector<std::string> found = answers("FROM 'kind=topmostAppName/part-00000.parquet'");
    ASSERT_EQ(found.size(), 1U);
    EXPECT_EQ(Json::parse(found.front()), (Json{file, text, 5e-324, "topmostAppName"}));
}

TEST_F(ExportParquet, TellsNamesApartThatAreNotUTF8) {
    const std::vector<std::string> names{positions("na\xff.dat", 1), positions("na\xfe.dat", 1),
                                         positions("na\\xff.dat", 1)};
    const ToolResult result = exported({"--format", "parquet", names[0], names[1], names[2]});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("looks like"));
    EXPECT_THAT(
        answers("SELECT recording FROM 'kind=cursorLocation/*.parquet' ORDER BY recording"),
        ElementsAre(Json::array({folder / "na\\xfe.dat"}).dump(), Json::array({folder / "na\\xff.dat"}).dump()));
}

TEST_F(ExportParquet, JoinsPiecesToOneFile) {
    const std::string longName(230, 'a'); // a piece ends with 64 MiB of lines, each of which has the name
    std::vector<std::string> arguments{"--format", "parquet"};
    for (int i = 0; i < 2; ++i)
        arguments.push_back(positions(longName + std::to_string(i) + ".dat", 120000));
    const ToolResult result = exported(arguments);
    ASSERT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(files(), ElementsAre("kind=cursorLocation/part-00000.parquet", "manifest.ndjson"));
    EXPECT_THAT(answers("SELECT count(*)::INTEGER, sum(x)::DOUBLE, sum(y)::DOUBLE, count(DISTINCT recording)::INTEGER "
                        "FROM 'kind=cursorLocation/part-00000.parquet'"),
                ElementsAre("[240000,14399880000,-14399880000,2]"));
    EXPECT_LT(result.peakMemoryKB, 400'000);
}

TEST_F(ExportParquet, SaysThatNodeIsMissing) {
    const std::string file = positions("a.dat", 1);
    ToolOptions options;
    options.environment = {{"PATH", folder / "nothing"}};
    const ToolResult result = runTool({"export", "--format", "parquet", "-o", out, file}, options);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("node: no such program in PATH; install node"));
    EXPECT_FALSE(std::filesystem::exists(out));
}

} // namespace
} // namespace ZULMetaData::Test
