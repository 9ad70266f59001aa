// The JSON documents of all commands against the schemas in Docs/schemas. Runs python3 with its jsonschema package.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <filesystem>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

using nlohmann::json;

std::string schemaOf(const std::string& command) {
    return std::string(ZULM_DOCS) + "/schemas/zulm." + command + ".schema.json";
}

class Schema : public RecordedSession {
protected:
    /// Fails where the documents do not follow the schema that they name.
    void expectValid(const std::vector<std::string>& documents) const {
        ASSERT_FALSE(documents.empty());
        const std::string schema = json::parse(documents.front()).at("schema");
        std::vector<std::string> arguments{"-m", "jsonschema", schemaOf(schema.substr(schema.find('.') + 1))};
        for (std::size_t i = 0; i < documents.size(); ++i) {
            const std::string file = folder / ("document-" + std::to_string(i) + ".json");
            writeFile(file, documents[i]);
            arguments.insert(arguments.end(), {"-i", file});
        }
        const ToolResult result = runProgram("/usr/bin/python3", arguments);
        EXPECT_EQ(result.exitCode, 0) << schema << '\n' << result.errors;
    }

    std::string outputOf(std::vector<std::string> arguments) const {
        arguments.emplace_back("--json");
        return runTool(arguments).output;
    }

    std::string odd() const { return written("Odd.mp4", oddMovie()); }
    std::string torn() const { return written("torn.dat", locations() + "1234"); }
    std::string interrupted() const { return written("interrupted.mp4", tinyMovie() + be32(1) + "ZULM" + be64(0)); }

    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }
};

TEST_F(Schema, IsOneForEveryCommandThatReports) {
    std::vector<std::string> commands;
    for (const auto& file : std::filesystem::directory_iterator(std::string(ZULM_DOCS) + "/schemas")) {
        const json schema = json::parse(contentsOf(file.path()));
        const std::string name = schema.at("properties").at("schema").at("const");
        EXPECT_EQ(file.path().filename(), name + ".schema.json");
        commands.push_back(name.substr(5));
    }
    EXPECT_THAT(commands, testing::UnorderedElementsAre(
                              "atoms", "attach", "compact", "cut", "data-set", "detach", "diff", "dump", "edits",
                              "export", "extract", "grep", "info", "insights", "record", "redact", "redactions",
                              "repair", "retime", "salvage", "stamp", "state", "style", "verify", "view", "zooms"));
}

TEST_F(Schema, RefusesWhatIsNotInIt) {
    json document = json::parse(outputOf({"info", movie()}));
    document["files"][0]["surprise"] = 1;
    writeFile(folder / "document.json", document.dump());
    EXPECT_EQ(
        runProgram("/usr/bin/python3", {"-m", "jsonschema", schemaOf("info"), "-i", folder / "document.json"}).exitCode,
        1);
}

TEST_F(Schema, HoldsForEditLists) {
    const std::string begin = R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [)";
    expectValid({begin + "]}", begin + R"({"start": "10", "end": "61/3", "speed": "3/2"}]})",
                 begin + R"({"at": 0, "duration": "0.5"}, {"start": 1, "end": 2e1, "speed": 0.5}]})"});
    for (const char* piece :
         {R"({"start": 1})", R"({"start": 1, "at": 1, "duration": 1})", R"({"start": -1, "end": 1})",
          R"({"start": "1e1", "end": 20})", R"({"start": 0, "end": "1/0"})", R"({"start": 0, "end": "0.0"})",
          R"({"at": 1, "duration": 1, "speed": 2})"}) {
        const std::string file = written("edits.json", begin + piece + "]}");
        EXPECT_EQ(runProgram("/usr/bin/python3", {"-m", "jsonschema", schemaOf("edits"), "-i", file}).exitCode, 1)
            << piece;
    }
}

TEST_F(Schema, HoldsForInfo) {
    expectValid({outputOf({"info", movie(), odd(), torn()}), outputOf({"info", written("na\xff.dat", locations())})});
}

TEST_F(Schema, HoldsForAtoms) {
    expectValid({outputOf({"atoms", movie(), odd(), interrupted(), written("a.wav", waveWithLocations())})});
}

