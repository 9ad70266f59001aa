// zulm verify, as a process: on what the demo records, on every invalid recording, and on what is no recording.

#include "Tests/Support/Bytes.h"
#include "Tests/Support/InvalidCorpus.h"
#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tools/demo/Session.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <limits>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;

struct VerifyCommand : RecordedSession {
    /// What the session recorded, in entries of all kinds.
    std::size_t recordedEntries() const {
        TemporaryFolder again;
        std::size_t count = 0;
        for (const Demo::Track& track : Demo::recordSession(again.path()))
            count += track.expected.size();
        return count;
    }

    std::string newFile(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }
};

std::string invalidRecording(const std::string& name) {
    const auto files = invalidCorpus();
    return std::find_if(files.begin(), files.end(), [&](const InvalidFile& file) { return file.name == name; })->path;
}

std::string locations(const std::vector<double>& times) {
    std::string stream = streamHeader("2b7b6af2", 1, 16);
    for (const double time : times)
        stream += f64(time) + le32(0) + le32(0);
    return stream;
}

std::vector<ExpectedFinding> findingsIn(const Json& file) {
    std::vector<ExpectedFinding> findings;
    const auto collect = [&](const Json& list) {
        for (const Json& finding : list)
            findings.push_back({finding["code"], finding["offset"]});
    };
    collect(file["findings"]);
    for (const Json& stream : file["streams"])
        collect(stream["findings"]);
    std::sort(findings.begin(), findings.end());
    return findings;
}

TEST_F(VerifyCommand, FindsNothingInAMovieThatTheRecorderMade) {
    const ToolResult result = runTool({"verify", movie()});
    EXPECT_EQ(result.exitCode, 0) << result.output;
    EXPECT_EQ(result.output, movie() + ": ok (17 streams, " + std::to_string(recordedEntries()) + " entries)\n");
    EXPECT_EQ(result.errors, "");
}

TEST_F(VerifyCommand, FindsNothingInTheOtherContainers) {
    std::string chunks;
    for (const std::string& stream : streamFiles())
        chunks += chunk("DATA", contentsOf(stream));
    std::vector<std::string> arguments{"verify",
                                       newFile("Recording.avi", chunk("RIFF", "AVI ") + chunk("ZULM", chunks)),
                                       copyOf(movie(), "Recording.mov"), copyOf(movie(), "Recording.zcap")};
    arguments.insert(arguments.end(), streamFiles().begin(), streamFiles().end());
    const ToolResult result = runTool(arguments);
    EXPECT_EQ(result.exitCode, 0) << result.output;
    EXPECT_EQ(std::count(result.output.begin(), result.output.end(), '\n'), 3 + 17);
    EXPECT_NE(result.output.find("cursorOpacity.dat: ok (1 stream, 5 entries)\n"), std::string::npos) << result.output;
}

TEST_F(VerifyCommand, FindsOutEveryInvalidRecording) {
    for (const InvalidFile& file : invalidCorpus()) {
        const ToolResult result = runTool({"verify", file.path});
        EXPECT_EQ(result.exitCode, 3) << file.name;
        for (const ExpectedFinding& finding : file.findings) {
            const std::string line =
                ".*: [^\n]* at offset " + std::to_string(finding.offset) + ": [^\n]* \\[" + finding.code + "\\]\n.*";
            EXPECT_THAT(result.output, testing::MatchesRegex("(.|\n)*" + line + "(.|\n)*")) << file.name;
        }
        EXPECT_EQ(static_cast<std::size_t>(std::count(result.output.begin(), result.output.end(), '\n')),
                  file.findings.size());
    }
}

TEST_F(VerifyCommand, ReportsEveryInvalidRecordingInOneDocument) {
    std::vector<std::string> arguments{"verify", "--json"};
    const auto files = invalidCorpus();
    for (const InvalidFile& file : files)
        arguments.push_back(file.path);
    const ToolResult result = runTool(arguments);
    EXPECT_EQ(result.exitCode, 3);
    const Json report = Json::parse(result.output);
    EXPECT_EQ(report["schema"], "zulm.verify");
    ASSERT_EQ(report["files"].size(), files.size());
    for (std::size_t i = 0; i < files.size(); ++i) {
        auto expected = files[i].findings;
        std::sort(expected.begin(), expected.end());
        EXPECT_EQ(report["files"][i]["path"], files[i].path);
        EXPECT_EQ(findingsIn(report["files"][i]), expected) << files[i].name;
        EXPECT_EQ(report["files"][i]["damaged"], true);
    }
}

TEST_F(VerifyCommand, ReportsWhatTheStreamsAre) {
    const std::string file = newFile("Locations.dat", locations({1, 0.5}) + "torn");
    const Json stream = Json::parse(runTool({"verify", "--json", file}).output)["files"][0]["streams"][0];
    EXPECT_EQ(stream["kind"], "cursorLocation");
    EXPECT_EQ(stream["uuid"], "2b7b6af2-7a1f-11e2-83d0-0017f200be7f");
    EXPECT_EQ(stream["version"], 1);
    EXPECT_EQ(stream["fixed_entry_size"], 16);
    EXPECT_EQ(stream["offset"], 0);
    EXPECT_EQ(stream["declared_bytes"], 60);
    EXPECT_EQ(stream["present_bytes"], 60);
    EXPECT_EQ(stream["readable_bytes"], 56);
    EXPECT_EQ(stream["entries"], 2);
    EXPECT_EQ(stream["first_time"], 1.0);
    EXPECT_EQ(stream["last_time"], 0.5);
    EXPECT_EQ(stream["reachable"], true);
    EXPECT_EQ(stream["findings"][0]["severity"], "notice");
    EXPECT_EQ(stream["findings"][1],
              Json::parse(R"({"code": "torn-entry", "severity": "damage", "place": "cursorLocation", "offset": 56,
                              "message": "the last entry has 4 of 16 bytes"})"));
}