TEST_F(Schema, HoldsForDump) {
    const std::string strange = written("strange.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1e300, "\xff"));
    std::vector<std::string> documents;
    for (const std::string& file : {movie(), odd(), strange, torn()})
        documents.push_back(
            runTool({"dump", "--format", "json", "--images", folder / "images", "--force", file}).output);
    documents.push_back(runTool({"dump", "--format", "json", "--columns", "x,title", movie(), torn()}).output);
    expectValid(documents);
}

TEST_F(Schema, HoldsForVerify) {
    expectValid({outputOf({"verify", movie(), odd(), torn(), interrupted()})});
}

TEST_F(Schema, HoldsForRepair) {
    expectValid({outputOf({"repair", "--dry-run", movie()}), outputOf({"repair", "--dry-run", interrupted()}),
                 outputOf({"repair", interrupted(), "-o", folder / "repaired.mp4"}),
                 outputOf({"repair", "--dry-run", written("long.mp4", be32(100) + "mdat")})});
}

TEST_F(Schema, HoldsForDiff) {
    const std::string other = written("other.dat", streamHeader("2b7b6af2", 1, 16) + pointEntry(0.5, 11, -20));
    const std::string unknown = written("a.dat", streamHeader("2b7b6aff", 1, 12) + f64(1) + le32(2));
    const std::string otherUnknown = written("b.dat", streamHeader("2b7b6aff", 2, 12) + f64(1) + le32(3));
    expectValid({outputOf({"diff", movie(), movie()}), outputOf({"diff", movie(), odd()}),
                 outputOf({"diff", torn(), other}), outputOf({"diff", unknown, otherUnknown})});
}

TEST_F(Schema, HoldsForGrep) {
    expectValid(
        {outputOf({"grep", "e", movie(), streamFile("slideText")}), outputOf({"grep", "nowhere at all", movie()})});
}

TEST_F(Schema, HoldsForExport) {
    const std::string tables = folder / "Tables";
    const std::string odds = written("na\xff.dat", locations());
    expectValid(
        {outputOf({"export", "-o", tables, movie(), odds}), outputOf({"export", "-o", tables, odds, torn(), odd()})});
    std::vector<std::string> lines;
    std::istringstream manifest(contentsOf(tables + "/manifest.ndjson"));
    for (std::string line; std::getline(manifest, line);)
        lines.push_back(line);
    EXPECT_EQ(lines.size(), 5U);
    expectValid(lines);
}

TEST_F(Schema, HoldsForInsights) {
    const std::string strange = written("strange.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1e300, "\xff"));
    const std::string press = written("press.dat", streamHeader("2b7b6af0", 1, 12) + f64(1e300) + le32(1));
    expectValid({outputOf({"insights", movie(), odd(), torn()}), outputOf({"insights", "--show-keys", movie()}),
                 outputOf({"insights", strange, press, written("na\xff.dat", locations())})});
}

TEST_F(Schema, HoldsForState) {
    const std::string strange = written("strange.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "\xff"));
    const std::string cursors = written("cursors.dat", streamHeader("2b7b6af1", 2, 0) + le32(28) + f64(1) + le64(7) +
                                                           le32(8) + le32(0) + le32(3));
    std::vector<std::string> documents;
    for (const std::string& file : {movie(), odd(), torn(), strange, cursors, streamFile("slideText")})
        documents.push_back(outputOf({"state", file, "--at", "0,0.05,2.5,61/3"}));
    expectValid(documents);
}

TEST_F(Schema, HoldsForAttachAndStamp) {
    const std::string tornNames = written("names.dat", streamHeader("2b7b6a06", 1, 0) + textEntry(1, "whole") +
                                                           textEntry(2, "torn").substr(0, 9));
    const std::string plain = written("plain.mp4", tinyMovie());
    expectValid({outputOf({"attach", plain, torn(), tornNames, "-o", folder / "attached.mp4"}),
                 outputOf({"attach", interrupted(), "--from", movie(), "-o", folder / "carried.mp4"})});
    expectValid({outputOf({"compact", movie(), "-o", folder / "compact.mp4"})});
    expectValid({outputOf({"detach", movie(), "-o", folder / "detached.mp4"})});
    expectValid({outputOf({"stamp", plain, "--creator", "a", "--creator-version", "1", "-o", folder / "stamped.mp4"})});
}

TEST_F(Schema, HoldsForRetimeAndCut) {
    const std::string plain = written("plain.mp4", tinyMovie());
    const std::string open = written("open\xff.mp4", tinyMovie() + be32(0) + "free1234");
    expectValid({outputOf({"retime", movie(), "--movie", plain, "--keep", "1-5@2", "-o", folder / "1.mp4"}),
                 outputOf({"retime", odd(), "--movie", open, "--remove", "1-5", "-o", folder / "2.mp4"}),
                 outputOf({"retime", plain, "--movie", plain, "--keep", "1-5", "-o", folder / "3.mp4"})});
    const std::string real = folder / "real.mp4";
    ZULMetaData::Test::outputOf("ffmpeg -v error -f lavfi -i testsrc=size=64x64:rate=10 -t 3 -c:v libx264 -g 5 " +
                                real);
    writeFile(real, contentsOf(real) + extendedAtom("ZULM", extendedAtom("DATA", locations())));
    writeFile(folder / "edits.json", R"({"schema": "zulm.edits", "schema_version": 1, "pieces": [
        {"start": 0, "end": 1, "speed": 2}, {"at": 1, "duration": 1}]})");
    expectValid({outputOf({"cut", real, "--edits", folder / "edits.json", "-o", folder / "4.mp4"}),
                 outputOf({"cut", real, "--fast", "--keep", "1-2", "-o", folder / "5.mp4"}),
                 outputOf({"cut", plain, "--keep", "1-2", "-o", folder / "6.mp4"})});
}

TEST_F(Schema, KeepsTheBytesOfNamesThatAreNotUTF8) {
    const std::string strange = written("na\xff.mp4", tinyMovie());
    const std::vector<std::string> documents{
        outputOf({"attach", strange, streamFile("cpuUsage"), "-o", folder / "\xff.mp4"}),
        outputOf({"repair", "--dry-run", strange}),
        outputOf({"stamp", strange, "--creator", "a", "--creator-version", "1", "-o", folder / "\xfe.mp4"}),
        outputOf({"info", strange})};
    for (const std::string& document : documents) {
        const json file = json::parse(document).at("files").at(0);
        EXPECT_THAT(std::string(file.at("path")), testing::EndsWith("/na\xef\xbf\xbd.mp4"));
        EXPECT_TRUE(file.contains("path_base64")) << document;
        expectValid({document});
    }
}

TEST_F(Schema, HoldsForExtractAndSalvage) {
    expectValid(
        {outputOf({"extract", movie(), "-o", folder / "streams"}), outputOf({"extract", odd(), "-o", folder / "odd"})});
    expectValid({outputOf({"salvage", movie(), "-o", folder / "salvaged"}),
                 outputOf({"salvage", written("cut.mp4", contentsOf(movie()).substr(300)), "-o", folder / "cut"})});
}

TEST_F(Schema, HoldsForRedact) {
    expectValid(
        {outputOf({"redact", movie(), "-o", folder / "public.mp4", "--keys", "--titles", "README", "--range", "1:2",
                   "--stream", "systemData"}),
         outputOf({"redact", torn(), "-o", folder / "public.dat", "--range", "1:"}),
         outputOf({"redact", movie(), "--dry-run", "--keys", "--range", "1:2", "--creator", "--stream", "cpuUsage"})});
}

TEST_F(Schema, HoldsIfNothingCanBeReadOrFound) {
    const std::string none = folder / "none\xff.mp4";
    const std::string plain = written("plain.mp4", tinyMovie());
    const std::string out = folder / "out.mp4";
    for (const auto& arguments :
         std::vector<std::vector<std::string>>{{"info"},
                                               {"atoms"},
                                               {"verify"},
                                               {"grep", "a"},
                                               {"insights"},
                                               {"state", "--at", "1"},
                                               {"diff", movie()},
                                               {"extract", "-o", folder / "streams"},
                                               {"salvage", "-o", folder / "streams"},
                                               {"attach", "-o", out, "--from", movie()},
                                               {"repair", "--dry-run"},
                                               {"stamp", "-o", out, "--creator", "a", "--creator-version", "1"},
                                               {"redact", "-o", out, "--keys"}}) {
        std::vector<std::string> unreadable = arguments;
        unreadable.push_back(none);
        std::vector<std::string> empty = arguments;
        empty.push_back(plain);
        expectValid({outputOf(unreadable), outputOf(empty)});
        std::filesystem::remove(out);
    }
    expectValid({runTool({"dump", "--format", "json", none, plain}).output});
}

TEST_F(Schema, HoldsForWhatPagesHold) {
    const std::string page = written("page.html", "<head></head>");
    std::vector<std::string> documents;
    for (const std::string& file : {movie(), odd(), torn()}) {
        runTool({"view", file, "-o", folder / "out.html", "--page", page, "--force"});
        const std::string text = contentsOf(folder / "out.html");
        const std::size_t start = text.find('{');
        documents.push_back(text.substr(start, text.rfind('}') + 1 - start));
    }
    expectValid(documents);
}

TEST_F(Schema, HoldsForEveryGoldenOutput) {
    std::size_t count = 0;
    for (const auto& file : std::filesystem::recursive_directory_iterator(std::string(ZULM_TEST_DATA) + "/golden")) {
        if (file.path().extension() != ".json")
            continue;
        SCOPED_TRACE(file.path());
        expectValid({contentsOf(file.path())});
        ++count;
    }
    EXPECT_GE(count, 5U);
}

} // namespace
} // namespace ZULMetaData::Test