TEST_F(VerifyCommand, PrintsNoticesAndEndsWell) {
    const std::string file = newFile("Locations.dat", locations({2, 1}));
    const ToolResult result = runTool({"verify", file});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.output, file +
                                 ": cursorLocation at offset 40: notice: the entry's time 1 is before 2, the time of "
                                 "an earlier entry [time-backwards]\n" +
                                 file + ": ok (1 stream, 2 entries)\n");
}

TEST_F(VerifyCommand, TakesNoticesForDamageWhereItIsStrict) {
    const std::string file = newFile("Locations.dat", locations({2, 1}));
    const ToolResult result = runTool({"verify", "--strict", file});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.output.find("ok ("), std::string::npos) << result.output;
    EXPECT_EQ(runTool({"verify", "--strict", movie()}).exitCode, 0);
}

TEST_F(VerifyCommand, LeavesOutWhatItIsToIgnore) {
    const std::string file = newFile("Locations.dat", locations({2, 1}) + "torn");
    const ToolResult result =
        runTool({"verify", "--strict", "--ignore", "time-backwards", "--ignore", "torn-entry", file});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.output, file + ": ok (1 stream, 2 entries)\n");
    EXPECT_EQ(runTool({"verify", "--ignore", "time-backwards", file}).exitCode, 3);
    const ToolResult unknown = runTool({"verify", "--ignore", "torn-entri", file});
    EXPECT_EQ(unknown.exitCode, 2);
    EXPECT_NE(unknown.errors.find("did you mean torn-entry?"), std::string::npos) << unknown.errors;
}

TEST_F(VerifyCommand, ListsItsRules) {
    const ToolResult result = runTool({"verify", "--rules"});
    EXPECT_EQ(result.exitCode, 0);
    for (const FindingRule& rule : s_findingRules)
        EXPECT_NE(result.output.find(std::string(rule.name) + ' '), std::string::npos) << rule.name;
    EXPECT_EQ(runTool({"verify"}).exitCode, 2);
}

TEST_F(VerifyCommand, CallsAStreamThatWasReplacedNoDamage) {
    const std::string copy = copyOf(movie());
    ASSERT_EQ(runTool({"attach", copy, streamFile("cpuUsage"), "--replace", "--in-place"}).exitCode, 0);
    const ToolResult result = runTool({"verify", copy});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_NE(result.output.find("notice: this stream hides an earlier stream of its kind at offset"),
              std::string::npos);
}

TEST_F(VerifyCommand, SaysHowManyFindingsItLeavesOut) {
    const std::vector<double> times(1500, std::numeric_limits<double>::quiet_NaN());
    const std::string file = newFile("Locations.dat", locations(times));
    const ToolResult result = runTool({"verify", file});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_TRUE(result.output.ends_with(file + ": 500 more findings are not listed\n"));
}

TEST_F(VerifyCommand, TellsAFileWithoutMetaDataFromADamagedOne) {
    const std::string plain = newFile("Plain.mp4", tinyMovie());
    const ToolResult result = runTool({"verify", plain});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_EQ(result.output, plain + ": no recording metadata\n");
    EXPECT_EQ(runTool({"verify", newFile("Damaged.mp4", tinyMovie() + "x")}).exitCode, 3);
}

TEST_F(VerifyCommand, FailsOnlyForFilesThatCannotBeRead) {
    std::filesystem::create_directory(folder / "Folder.mp4");
    for (const std::string& file : {folder / "Missing.mp4", newFile("Notes.txt", "no movie"), folder / "Folder.mp4"}) {
        const ToolResult result = runTool({"verify", file});
        EXPECT_EQ(result.exitCode, 1) << file;
        EXPECT_EQ(result.output, "");
        EXPECT_TRUE(result.errors.starts_with("zulm: " + file + ": ")) << result.errors;
    }
}

TEST_F(VerifyCommand, EndsAsItsWorstFileDoes) {
    const std::string plain = newFile("Plain.mp4", tinyMovie());
    const std::string damaged = newFile("Damaged.mp4", tinyMovie() + "x");
    EXPECT_EQ(runTool({"verify", movie(), plain}).exitCode, 4);
    EXPECT_EQ(runTool({"verify", damaged, plain, movie()}).exitCode, 3);
    EXPECT_EQ(runTool({"verify", damaged, folder / "Missing.mp4", movie()}).exitCode, 1);
}

TEST_F(VerifyCommand, ReadsStandardInput) {
    ToolOptions options;
    options.input = contentsOf(streamFile("cursorOpacity"));
    const ToolResult result = runTool({"verify", "-"}, options);
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.output, "-: ok (1 stream, 5 entries)\n");
}

TEST_F(VerifyCommand, SaysWhatToRunForAnInterruptedAppend) {
    const std::string file = newFile("Movie.mp4", tinyMovie() + be32(1) + "ZULM" + be64(0));
    const ToolResult result = runTool({"verify", file});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_NE(result.errors.find("'zulm repair --dry-run " + file + "'"), std::string::npos) << result.errors;
}

TEST_F(VerifyCommand, SaysWhatToRunForStreamsThatNoReaderFinds) {
    const std::string movie = invalidRecording("movie-dropped-tail.mp4");
    const ToolResult result = runTool({"verify", movie});
    EXPECT_NE(result.errors.find("'zulm salvage " + movie + " -o DIR'"), std::string::npos) << result.errors;
    EXPECT_EQ(runTool({"verify", "--quiet", movie}).errors, "");
}

} // namespace
} // namespace ZULMetaData::Test
